#include "platform/media/MediaProcessPlayer.h"

#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <asio.hpp>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <optional>
#include <vector>

#include "platform/media/ChildProcess.h"
#include "platform/media/ChildReaper.h"
#include "platform/media/MediaPlayState.h"
#include "platform/media/MediaProtocol.h"
#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kSource = "MediaProcessPlayer";
constexpr const char* kEndedUnexpectedly = "the media process ended unexpectedly";
constexpr const char* kLogTail = "; the next media file starts a new one";
constexpr const char* kSilentTail = "; playing on without sound";
// The media process's end of the socket pair, as its command line says.
constexpr int kChildSocket = 3;
// What may wait for a media process that does not read before it counts as
// hung (a few thousand commands).
constexpr size_t kMaxUnsent = 256 * 1024;
constexpr size_t kReadChunk = 16 * 1024;

using SteadyClock = std::chrono::steady_clock;
using Socket = asio::local::stream_protocol::socket;

SteadyClock::duration Seconds(double seconds) {
  return std::chrono::duration_cast<SteadyClock::duration>(std::chrono::duration<double>(seconds));
}

std::string DurationText(SteadyClock::duration duration) {
  auto ms = std::chrono::duration_cast<std::chrono::milliseconds>(duration).count();
  if (ms % 1000 == 0) return std::to_string(ms / 1000) + " s";
  return std::to_string(ms) + " ms";
}

}  // namespace

std::string MediaProcessPlayer::DefaultProgramPath() {
  const char* named = std::getenv(kProgramVariable);
  if (named && *named) return named;
  std::error_code error;
  auto self = std::filesystem::read_symlink("/proc/self/exe", error);
  if (error) return kProgramName;
  return (self.parent_path() / kProgramName).string();
}

struct MediaProcessPlayer::Impl : std::enable_shared_from_this<Impl> {
  // One running media process and the link to it. Shared with the pending
  // reads and writes, which keep their buffers alive until they complete.
  struct Link {
    explicit Link(asio::io_context& context) : socket(context) {}
    int64_t processId = 0;
    SteadyClock::time_point started;
    Socket socket;
    std::array<char, kReadChunk> received{};
    MediaLineReader lines;
    std::string unsent;
    std::string sending;
    bool greeted = false;
    // Awaiting the greeting, or the answer to ping `pingSerial`, since then.
    bool awaiting = true;
    SteadyClock::time_point awaitingSince;
    uint64_t pingSerial = 0;
  };

  Impl(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs, std::string program,
       const MediaProcessTiming& timing)
      : loop(loop),
        log(log),
        outputs(outputs),
        program(std::move(program)),
        timing(timing),
        plays(loop, log, kSource),
        pingTimer(loop.Context()),
        reaper(loop),
        idleTimer(loop.Context()),
        silentEnd(loop.Context()) {}

  void Start();
  void Send(const MediaMessage& message);
  void StartWrite(const std::shared_ptr<Link>& on);
  void StartRead(const std::shared_ptr<Link>& on);
  void OnReceived(const std::shared_ptr<Link>& on, size_t size);
  void OnLine(const std::string& line);
  void Handle(const MediaMessage& message);
  void SchedulePing();
  void OnPingTimer();
  void EndLink(const std::string& why, bool kill, const std::string& playReason);
  void EndLinkUnexpectedly();
  void QuitLink();
  void WatchIdle();
  void Close();

  bool Current(uint64_t generation) const { return generation == plays.Generation(); }
  void BeginNewPlay();
  void PlayOnInSilence(const std::string& reason);
  double Position(SteadyClock::time_point now) const;

  EventLoop& loop;
  MessageLog& log;
  MpvOutputs outputs;
  std::string program;
  MediaProcessTiming timing;
  MediaPlayState plays;

  std::shared_ptr<Link> link;
  asio::steady_timer pingTimer;
  ChildReaper reaper;
  int earlyDeaths = 0;
  SteadyClock::time_point nextStartAllowed{};
  // Whether the latest start failed and said so: said once until one works.
  bool startFailureSaid = false;
  // Since when a running media process has had nothing to play.
  std::optional<SteadyClock::time_point> idleSince;
  asio::steady_timer idleTimer;

  std::string path;
  std::string mediaType;
  MediaClock clock;
  PositionReport latestReport;

  // A play that has no media process: its position runs on the steady
  // clock from `from` at `since`, up to `end` when the media's length is
  // known (0: unknown), when it stops as the music would have.
  struct SilentPlay {
    double from = 0;
    SteadyClock::time_point since;
    double end = 0;
  };
  std::optional<SilentPlay> silent;
  asio::steady_timer silentEnd;
};

// Spawning returns at once: the media process loads libmpv on its own time.
void MediaProcessPlayer::Impl::Start() {
  if (::access(program.c_str(), X_OK) != 0) {
    std::string reason = std::strerror(errno);
    throw Error(kMediaPlayerUnavailable, kSource,
                "cannot start the media process " + program + ": " + reason);
  }
  SpawnedChild child =
      SpawnWithSocket(program, {"--fd", std::to_string(kChildSocket)}, kChildSocket);
  auto fresh = std::make_shared<Link>(loop.Context());
  fresh->processId = child.processId;
  fresh->started = fresh->awaitingSince = SteadyClock::now();
  asio::error_code error;
  fresh->socket.assign(asio::local::stream_protocol(), child.socket, error);
  if (error) {
    ::close(child.socket);
    reaper.Kill(child.processId);
    throw Error(errors::kInvalidProcedureCall, kSource,
                "Cannot reach the media process: " + error.message());
  }
  link = std::move(fresh);
  startFailureSaid = false;
  Send(media::Outputs{outputs.audioOutput, outputs.audioDevice, outputs.videoOutput});
  StartRead(link);
  SchedulePing();
}

void MediaProcessPlayer::Impl::Send(const MediaMessage& message) {
  if (!link) return;
  link->unsent += EncodeMediaMessage(message);
  if (link->unsent.size() > kMaxUnsent) {
    EndLink("stopped reading and was ended", true, kEndedUnexpectedly);
    return;
  }
  StartWrite(link);
}

void MediaProcessPlayer::Impl::StartWrite(const std::shared_ptr<Link>& on) {
  if (!on->sending.empty() || on->unsent.empty()) return;
  on->sending.swap(on->unsent);
  // The socket is written with send(MSG_NOSIGNAL): a media process that has
  // gone raises no SIGPIPE here, only an error.
  asio::async_write(on->socket, asio::buffer(on->sending),
                    [weak = weak_from_this(), on](const asio::error_code& error, size_t) {
                      auto self = weak.lock();
                      if (!self || self->link != on) return;
                      on->sending.clear();
                      if (error) {
                        self->EndLinkUnexpectedly();
                        return;
                      }
                      self->StartWrite(on);
                    });
}

void MediaProcessPlayer::Impl::StartRead(const std::shared_ptr<Link>& on) {
  on->socket.async_read_some(
      asio::buffer(on->received),
      [weak = weak_from_this(), on](const asio::error_code& error, size_t size) {
        auto self = weak.lock();
        if (!self || self->link != on) return;
        if (error) {
          self->EndLinkUnexpectedly();
          return;
        }
        self->OnReceived(on, size);
      });
}

void MediaProcessPlayer::Impl::OnReceived(const std::shared_ptr<Link>& on, size_t size) {
  on->lines.Append(std::string_view(on->received.data(), size));
  std::string line;
  for (;;) {
    MediaLineStatus status = on->lines.Next(line);
    if (status == MediaLineStatus::kIncomplete) break;
    if (status == MediaLineStatus::kTooLong) {
      EndLink("sent a line longer than " + std::to_string(kMaxMediaLine) + " bytes and was ended",
              true, kEndedUnexpectedly);
      return;
    }
    OnLine(line);
    WatchIdle();
    if (link != on) return;  // the line ended it
  }
  StartRead(on);
}

void MediaProcessPlayer::Impl::OnLine(const std::string& line) {
  MediaMessage message;
  try {
    message = DecodeMediaLine(line);
  } catch (const Error& e) {
    EndLink("sent what cannot be read (" + e.Description() + ") and was ended", true,
            kEndedUnexpectedly);
    return;
  }
  bool isHello = std::holds_alternative<media::Hello>(message);
  if (isHello == link->greeted) {
    EndLink(std::string("sent \"") + MediaMessageName(message) +
                (isHello ? "\" twice" : "\" before its greeting") + " and was ended",
            true, kEndedUnexpectedly);
    return;
  }
  Handle(message);
}

void MediaProcessPlayer::Impl::Handle(const MediaMessage& message) {
  if (const auto* hello = std::get_if<media::Hello>(&message)) {
    if (hello->version != kMediaProtocolVersion) {
      EndLink("speaks version " + std::to_string(hello->version) + " of the protocol, not " +
                  std::to_string(kMediaProtocolVersion),
              true, kEndedUnexpectedly);
      return;
    }
    link->greeted = true;
    link->awaiting = false;
  } else if (const auto* pong = std::get_if<media::Pong>(&message)) {
    if (pong->serial == link->pingSerial) link->awaiting = false;
  } else if (const auto* report = std::get_if<media::State>(&message)) {
    if (!Current(report->generation)) return;
    if (report->state == kMediaStopped) clock.Reset();
    plays.SetState(report->state);
  } else if (const auto* type = std::get_if<media::MediaType>(&message)) {
    if (Current(type->generation)) mediaType = type->type;
  } else if (const auto* reported = std::get_if<media::Clock>(&message)) {
    if (!Current(reported->generation) || plays.State() == kMediaStopped) return;
    latestReport.clock = {reported->position,
                          MediaClock::TimePoint(std::chrono::nanoseconds(reported->atNs)),
                          reported->end, reported->running};
    latestReport.received = SteadyClock::now();
    clock.Follow(latestReport.clock);
  } else if (const auto* queued = std::get_if<media::QueuedError>(&message)) {
    plays.QueueError(queued->description);
  } else if (const auto* failure = std::get_if<media::MediaError>(&message)) {
    // An error of an earlier play leaves the current one as it is.
    bool current = Current(failure->generation);
    if (current && failure->state == kMediaStopped) clock.Reset();
    plays.RaiseError(current ? failure->state : plays.State());
  } else if (const auto* line = std::get_if<media::Log>(&message)) {
    log.LogMessage(line->level, line->text);
  } else if (const auto* failed = std::get_if<media::Failed>(&message)) {
    EndLink("cannot play: " + failed->description, true, failed->description);
  } else {
    EndLink(std::string("sent a command (\"") + MediaMessageName(message) + "\") and was ended",
            true, kEndedUnexpectedly);
  }
}

void MediaProcessPlayer::Impl::SchedulePing() {
  pingTimer.expires_after(timing.pingInterval);
  pingTimer.async_wait([weak = weak_from_this(), on = link](const asio::error_code& error) {
    auto self = weak.lock();
    if (error || !self || self->link != on) return;
    self->OnPingTimer();
  });
}

void MediaProcessPlayer::Impl::OnPingTimer() {
  auto now = SteadyClock::now();
  if (link->awaiting) {
    if (now - link->awaitingSince >= timing.answerBound) {
      EndLink(std::string(link->greeted ? "did not answer" : "did not start") + " within " +
                  DurationText(timing.answerBound) + " and was ended",
              true, kEndedUnexpectedly);
      return;
    }
  } else {
    link->awaiting = true;
    link->awaitingSince = now;
    Send(media::Ping{++link->pingSerial});
    if (!link) return;
  }
  SchedulePing();
}

// One line in the log for each media process that ends; a play that was
// going ends with a media error. `why` completes "the media process ...".
void MediaProcessPlayer::Impl::EndLink(const std::string& why, bool kill,
                                       const std::string& playReason) {
  if (!link) return;
  std::shared_ptr<Link> gone = std::move(link);
  asio::error_code ignored;
  gone->socket.close(ignored);
  pingTimer.cancel();

  auto now = SteadyClock::now();
  earlyDeaths = now - gone->started < timing.stableLife ? earlyDeaths + 1 : 1;
  auto backOff = SteadyClock::duration::zero();
  if (earlyDeaths >= 2) {
    backOff = timing.firstBackOff * (int64_t{1} << std::min(earlyDeaths - 2, 20));
    backOff = std::min<SteadyClock::duration>(backOff, timing.maxBackOff);
  }
  nextStartAllowed = now + backOff;

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
  WatchIdle();
  if (plays.State() != kMediaStopped) PlayOnInSilence(playReason);
}

void MediaProcessPlayer::Impl::EndLinkUnexpectedly() {
  EndLink("ended unexpectedly", false, kEndedUnexpectedly);
}

// Ends the media process in order: it is told to quit (best effort and
// without waiting; it also quits when the link closes), then reaped, and
// killed if it has not gone within quitWait.
void MediaProcessPlayer::Impl::QuitLink() {
  if (!link) return;
  std::shared_ptr<Link> gone = std::move(link);
  pingTimer.cancel();
  idleTimer.cancel();
  idleSince.reset();
  std::string quit = EncodeMediaMessage(media::Quit{});
  [[maybe_unused]] auto sent =
      ::send(gone->socket.native_handle(), quit.data(), quit.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
  asio::error_code ignored;
  gone->socket.close(ignored);
  reaper.AwaitQuit(gone->processId, SteadyClock::now() + timing.quitWait);
  // It did not die: its life says nothing about the next one's.
  earlyDeaths = 0;
}

// libmpv's memory is worth keeping only while music comes: a media process
// that has had nothing to play for idleLimit is ended, and the next
// OpenMedia starts a new one. Called wherever the play state or the link
// may have changed.
void MediaProcessPlayer::Impl::WatchIdle() {
  if (!link || plays.State() != kMediaStopped) {
    idleSince.reset();
    idleTimer.cancel();
    return;
  }
  if (idleSince) return;
  idleSince = SteadyClock::now();
  idleTimer.expires_after(timing.idleLimit);
  idleTimer.async_wait([weak = weak_from_this(), on = link](const asio::error_code& error) {
    auto self = weak.lock();
    if (error || !self || self->link != on || !self->idleSince) return;
    if (SteadyClock::now() - *self->idleSince < self->timing.idleLimit) return;  // re-armed since
    self->idleSince.reset();
    self->QuitLink();
  });
}

void MediaProcessPlayer::Impl::Close() {
  idleTimer.cancel();
  silentEnd.cancel();
  plays.Silence();
  QuitLink();
  // Closing is the one place that waits: the player is going.
  reaper.WaitForAll();
}

void MediaProcessPlayer::Impl::BeginNewPlay() {
  plays.BeginPlay();
  clock.Reset();
  latestReport = {};
  silent.reset();
  silentEnd.cancel();
}

// The music is lost, not the show: the play goes on from where it stood,
// so that the lights bound to it keep their time, and ends at the media's
// end as the music would have (or when the engine stops it). Said through
// the error queue and the media error, as a file that cannot be played is.
void MediaProcessPlayer::Impl::PlayOnInSilence(const std::string& reason) {
  auto now = SteadyClock::now();
  double from = clock.Position(now);
  double end = clock.Take().end;
  clock.Reset();
  plays.QueueError("Cannot play \"" + path + "\": " + reason + kSilentTail);
  if (end > 0 && from >= end) {
    plays.RaiseError(kMediaStopped);  // it had been heard to its end
    return;
  }
  silent = SilentPlay{from, now, end};
  plays.RaiseError(kMediaPlaying);
  if (end <= 0) return;
  silentEnd.expires_after(Seconds(end - from));
  silentEnd.async_wait(
      [weak = weak_from_this(), forGeneration = plays.Generation()](const asio::error_code& error) {
        auto self = weak.lock();
        if (error || !self || self->plays.Generation() != forGeneration) return;
        self->silent.reset();
        self->plays.SetState(kMediaStopped);
      });
}

double MediaProcessPlayer::Impl::Position(SteadyClock::time_point now) const {
  if (!silent) return clock.Position(now);
  double position = silent->from + std::chrono::duration<double>(
                                       std::max(now - silent->since, SteadyClock::duration::zero()))
                                       .count();
  return silent->end > 0 ? std::min(position, silent->end) : position;
}

MediaProcessPlayer::MediaProcessPlayer(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs,
                                       const std::string& program, const MediaProcessTiming& timing)
    : m_impl(std::make_shared<Impl>(loop, log, outputs, program, timing)) {}

MediaProcessPlayer::~MediaProcessPlayer() {
  m_impl->Close();
}

void MediaProcessPlayer::OpenMedia(const std::string& path) {
  Impl& p = *m_impl;
  p.BeginNewPlay();
  p.path = path;
  p.mediaType.clear();
  p.plays.SetState(kTransitioning);
  if (!p.link) {
    auto now = SteadyClock::now();
    if (now < p.nextStartAllowed) {
      p.PlayOnInSilence(
          "the media process keeps ending unexpectedly; it is tried again in " +
          DurationText(std::chrono::ceil<std::chrono::seconds>(p.nextStartAllowed - now)));
      return;
    }
    try {
      p.Start();
    } catch (const Error& e) {
      // The lights need no media process: the shows go on, and each media
      // file tries to start one again. Said once until one starts.
      if (!p.startFailureSaid) {
        p.log.LogMessage(3, "Media: " + e.Description() +
                                "; music and video play without sound until it starts, and each "
                                "media file tries again");
        p.startFailureSaid = true;
      }
      p.PlayOnInSilence(e.Description());
      return;
    }
  }
  // Sent at once: while a new media process starts, the socket holds it
  // until the media process reads it.
  p.Send(media::Open{p.plays.Generation(), path});
  p.WatchIdle();
}

void MediaProcessPlayer::Stop() {
  Impl& p = *m_impl;
  p.BeginNewPlay();
  p.Send(media::Stop{p.plays.Generation()});
  p.plays.SetState(kMediaStopped);
  p.WatchIdle();
}

std::string MediaProcessPlayer::CurrentMediaItemInfo(const std::string& attribute) const {
  if (attribute == "MediaType") return m_impl->mediaType;
  if (attribute == "SourceURL") return m_impl->path;
  return "";
}

double MediaProcessPlayer::CurrentPosition() const {
  return m_impl->Position(SteadyClock::now());
}

int32_t MediaProcessPlayer::PlayState() const {
  return m_impl->plays.State();
}

void MediaProcessPlayer::SetFullScreen(bool value) {
  m_impl->Send(media::FullScreen{value});
}

int32_t MediaProcessPlayer::ErrorCount() const {
  return m_impl->plays.ErrorCount();
}

std::string MediaProcessPlayer::ErrorDescription(int32_t index) const {
  return m_impl->plays.ErrorDescription(index);
}

void MediaProcessPlayer::ClearErrorQueue() {
  m_impl->plays.ClearErrorQueue();
}

void MediaProcessPlayer::ShowVideoForm(int32_t x, int32_t y) {
  m_impl->Send(media::ShowVideo{x, y});
}

void MediaProcessPlayer::HideVideoForm() {
  m_impl->Send(media::HideVideo{});
}

void MediaProcessPlayer::SetOnPlayStateChange(std::function<void(int32_t)> handler) {
  m_impl->plays.SetOnPlayStateChange(std::move(handler));
}

void MediaProcessPlayer::SetOnMediaError(std::function<void()> handler) {
  m_impl->plays.SetOnMediaError(std::move(handler));
}

int64_t MediaProcessPlayer::ProcessId() const {
  return m_impl->link ? m_impl->link->processId : 0;
}

MediaProcessPlayer::PositionReport MediaProcessPlayer::LatestReport() const {
  return m_impl->latestReport;
}

}  // namespace tav
