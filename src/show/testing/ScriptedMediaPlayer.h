#pragma once
// Test double of the MediaPlayer port, on virtual time. Each media file (by
// its base name) follows a script: how long it plays, whether it is audio
// or video, whether it cannot be played (and the errors it then queues), or
// whether it stops early. What it reports is a function of the clock, so a
// show sees the same thing whenever it asks; its events come on the loop,
// through a timer of the service, as the real player's would:
//  - a file that plays: PlayStateChange(3) at once;
//  - at its end, or when it stops early: PlayStateChange(8), then (1);
//  - a file that cannot be played: the transitional state (9) until, on the
//    loop at once, MediaError and PlayStateChange(1) arrive;
//  - Stop(): PlayStateChange(1).
// Its calls and events go to a Timeline as "media ..." lines.

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "ports/Clock.h"
#include "ports/TimerService.h"
#include "show/MediaPlayer.h"
#include "show/testing/Timeline.h"

namespace tav {

inline constexpr int32_t kMediaEnded = 8;

struct MediaScript {
  double durationSeconds = 60.0;
  std::string mediaType = "audio";
  // Not empty: the file cannot be played, and these are its errors.
  std::vector<std::string> loadErrors;
  // Ends after this long although the file is longer (a lost device, say).
  std::optional<double> stopsAfterSeconds;
};

class ScriptedMediaPlayer : public MediaPlayer {
 public:
  ScriptedMediaPlayer(const Clock& clock, TimerService& timers, Timeline* timeline = nullptr);

  // The script of a file, by base name; others follow the default script.
  void Script(const std::string& name, MediaScript script) { m_scripts[name] = std::move(script); }
  void SetDefaultScript(MediaScript script) { m_default = std::move(script); }
  // Makes reading the error queue fail, as a broken player would.
  void FailErrorQueue(bool fail) { m_failQueue = fail; }
  // Queues errors and raises MediaError at once (the test acts as the loop).
  void RaiseMediaError(const std::vector<std::string>& descriptions);

  // The base name of the current media, "" when none.
  std::string CurrentFile() const;
  bool FormShown() const { return m_formShown; }

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

 private:
  struct Pending {
    uint32_t dueTick;
    std::function<void()> raise;
  };
  uint32_t ElapsedMs() const;
  void Post(uint32_t delayMs, std::function<void()> raise);
  void Deliver();
  void Record(const std::string& text);

  const Clock& m_clock;
  Timeline* m_timeline;
  std::unique_ptr<Timer> m_events;
  std::vector<Pending> m_pending;
  std::map<std::string, MediaScript> m_scripts;
  MediaScript m_default;
  std::function<void(int32_t)> m_onPlayStateChange;
  std::function<void()> m_onMediaError;

  // The current media.
  std::string m_file;
  MediaScript m_script;
  uint32_t m_openedAt = 0;
  uint32_t m_endMs = 0;       // where it stops by itself
  bool m_stopped = true;      // by Stop(), or nothing opened
  bool m_loadFailed = false;  // the failure of a file that cannot play has been raised
  uint64_t m_generation = 0;  // events of an earlier file are dropped

  std::vector<std::string> m_errors;
  bool m_failQueue = false;
  bool m_formShown = false;
};

}  // namespace tav
