#pragma once
// The media process's end of the link to the player: reads the player's
// commands from the inherited socket, plays them on MpvMediaPlayer, and
// reports back what the player's MediaProcessPlayer needs to answer the
// engine (docs/media-process.md): play states, the media type, the position
// clock, queued errors, media errors and log lines, each report stamped with
// the generation of the play it concerns.
//
// The link ends the process: the loop is stopped when the player says quit,
// closes its end, stops reading, or sends what cannot be read (said on
// standard error, which the player shares). mpv starts when the outputs
// arrive; if it cannot, the player is told why and the process ends.
//
// Owned by main; the EventLoop must outlive it.

#include <array>
#include <asio.hpp>
#include <cstdint>
#include <memory>
#include <string>

#include "platform/EventLoop.h"
#include "platform/media/MediaProtocol.h"
#include "platform/media/MpvMediaPlayer.h"
#include "ports/MessageLog.h"

namespace tav {

class MediaServer {
 public:
  // Takes over `socket`, the player's end of the link.
  MediaServer(EventLoop& loop, int socket);
  ~MediaServer();
  MediaServer(const MediaServer&) = delete;
  MediaServer& operator=(const MediaServer&) = delete;

  // 0 when the link ended as it should, 2 when the player broke the protocol.
  int ExitStatus() const { return m_exitStatus; }

 private:
  // Log lines of the media player go to the player's log.
  class RelayLog : public MessageLog {
   public:
    explicit RelayLog(MediaServer& server) : m_server(server) {}
    void LogMessage(int32_t level, const std::string& szText,
                    const SequenceIdentity* seqInfo = nullptr) override;

   private:
    MediaServer& m_server;
  };

  void StartRead();
  void OnLine(const std::string& line);
  void Handle(const MediaMessage& message);
  void StartPlayer(const MpvOutputs& outputs);
  void OnPlayStateChange(int32_t newState);
  void OnMediaError();
  void OnClockChange(const MediaClock& clock);
  void Send(const MediaMessage& message);
  void StartWrite();
  void Quit(const std::string& why = "");

  EventLoop& m_loop;
  asio::local::stream_protocol::socket m_socket;
  std::array<char, 16 * 1024> m_received{};
  MediaLineReader m_lines;
  std::string m_unsent;
  std::string m_sending;
  bool m_quitWhenSent = false;
  int m_exitStatus = 0;
  RelayLog m_log{*this};
  std::unique_ptr<MpvMediaPlayer> m_player;
  // The generation of the latest open or stop, which every report concerns,
  // and the media type last reported for it.
  uint64_t m_generation = 0;
  std::string m_reportedType;
};

}  // namespace tav
