#pragma once
// The MediaPlayer port served by the media process: a program of its own
// (showplayer-media, which hosts MpvMediaPlayer) plays the music and video,
// so that libmpv's memory and threads stay out of the player and a crash in
// a decoder or a sound driver leaves the lights running. The two speak the
// protocol of docs/media-process.md over a socket pair the media process
// inherits.
//
// Whatever the engine asks is answered at once from what the media process
// last reported: the play state, the media type, the error queue, and the
// position, which runs on from the latest report stamped with the monotonic
// clock both processes read (MediaClock): never backwards while playing,
// never beyond the media's length. The play states are MpvMediaPlayer's:
// OpenMedia moves to transitioning (9) at once, then playing (3), then
// stopped (1) once the media has finished sounding. PlayStateChange and
// MediaError are raised on the loop, never from inside a call made on this
// object; each change raised holds for the play asked for last
// (MediaPlayState).
//
// The media process is started by the first OpenMedia (posix_spawn: the
// loop does not wait for it; the play waits in the link until the media
// process reads it, transitioning meanwhile) and ended in order (quit, then
// reaped) once nothing has played for MediaProcessTiming::idleLimit, so
// that an idle player does not hold libmpv's memory; the next OpenMedia
// starts a new one. While it runs it is pinged every pingInterval. When it
// ends, writes what cannot be read, or leaves a ping unanswered for
// answerBound, it is ended and one line is logged. The music is lost, not
// the show: a play that was going plays on without sound, its position
// running on the steady clock from where it stood to the media's end (then
// stopped, as if heard to its end), so the lights bound to it keep their
// time; a media error says why ("the media process ended unexpectedly;
// playing on without sound"). The next OpenMedia starts a new media process;
// one that cannot have one (the program is missing, cannot start, or is in
// its back-off) plays on without sound in the same way, from 0 and without
// end until Stop. After a second early death in a row, OpenMedia does not
// start one until a back-off has passed that doubles with each further early
// death, so that a media process that cannot start does not spin.
//
// Owned by the composition root; the EventLoop and the MessageLog must
// outlive it. Used on the loop's thread only. Destroying it closes the link
// (the media process then quits) and waits for the media process at most
// quitWait before killing it.

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "platform/EventLoop.h"
#include "platform/media/MediaClock.h"
#include "platform/media/MpvOutputs.h"
#include "ports/MessageLog.h"
#include "show/MediaPlayer.h"

namespace tav {

struct MediaProcessTiming {
  // How often a running media process is asked whether it is alive.
  std::chrono::milliseconds pingInterval{1000};
  // How long it may take to greet or to answer a ping.
  std::chrono::milliseconds answerBound{3000};
  // A media process that lived this long did not die early.
  std::chrono::milliseconds stableLife{10000};
  // The back-off after the second early death in a row; it doubles with
  // each further one, up to maxBackOff.
  std::chrono::milliseconds firstBackOff{1000};
  std::chrono::milliseconds maxBackOff{60000};
  // How long a media process that is told to quit (when idle, or by the
  // destructor) may take before it is killed.
  std::chrono::milliseconds quitWait{1000};
  // How long a media process may have nothing to play before it is ended.
  std::chrono::milliseconds idleLimit{60000};
};

class MediaProcessPlayer : public MediaPlayer {
 public:
  static constexpr int32_t kTransitioning = kMediaTransitioning;
  // The media process's program: named by this environment variable, else
  // this name in the folder of the running program.
  static constexpr const char* kProgramVariable = "TAV_MEDIA_HELPER";
  static constexpr const char* kProgramName = "showplayer-media";
  static std::string DefaultProgramPath();

  // Plays through the media process `program` with the given outputs, which
  // starts at the first OpenMedia. A program that is missing or cannot start
  // is logged (once until one starts), not raised: each OpenMedia tries
  // again.
  MediaProcessPlayer(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs,
                     const std::string& program, const MediaProcessTiming& timing = {});
  ~MediaProcessPlayer() override;
  MediaProcessPlayer(const MediaProcessPlayer&) = delete;
  MediaProcessPlayer& operator=(const MediaProcessPlayer&) = delete;

  void OpenMedia(const std::string& path) override;
  void Stop() override;
  std::string CurrentMediaItemInfo(const std::string& attribute) const override;
  double CurrentPosition() const override;
  int32_t PlayState() const override;
  void SetFullScreen(bool value) override;

  int32_t ErrorCount() const override;
  std::string ErrorDescription(int32_t index) const override;
  void ClearErrorQueue() override;

  void ShowVideoForm(int32_t x, int32_t y) override;
  void HideVideoForm() override;

  void SetOnPlayStateChange(std::function<void(int32_t newState)> handler) override;
  void SetOnMediaError(std::function<void()> handler) override;

  // The running media process, 0 when none (tests and measurements).
  int64_t ProcessId() const;
  // The latest position report of the current play, as the media process
  // took it from mpv, and when it arrived here (measurements).
  struct PositionReport {
    MediaClock::Snapshot clock;
    MediaClock::TimePoint received{};
  };
  PositionReport LatestReport() const;

 private:
  struct Impl;
  std::shared_ptr<Impl> m_impl;
};

}  // namespace tav
