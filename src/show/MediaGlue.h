#pragma once
// The show engine's side of media playback: starting the media file of a
// sequence, keeping that sequence in step with the player's position,
// showing or hiding the video form as the user's video preferences say, and
// turning media errors into the sequence's error text and a log line.
//
// One sequence at a time is bound to the player (the MediaSequence). When it
// ends while its media still plays (stopped by a conflict, by the show
// winding down, or because the show ended), the media is stopped too:
// people expect the music to stop with its lights, not to play on over the
// next section.
//
// Owned by the ShowPlayer. The video preferences are read once, when it is
// made; the player and the log are handed over by SetControls and must
// outlive it. Single-threaded.

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "config/Settings.h"
#include "ports/MessageLog.h"
#include "sequence/SequencePlayInfo.h"
#include "show/MediaPlayer.h"

namespace tav {

struct VideoPreferences {
  bool AudioOnly = false;
  bool DisplayVideos = true;
  bool DisplayVisualizations = false;
  bool FullScreenVideo = false;
  int32_t MonitorX = 0;
  int32_t MonitorY = 0;
};

class MediaGlue {
 public:
  // Reads the video preferences. Settings that cannot be read give their
  // defaults.
  explicit MediaGlue(const Settings& settings);

  void SetControls(MediaPlayer* player, MessageLog* log);
  const VideoPreferences& Video() const { return m_video; }

  const std::shared_ptr<SequencePlayInfo>& MediaSequence() const { return m_mediaSequence; }
  bool IsMediaSequence(const SequencePlayInfo* item) const {
    return item && item == m_mediaSequence.get();
  }

  // Makes `path` the player's current media (which starts it), starts the
  // sequence's music synchronisation at the player's position and binds the
  // sequence to the player.
  void StartMedia(const std::shared_ptr<SequencePlayInfo>& item, const std::string& path);
  // Called on every service of the MediaSequence: stops the sequence when
  // the player has stopped (true), otherwise hands it the position.
  bool KeepInStep(SequencePlayInfo& item);
  // The sequence has ended: unbinds it and stops its media if that still
  // plays. Any other sequence is ignored.
  void SequenceEnded(const SequencePlayInfo* item);

  // The player's events.
  void OnPlayStateChange(int32_t newState);
  void OnMediaError();
  // "Error playing media file", then ": " and the queued descriptions joined
  // by " / "; clears the queue. "Unexpected error playing media file" when
  // the queue cannot be read.
  std::string MediaErrorText();

  // Hides the video form unless it is known to be hidden already (the
  // engine asks on every tick while no musical piece plays).
  void HideVideoForm();
  bool VideoFormShown() const { return m_formShown.value_or(false); }

 private:
  void ShowVideoForm();

  VideoPreferences m_video;
  MediaPlayer* m_WMP = nullptr;
  MessageLog* m_log = nullptr;
  std::shared_ptr<SequencePlayInfo> m_mediaSequence;
  // Unknown until the engine first shows or hides the form.
  std::optional<bool> m_formShown;
};

// The player's position in whole milliseconds, halves to even.
int32_t MediaPositionMs(double seconds);

}  // namespace tav
