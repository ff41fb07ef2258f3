#pragma once
// The MediaPlayer port on libmpv: plays the music and video of musical
// sequences. OpenMedia replaces whatever plays and starts the file; the play
// state goes to transitioning (9), then playing (3) once sound (or picture)
// starts, and stopped (1) when the media has finished sounding, when Stop is
// called, or when the file cannot be played. Each change raised holds for
// the play asked for last (MediaPlayState). The position runs smoothly
// between mpv's reports (MediaClock).
//
// Threads: mpv runs its own threads, which touch nothing of ours but a
// wakeup flag: its wakeup callback only posts a drain to the event loop, and
// events are read and handled there. No call into mpv from this class waits
// for a busy core (one opening or draining a sound device would stall the
// loop, and the lights with it): commands are asynchronous, and the only
// reads, of what a file holds, are made while the core waits for them in a
// hook. The PlayStateChange and MediaError events are raised from the loop,
// never from inside a call made on this object.
//
// Outputs (MpvOutputs, from the settings' "Media" section): an audio output
// that cannot be opened (no sound card, no sound server, a busy or missing
// device) leaves playback going on the null output, with one warning in the
// log; the player then stays on the null output until it is restarted. No
// video output ("null", or mpv's default where there is no display) makes
// showing the video form do nothing. The video form is hidden until shown;
// audio files show nothing (there are no visualisations).
//
// Owned by the composition root; the EventLoop and the MessageLog must
// outlive it. Used on the loop's thread only.

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

class MpvMediaPlayer : public MediaPlayer {
 public:
  static constexpr int32_t kTransitioning = kMediaTransitioning;

  // Starts mpv with the given outputs. Fails with kMediaPlayerUnavailable
  // when mpv cannot be started.
  MpvMediaPlayer(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs);
  ~MpvMediaPlayer() override;
  MpvMediaPlayer(const MpvMediaPlayer&) = delete;
  MpvMediaPlayer& operator=(const MpvMediaPlayer&) = delete;

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

  // For the media process, which hands the position on to the player: called
  // on the loop, from inside this player's handling of mpv's events, each
  // time the position clock of the current play takes a report, starts, or
  // learns the media's length. The handler must not call this player.
  void SetOnClockChange(std::function<void(const MediaClock& clock)> handler);

  // Whether showing the video form can show anything.
  bool HasVideoOutput() const;
  // Whether an audio output failed and playback went to the null output.
  bool FellBackToNullAudio() const;

 private:
  struct Impl;
  std::shared_ptr<Impl> m_impl;
};

}  // namespace tav
