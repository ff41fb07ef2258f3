#pragma once
// Port: the media player that plays the music and video of musical
// sequences, and the form that shows its video. The show engine uses the
// subset a show needs: open a file (which starts it), what kind of media it
// is, where it is, whether it plays, full screen, the error queue, and two
// events. The real one is an adapter on libmpv; tests use a scripted double
// whose position follows the virtual clock.
//
// Events are raised on the event loop, never from another thread, and never
// from inside a call the engine makes.

#include <cstdint>
#include <functional>
#include <string>

namespace tav {

// Play states, as the media player reports them.
inline constexpr int32_t kMediaStopped = 1;
inline constexpr int32_t kMediaPaused = 2;
inline constexpr int32_t kMediaPlaying = 3;
// Between opening a file and the start of its playback.
inline constexpr int32_t kMediaTransitioning = 9;

class MediaPlayer {
 public:
  virtual ~MediaPlayer() = default;

  // Makes the file the current media and starts playing it. A file that
  // cannot be played is not an exception: it raises the media-error event
  // (with the reason in the error queue) and the play state goes to stopped.
  virtual void OpenMedia(const std::string& path) = 0;
  // Stops the current media, if any.
  virtual void Stop() = 0;
  // The current media's item information; the engine asks for "MediaType",
  // which is "audio" or "video" ("" when nothing is loaded).
  virtual std::string CurrentMediaItemInfo(const std::string& attribute) const = 0;
  // Seconds from the start of the current media.
  virtual double CurrentPosition() const = 0;
  // kMediaStopped, kMediaPaused, kMediaPlaying, or another of the player's
  // transitional codes.
  virtual int32_t PlayState() const = 0;
  virtual void SetFullScreen(bool value) = 0;

  // The error queue: descriptions of the errors since it was last cleared.
  virtual int32_t ErrorCount() const = 0;
  // 0-based; fails with the subscript error (9) outside the queue.
  virtual std::string ErrorDescription(int32_t index) const = 0;
  virtual void ClearErrorQueue() = 0;

  // The video form: shown with its top-left corner at (x, y) pixels, or
  // hidden.
  virtual void ShowVideoForm(int32_t x, int32_t y) = 0;
  virtual void HideVideoForm() = 0;

  virtual void SetOnPlayStateChange(std::function<void(int32_t newState)> handler) = 0;
  virtual void SetOnMediaError(std::function<void()> handler) = 0;
};

}  // namespace tav
