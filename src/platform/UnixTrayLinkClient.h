#pragma once
// A tray's end of the Unix tray link: connects to the player's socket, sends
// frames and waits for frames with a time limit. Blocking, for command-line
// tools, tests and benchmarks; the player's side is UnixTrayLink. The frames
// a client sends carry handle 0: the player stamps its own choice anyway.

#include <cstdint>
#include <optional>
#include <string>

#include "host/TrayLink.h"
#include "platform/TrayLinkFrame.h"

namespace tav {

class UnixTrayLinkClient {
 public:
  // Fails with kTrayLinkUnavailable, saying so, when no player listens at
  // `socketPath`.
  explicit UnixTrayLinkClient(const std::string& socketPath,
                              uint32_t maxFrameBytes = 16 * 1024 * 1024);
  ~UnixTrayLinkClient();
  UnixTrayLinkClient(const UnixTrayLinkClient&) = delete;
  UnixTrayLinkClient& operator=(const UnixTrayLinkClient&) = delete;

  // Writes the whole frame. Fails when the player has gone.
  void Send(const TrayFrame& frame);
  // Writes bytes as they are (tests of misbehaving trays).
  void SendBytes(std::string_view bytes);
  // The next frame, waiting at most `timeoutMs` (negative: without limit);
  // nothing when none came in time. Fails when the player closed the
  // connection (Closed() is then true) or sent something that is no frame.
  std::optional<TrayFrame> Receive(int timeoutMs);
  bool Closed() const { return m_closed; }
  // Shuts the sending direction, so the player sees the end of the stream.
  void FinishSending();

 private:
  int m_fd = -1;
  bool m_closed = false;
  TrayFrameReader m_reader;
};

}  // namespace tav
