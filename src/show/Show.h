#pragma once
// What the player runs during one scheduled slot: five playlists (one per
// section), the interactive groups, the startup trigger and options, and the
// schedule entry the show was loaded for. The playlists, the group collection
// and the trigger are shared by reference: a caller that changes Main()
// changes this show. Monitoring is never null. Two shows have the same
// contents when they write the same show file text; Monitoring is not part of
// that text.

#include <cstdint>
#include <memory>
#include <vector>

#include "schedule/MonitoredShowEvent.h"
#include "show/InteractiveGroup.h"
#include "show/Playlist.h"
#include "show/Trigger.h"

namespace tav {

// A show's interactive section, in show file order. Shared by the show and
// whoever edits or plays it.
using InteractiveGroupList = std::vector<std::shared_ptr<InteractiveGroup>>;

class Show {
 public:
  // Musical Startup, Shutdown and Musical (order 1, no delay), Main animation
  // one at a time, Background animation all at once; no groups, StartupType
  // 0, no trigger, no preloading, a new empty Monitoring.
  Show();

  const std::shared_ptr<Playlist>& Background() const { return m_background; }
  void SetBackground(std::shared_ptr<Playlist> value) { m_background = std::move(value); }

  // True exactly when both shows write the same text; false when either text
  // cannot be written (an empty group, a missing playlist) or other is null.
  bool HasSameContents(const std::shared_ptr<Show>& other) const;
  bool HasSameContents(const Show& other) const;

  const std::shared_ptr<InteractiveGroupList>& InteractiveGroups() const {
    return m_interactiveGroups;
  }
  void SetInteractiveGroups(std::shared_ptr<InteractiveGroupList> value) {
    m_interactiveGroups = std::move(value);
  }
  const std::shared_ptr<Playlist>& Main() const { return m_main; }
  void SetMain(std::shared_ptr<Playlist> value) { m_main = std::move(value); }
  const std::shared_ptr<MonitoredShowEvent>& Monitoring() const { return m_monitoring; }
  // Null stores a new, empty event instead.
  void SetMonitoring(std::shared_ptr<MonitoredShowEvent> value);
  const std::shared_ptr<Playlist>& Musical() const { return m_musical; }
  void SetMusical(std::shared_ptr<Playlist> value) { m_musical = std::move(value); }
  bool PreloadSequences() const { return m_preloadSequences; }
  void SetPreloadSequences(bool value) { m_preloadSequences = value; }
  const std::shared_ptr<Playlist>& Shutdown() const { return m_shutdown; }
  void SetShutdown(std::shared_ptr<Playlist> value) { m_shutdown = std::move(value); }
  const std::shared_ptr<Playlist>& Startup() const { return m_startup; }
  void SetStartup(std::shared_ptr<Playlist> value) { m_startup = std::move(value); }
  // Null when the show does not wait for an input to start.
  const std::shared_ptr<Trigger>& StartupTrigger() const { return m_startupTrigger; }
  void SetStartupTrigger(std::shared_ptr<Trigger> value) { m_startupTrigger = std::move(value); }
  // 0 = no startup trigger; 1 and 2 are the engine's two ways of waiting.
  int32_t StartupType() const { return m_startupType; }
  void SetStartupType(int32_t value) { m_startupType = value; }

 private:
  std::shared_ptr<Playlist> m_startup;
  std::shared_ptr<Playlist> m_shutdown;
  std::shared_ptr<Playlist> m_main;
  std::shared_ptr<Playlist> m_musical;
  std::shared_ptr<Playlist> m_background;
  std::shared_ptr<InteractiveGroupList> m_interactiveGroups;
  int32_t m_startupType = 0;
  std::shared_ptr<Trigger> m_startupTrigger;
  bool m_preloadSequences = false;
  std::shared_ptr<MonitoredShowEvent> m_monitoring;
};

}  // namespace tav
