#include "MediaServer.h"

#include <unistd.h>

#include <cstdio>

#include "support/Error.h"

namespace tav {
namespace {

// A player that reads nothing while this much waits for it is not coming
// back (hours of position reports).
constexpr size_t kMaxUnsent = 1024 * 1024;

}  // namespace

void MediaServer::RelayLog::LogMessage(int32_t level, const std::string& szText,
                                       const SequenceIdentity*) {
  m_server.Send(media::Log{level, szText});
}

MediaServer::MediaServer(EventLoop& loop, int socket) : m_loop(loop), m_socket(loop.Context()) {
  m_socket.assign(asio::local::stream_protocol(), socket);
  Send(media::Hello{kMediaProtocolVersion, static_cast<int64_t>(::getpid())});
  StartRead();
}

MediaServer::~MediaServer() {
  // mpv first: its last events must find nothing to report to.
  m_player.reset();
}

void MediaServer::StartRead() {
  m_socket.async_read_some(asio::buffer(m_received),
                           [this](const asio::error_code& error, size_t size) {
                             if (error) return Quit();  // the player has gone
                             m_lines.Append(std::string_view(m_received.data(), size));
                             std::string line;
                             for (;;) {
                               MediaLineStatus status = m_lines.Next(line);
                               if (status == MediaLineStatus::kIncomplete) break;
                               if (status == MediaLineStatus::kTooLong) {
                                 return Quit("the player sent a line that is too long");
                               }
                               OnLine(line);
                               if (m_loop.Stopped()) return;
                             }
                             StartRead();
                           });
}

void MediaServer::OnLine(const std::string& line) {
  MediaMessage message;
  try {
    message = DecodeMediaLine(line);
  } catch (const Error& e) {
    return Quit("the player sent what cannot be read: " + e.Description());
  }
  Handle(message);
}

void MediaServer::Handle(const MediaMessage& message) {
  if (const auto* outputs = std::get_if<media::Outputs>(&message)) {
    StartPlayer({outputs->audioOutput, outputs->audioDevice, outputs->videoOutput});
  } else if (const auto* ping = std::get_if<media::Ping>(&message)) {
    Send(media::Pong{ping->serial});
  } else if (std::holds_alternative<media::Quit>(message)) {
    Quit();
  } else if (!m_player) {
    Quit(std::string("the player sent \"") + MediaMessageName(message) + "\" before the outputs");
  } else if (const auto* open = std::get_if<media::Open>(&message)) {
    m_generation = open->generation;
    m_reportedType.clear();
    m_player->OpenMedia(open->path);
  } else if (const auto* stop = std::get_if<media::Stop>(&message)) {
    m_generation = stop->generation;
    m_player->Stop();
  } else if (const auto* full = std::get_if<media::FullScreen>(&message)) {
    m_player->SetFullScreen(full->on);
  } else if (const auto* show = std::get_if<media::ShowVideo>(&message)) {
    m_player->ShowVideoForm(show->x, show->y);
  } else if (std::holds_alternative<media::HideVideo>(message)) {
    m_player->HideVideoForm();
  } else {
    Quit(std::string("the player sent a report (\"") + MediaMessageName(message) + "\")");
  }
}

void MediaServer::StartPlayer(const MpvOutputs& outputs) {
  m_player.reset();
  try {
    m_player = std::make_unique<MpvMediaPlayer>(m_loop, m_log, outputs);
  } catch (const Error& e) {
    Send(media::Failed{e.Description()});
    m_quitWhenSent = true;
    return;
  }
  m_player->SetOnPlayStateChange([this](int32_t newState) { OnPlayStateChange(newState); });
  m_player->SetOnMediaError([this] { OnMediaError(); });
  m_player->SetOnClockChange([this](const MediaClock& clock) { OnClockChange(clock); });
}

void MediaServer::OnPlayStateChange(int32_t newState) {
  // The type is known before playing starts; the player reads it when told
  // of the start.
  std::string type = m_player->CurrentMediaItemInfo("MediaType");
  if (type != m_reportedType) {
    Send(media::MediaType{m_generation, type});
    m_reportedType = type;
  }
  Send(media::State{m_generation, newState});
}

void MediaServer::OnMediaError() {
  for (int32_t i = 0; i < m_player->ErrorCount(); ++i) {
    Send(media::QueuedError{m_player->ErrorDescription(i)});
  }
  m_player->ClearErrorQueue();
  Send(media::MediaError{m_generation, m_player->PlayState()});
}

void MediaServer::OnClockChange(const MediaClock& clock) {
  MediaClock::Snapshot now = clock.Take();
  auto at = std::chrono::duration_cast<std::chrono::nanoseconds>(now.at.time_since_epoch());
  Send(media::Clock{m_generation, now.position, at.count(), now.end, now.running});
}

void MediaServer::Send(const MediaMessage& message) {
  if (m_loop.Stopped()) return;
  m_unsent += EncodeMediaMessage(message);
  if (m_unsent.size() > kMaxUnsent) return Quit("the player does not read");
  StartWrite();
}

void MediaServer::StartWrite() {
  if (!m_sending.empty()) return;
  if (m_unsent.empty()) {
    if (m_quitWhenSent) Quit();
    return;
  }
  m_sending.swap(m_unsent);
  asio::async_write(m_socket, asio::buffer(m_sending),
                    [this](const asio::error_code& error, size_t) {
                      m_sending.clear();
                      if (error) return Quit();  // the player has gone
                      StartWrite();
                    });
}

void MediaServer::Quit(const std::string& why) {
  if (!why.empty()) {
    std::fprintf(stderr, "showplayer-media: %s\n", why.c_str());
    m_exitStatus = 2;
  }
  m_loop.Stop();
}

}  // namespace tav
