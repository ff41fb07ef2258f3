#include "platform/media/MediaProcessPlayer.h"

#include <algorithm>
#include <asio.hpp>
#include <cstdlib>
#include <filesystem>
#include <optional>

#include "platform/media/MediaPlayState.h"
#include "platform/media/MediaProcessLink.h"
#include "platform/media/MediaProtocol.h"
#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kSource = "MediaProcessPlayer";
constexpr const char* kSilentTail = "; playing on without sound";

using SteadyClock = std::chrono::steady_clock;

SteadyClock::duration Seconds(double seconds) {
  return std::chrono::duration_cast<SteadyClock::duration>(std::chrono::duration<double>(seconds));
}

MediaProcessLink::Timing LinkTiming(const MediaProcessTiming& timing) {
  return {timing.pingInterval, timing.answerBound, timing.quitWait};
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
  Impl(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs, std::string program,
       const MediaProcessTiming& timing)
      : log(log),
        timing(timing),
        plays(loop, log, kSource),
        link(loop, log, outputs, std::move(program), LinkTiming(timing)),
        idleTimer(loop.Context()),
        silentEnd(loop.Context()) {}

  // Called once the Impl is shared: the link's handlers hold it weakly.
  void ListenToLink();
  void Handle(const MediaMessage& message);
  void OnLinkEnded(const std::string& reason, SteadyClock::duration lived);
  void QuitLink();
  void WatchIdle();
  void Close();

  bool Current(uint64_t generation) const { return generation == plays.Generation(); }
  void BeginNewPlay();
  void PlayOnInSilence(const std::string& reason);
  double Position(SteadyClock::time_point now) const;

  MessageLog& log;
  MediaProcessTiming timing;
  MediaPlayState plays;

  MediaProcessLink link;
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

void MediaProcessPlayer::Impl::ListenToLink() {
  link.SetOnMessage([weak = weak_from_this()](const MediaMessage& message) {
    if (auto self = weak.lock()) {
      self->Handle(message);
      self->WatchIdle();
    }
  });
  link.SetOnEnded([weak = weak_from_this()](const std::string& reason, auto lived) {
    if (auto self = weak.lock()) self->OnLinkEnded(reason, lived);
  });
}

void MediaProcessPlayer::Impl::Handle(const MediaMessage& message) {
  if (const auto* report = std::get_if<media::State>(&message)) {
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
  }
}

// A media process that dies young counts towards the back-off; a play that
// was going ends with a media error and plays on without sound.
void MediaProcessPlayer::Impl::OnLinkEnded(const std::string& reason, SteadyClock::duration lived) {
  earlyDeaths = lived < timing.stableLife ? earlyDeaths + 1 : 1;
  auto backOff = SteadyClock::duration::zero();
  if (earlyDeaths >= 2) {
    backOff = timing.firstBackOff * (int64_t{1} << std::min(earlyDeaths - 2, 20));
    backOff = std::min<SteadyClock::duration>(backOff, timing.maxBackOff);
  }
  nextStartAllowed = SteadyClock::now() + backOff;
  WatchIdle();
  if (plays.State() != kMediaStopped) PlayOnInSilence(reason);
}

// Ends the media process in order (see MediaProcessLink::Quit).
void MediaProcessPlayer::Impl::QuitLink() {
  if (!link.Running()) return;
  idleTimer.cancel();
  idleSince.reset();
  link.Quit();
  // It did not die: its life says nothing about the next one's.
  earlyDeaths = 0;
}

// libmpv's memory is worth keeping only while music comes: a media process
// that has had nothing to play for idleLimit is ended, and the next
// OpenMedia starts a new one. Called wherever the play state or the link
// may have changed.
void MediaProcessPlayer::Impl::WatchIdle() {
  if (!link.Running() || plays.State() != kMediaStopped) {
    idleSince.reset();
    idleTimer.cancel();
    return;
  }
  if (idleSince) return;
  idleSince = SteadyClock::now();
  idleTimer.expires_after(timing.idleLimit);
  idleTimer.async_wait(
      [weak = weak_from_this(), on = link.ProcessId()](const asio::error_code& error) {
        auto self = weak.lock();
        if (error || !self || self->link.ProcessId() != on || !self->idleSince) return;
        if (SteadyClock::now() - *self->idleSince < self->timing.idleLimit)
          return;  // re-armed since
        self->idleSince.reset();
        self->QuitLink();
      });
}

void MediaProcessPlayer::Impl::Close() {
  idleTimer.cancel();
  silentEnd.cancel();
  plays.Silence();
  QuitLink();
  link.Close();
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
    : m_impl(std::make_shared<Impl>(loop, log, outputs, program, timing)) {
  m_impl->ListenToLink();
}

MediaProcessPlayer::~MediaProcessPlayer() {
  m_impl->Close();
}

void MediaProcessPlayer::OpenMedia(const std::string& path) {
  Impl& p = *m_impl;
  p.BeginNewPlay();
  p.path = path;
  p.mediaType.clear();
  p.plays.SetState(kTransitioning);
  if (!p.link.Running()) {
    auto now = SteadyClock::now();
    if (now < p.nextStartAllowed) {
      p.PlayOnInSilence("the media process keeps ending unexpectedly; it is tried again in " +
                        MediaProcessLink::DurationText(
                            std::chrono::ceil<std::chrono::seconds>(p.nextStartAllowed - now)));
      return;
    }
    try {
      p.link.Start();
      p.startFailureSaid = false;
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
  p.link.Send(media::Open{p.plays.Generation(), path});
  p.WatchIdle();
}

void MediaProcessPlayer::Stop() {
  Impl& p = *m_impl;
  p.BeginNewPlay();
  p.link.Send(media::Stop{p.plays.Generation()});
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
  m_impl->link.Send(media::FullScreen{value});
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
  m_impl->link.Send(media::ShowVideo{x, y});
}

void MediaProcessPlayer::HideVideoForm() {
  m_impl->link.Send(media::HideVideo{});
}

void MediaProcessPlayer::SetOnPlayStateChange(std::function<void(int32_t)> handler) {
  m_impl->plays.SetOnPlayStateChange(std::move(handler));
}

void MediaProcessPlayer::SetOnMediaError(std::function<void()> handler) {
  m_impl->plays.SetOnMediaError(std::move(handler));
}

int64_t MediaProcessPlayer::ProcessId() const {
  return m_impl->link.ProcessId();
}

MediaProcessPlayer::PositionReport MediaProcessPlayer::LatestReport() const {
  return m_impl->latestReport;
}

}  // namespace tav
