#pragma once
// The tray link on a Unix-domain stream socket, on the program's event loop.
// The player listens; every connection is a tray "window" with a non-zero
// 32-bit handle that the link assigns (never reused while the link lives)
// and stamps on every frame it receives from it. Frames are those of
// TrayLinkFrame.h.
//
// Only the user can reach the player: the socket file is made with mode 0600
// and directories the link creates with 0700. A socket file left by a player
// that died is replaced; one that answers means another player is running,
// and the constructor fails.
//
// Bounded against trays that misbehave: a frame above the size limit, a
// header that is none, or more than the queued-bytes limit waiting for a tray
// that does not read gets that tray disconnected, and the player goes on.
// Connections above the connection limit are closed at once.
//
// Nothing blocks: writes that the socket cannot take at once are queued and
// finished when it can. Disconnections are reported from the loop, never
// from inside Send. Owned by the program's entry point (or the host); the
// EventLoop must outlive it.

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

#include "host/TrayLink.h"
#include "platform/EventLoop.h"

namespace tav {

// Error numbers of a link that cannot listen, and of a client that cannot
// reach the player.
constexpr int32_t kTrayLinkInUse = 70;
constexpr int32_t kTrayLinkUnavailable = 75;

struct UnixTrayLinkLimits {
  uint32_t maxFrameBytes = 64 * 1024;   // cbData accepted from a tray
  size_t maxConnections = 16;           // trays at the same time
  size_t maxQueuedBytes = 1024 * 1024;  // unsent bytes for one tray
};

class UnixTrayLink : public TrayLink {
 public:
  // The player's own window handle.
  static constexpr uint32_t kPlayerHandle = 1;

  // $TAV_TRAY_SOCKET, else $XDG_RUNTIME_DIR/tessavar/showplayer.sock, else
  // /tmp/tessavar-<uid>/showplayer.sock.
  static std::string DefaultSocketPath();

  // Listens at `socketPath`. Fails with kTrayLinkInUse when another player
  // listens there and with kTrayLinkUnavailable when the socket cannot be made.
  UnixTrayLink(EventLoop& loop, std::string socketPath, UnixTrayLinkLimits limits = {});
  ~UnixTrayLink() override;
  UnixTrayLink(const UnixTrayLink&) = delete;
  UnixTrayLink& operator=(const UnixTrayLink&) = delete;

  const std::string& SocketPath() const;
  size_t ConnectionCount() const;
  // Bytes waiting to be written to a tray (0 for an unknown handle).
  size_t QueuedBytes(uint32_t hwnd) const;
  // Connections closed at once because the limit was reached.
  uint64_t RefusedConnections() const;
  // Stops listening, disconnects every tray without notice and removes the
  // socket file if it is still this link's.
  void Close();

  uint32_t OwnHandle() const override { return kPlayerHandle; }
  bool Send(uint32_t targetHwnd, const TrayFrame& frame) override;
  void SetOnFrame(std::function<void(const TrayFrame&)> onFrame) override;
  void SetOnConnect(std::function<void(uint32_t)> onConnect) override;
  void SetOnDisconnect(std::function<void(uint32_t, const std::string&)> onDisconnect) override;

 private:
  struct Impl;
  std::shared_ptr<Impl> m_impl;
};

}  // namespace tav
