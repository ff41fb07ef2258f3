#include "platform/media/MediaProcessLink.h"

#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <asio.hpp>
#include <cerrno>
#include <cstring>

#include "platform/media/ChildProcess.h"
#include "platform/media/ChildReaper.h"
#include "support/Error.h"

namespace tav {
namespace {

// Errors name the port the media process serves.
constexpr const char* kSource = "MediaProcessPlayer";
constexpr const char* kEndedUnexpectedly = "the media process ended unexpectedly";
constexpr const char* kLogTail = "; the next media file starts a new one";
// The media process's end of the socket pair, as its command line says.
constexpr int kChildSocket = 3;
// What may wait for a media process that does not read before it counts as
// hung (a few thousand commands).
constexpr size_t kMaxUnsent = 256 * 1024;
constexpr size_t kReadChunk = 16 * 1024;

using Clock = MediaProcessLink::Clock;
using Socket = asio::local::stream_protocol::socket;

}  // namespace

std::string MediaProcessLink::DurationText(Clock::duration duration) {
  auto ms = std::chrono::duration_cast<std::chrono::milliseconds>(duration).count();
  if (ms % 1000 == 0) return std::to_string(ms / 1000) + " s";
  return std::to_string(ms) + " ms";
}

struct MediaProcessLink::State : std::enable_shared_from_this<State> {
  // One running media process. Shared with the pending reads and writes,
  // which keep their buffers alive until they complete.
  struct Process {
    explicit Process(asio::io_context& context) : socket(context) {}
    int64_t processId = 0;
    Clock::time_point started;
    Socket socket;
    std::array<char, kReadChunk> received{};
    MediaLineReader lines;
    std::string unsent;
    std::string sending;
    bool greeted = false;
    // Awaiting the greeting, or the answer to ping `pingSerial`, since then.
    bool awaiting = true;
    Clock::time_point awaitingSince;
    uint64_t pingSerial = 0;
  };

  State(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs, std::string program,
        const Timing& timing)
      : loop(loop),
        log(log),
        outputs(outputs),
        program(std::move(program)),
        timing(timing),
        pingTimer(loop.Context()),
        reaper(loop) {}

  void Start();
  void Send(const MediaMessage& message);
  void StartWrite(const std::shared_ptr<Process>& on);
  void StartRead(const std::shared_ptr<Process>& on);
  void OnReceived(const std::shared_ptr<Process>& on, size_t size);
  void OnLine(const std::string& line);
  void Handle(const MediaMessage& message);
  void SchedulePing();
  void OnPingTimer();
  void End(const std::string& why, bool kill, const std::string& playReason);
  void EndUnexpectedly() { End("ended unexpectedly", false, kEndedUnexpectedly); }
  void Quit();

  EventLoop& loop;
  MessageLog& log;
  MpvOutputs outputs;
  std::string program;
  Timing timing;
  std::shared_ptr<Process> process;
  asio::steady_timer pingTimer;
  ChildReaper reaper;
  OnMessage onMessage;
  OnEnded onEnded;
};

// Spawning returns at once: the media process loads libmpv on its own time.
void MediaProcessLink::State::Start() {
  if (process) return;
  if (::access(program.c_str(), X_OK) != 0) {
    std::string reason = std::strerror(errno);
    throw Error(kMediaPlayerUnavailable, kSource,
                "cannot start the media process " + program + ": " + reason);
  }
  SpawnedChild child =
      SpawnWithSocket(program, {"--fd", std::to_string(kChildSocket)}, kChildSocket);
  auto fresh = std::make_shared<Process>(loop.Context());
  fresh->processId = child.processId;
  fresh->started = fresh->awaitingSince = Clock::now();
  asio::error_code error;
  fresh->socket.assign(asio::local::stream_protocol(), child.socket, error);
  if (error) {
    ::close(child.socket);
    reaper.Kill(child.processId);
    throw Error(errors::kInvalidProcedureCall, kSource,
                "Cannot reach the media process: " + error.message());
  }
  process = std::move(fresh);
  Send(media::Outputs{outputs.audioOutput, outputs.audioDevice, outputs.videoOutput});
  if (!process) return;
  StartRead(process);
  SchedulePing();
}

void MediaProcessLink::State::Send(const MediaMessage& message) {
  if (!process) return;
  process->unsent += EncodeMediaMessage(message);
  if (process->unsent.size() > kMaxUnsent) {
    End("stopped reading and was ended", true, kEndedUnexpectedly);
    return;
  }
  StartWrite(process);
}

void MediaProcessLink::State::StartWrite(const std::shared_ptr<Process>& on) {
  if (!on->sending.empty() || on->unsent.empty()) return;
  on->sending.swap(on->unsent);
  // The socket is written with send(MSG_NOSIGNAL): a media process that has
  // gone raises no SIGPIPE here, only an error.
  asio::async_write(on->socket, asio::buffer(on->sending),
                    [weak = weak_from_this(), on](const asio::error_code& error, size_t) {
                      auto self = weak.lock();
                      if (!self || self->process != on) return;
                      on->sending.clear();
                      if (error) {
                        self->EndUnexpectedly();
                        return;
                      }
                      self->StartWrite(on);
                    });
}

void MediaProcessLink::State::StartRead(const std::shared_ptr<Process>& on) {
  on->socket.async_read_some(
      asio::buffer(on->received),
      [weak = weak_from_this(), on](const asio::error_code& error, size_t size) {
        auto self = weak.lock();
        if (!self || self->process != on) return;
        if (error) {
          self->EndUnexpectedly();
          return;
        }
        self->OnReceived(on, size);
      });
}

void MediaProcessLink::State::OnReceived(const std::shared_ptr<Process>& on, size_t size) {
  on->lines.Append(std::string_view(on->received.data(), size));
  std::string line;
  for (;;) {
    MediaLineStatus status = on->lines.Next(line);
    if (status == MediaLineStatus::kIncomplete) break;
    if (status == MediaLineStatus::kTooLong) {
      End("sent a line longer than " + std::to_string(kMaxMediaLine) + " bytes and was ended", true,
          kEndedUnexpectedly);
      return;
    }
    OnLine(line);
    if (process != on) return;  // the line ended it
  }
  StartRead(on);
}

void MediaProcessLink::State::OnLine(const std::string& line) {
  MediaMessage message;
  try {
    message = DecodeMediaLine(line);
  } catch (const Error& e) {
    End("sent what cannot be read (" + e.Description() + ") and was ended", true,
        kEndedUnexpectedly);
    return;
  }
  bool isHello = std::holds_alternative<media::Hello>(message);
  if (isHello == process->greeted) {
    End(std::string("sent \"") + MediaMessageName(message) +
            (isHello ? "\" twice" : "\" before its greeting") + " and was ended",
        true, kEndedUnexpectedly);
    return;
  }
  Handle(message);
}

void MediaProcessLink::State::Handle(const MediaMessage& message) {
  if (const auto* hello = std::get_if<media::Hello>(&message)) {
    if (hello->version != kMediaProtocolVersion) {
      End("speaks version " + std::to_string(hello->version) + " of the protocol, not " +
              std::to_string(kMediaProtocolVersion),
          true, kEndedUnexpectedly);
      return;
    }
    process->greeted = true;
    process->awaiting = false;
  } else if (const auto* pong = std::get_if<media::Pong>(&message)) {
    if (pong->serial == process->pingSerial) process->awaiting = false;
  } else if (const auto* line = std::get_if<media::Log>(&message)) {
    log.LogMessage(line->level, line->text);
  } else if (const auto* failed = std::get_if<media::Failed>(&message)) {
    End("cannot play: " + failed->description, true, failed->description);
  } else if (std::holds_alternative<media::State>(message) ||
             std::holds_alternative<media::MediaType>(message) ||
             std::holds_alternative<media::Clock>(message) ||
             std::holds_alternative<media::QueuedError>(message) ||
             std::holds_alternative<media::MediaError>(message)) {
    if (onMessage) onMessage(message);
  } else {
    End(std::string("sent a command (\"") + MediaMessageName(message) + "\") and was ended", true,
        kEndedUnexpectedly);
  }
}

void MediaProcessLink::State::SchedulePing() {
  pingTimer.expires_after(timing.pingInterval);
  pingTimer.async_wait([weak = weak_from_this(), on = process](const asio::error_code& error) {
    auto self = weak.lock();
    if (error || !self || self->process != on) return;
    self->OnPingTimer();
  });
}

void MediaProcessLink::State::OnPingTimer() {
  auto now = Clock::now();
  if (process->awaiting) {
    if (now - process->awaitingSince >= timing.answerBound) {
      End(std::string(process->greeted ? "did not answer" : "did not start") + " within " +
              DurationText(timing.answerBound) + " and was ended",
          true, kEndedUnexpectedly);
      return;
    }
  } else {
    process->awaiting = true;
    process->awaitingSince = now;
    Send(media::Ping{++process->pingSerial});
    if (!process) return;
  }
  SchedulePing();
}

// One line in the log for each media process that ends. `why` completes
// "the media process ...".
void MediaProcessLink::State::End(const std::string& why, bool kill,
                                  const std::string& playReason) {
  if (!process) return;
  std::shared_ptr<Process> gone = std::move(process);
  asio::error_code ignored;
  gone->socket.close(ignored);
  pingTimer.cancel();

  auto now = Clock::now();
  std::string line = "Media: the media process " + why;
  if (kill) {
    reaper.Kill(gone->processId);
    log.LogMessage(3, line + kLogTail);
  } else {
    // Said once it is known how it ended: at once, as a rule.
    reaper.AwaitQuit(gone->processId, now + timing.quitWait, [&log = log, line](const auto& how) {
      log.LogMessage(3, line + " (" + how + ")" + kLogTail);
    });
  }
  if (onEnded) onEnded(playReason, now - gone->started);
}

// Told to quit best effort and without waiting: it also quits when the
// link closes.
void MediaProcessLink::State::Quit() {
  if (!process) return;
  std::shared_ptr<Process> gone = std::move(process);
  pingTimer.cancel();
  std::string quit = EncodeMediaMessage(media::Quit{});
  [[maybe_unused]] auto sent =
      ::send(gone->socket.native_handle(), quit.data(), quit.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
  asio::error_code ignored;
  gone->socket.close(ignored);
  reaper.AwaitQuit(gone->processId, Clock::now() + timing.quitWait);
}

MediaProcessLink::MediaProcessLink(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs,
                                   std::string program, const Timing& timing)
    : m_state(std::make_shared<State>(loop, log, outputs, std::move(program), timing)) {}

MediaProcessLink::~MediaProcessLink() {
  Close();
}

void MediaProcessLink::SetOnMessage(OnMessage handler) {
  m_state->onMessage = std::move(handler);
}

void MediaProcessLink::SetOnEnded(OnEnded handler) {
  m_state->onEnded = std::move(handler);
}

void MediaProcessLink::Start() {
  m_state->Start();
}

bool MediaProcessLink::Running() const {
  return m_state->process != nullptr;
}

int64_t MediaProcessLink::ProcessId() const {
  return m_state->process ? m_state->process->processId : 0;
}

void MediaProcessLink::Send(const MediaMessage& message) {
  m_state->Send(message);
}

void MediaProcessLink::Quit() {
  m_state->Quit();
}

void MediaProcessLink::Close() {
  m_state->Quit();
  // Closing is the one place that waits: the player is going.
  m_state->reaper.WaitForAll();
}

}  // namespace tav
