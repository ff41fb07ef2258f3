#pragma once
// A run of the real player on virtual time: the host form with its show
// engine, its schedule lookups and its timers, over the user's settings,
// schedules, shows, sequences and media, from one moment to another, with
// nothing leaving the process. Lights go to SimulatedOutputs, media to the
// SimulatedMediaPlayer (lengths from the files themselves), the user's files
// are read and never written (ReadOnlyStores), shell commands are not run.
// What happened comes back as a Timeline: shows starting (with the source
// that chose them and why), winding down and ending; sequences starting and
// stopping; every warning and error the player logged; notes on what was
// simulated rather than done.
//
// The player starts at `from` as if it had been started then, so the first
// show begins a few seconds later (the player's start-up delay).

#include <functional>
#include <optional>
#include <string>

#include "SimulatedOutputs.h"
#include "Timeline.h"
#include "config/RegistryDocument.h"
#include "config/Settings.h"
#include "support/DateTime.h"

namespace tav::simulation {

struct SimulationSetup {
  DateTime from;
  DateTime to;
  // A copy of the user's settings: the simulation may change it freely.
  RegistryDocument settings;
  PathDefaults pathDefaults;
  // As the player started with "/noschedule".
  bool onDemandOnly = false;
  // Not empty: this show file is requested on demand from `from` to `to`,
  // as the tray program would request it.
  std::string onDemandShow;
  // Keep the player's information lines (level 1) as well.
  bool withInformation = false;
  // Virtual seconds per real second; 0 runs as fast as the machine can.
  double speed = 0;
  // Called for each line as it is added to the timeline (not for folded
  // repetitions), so that a slow run can be watched as it goes.
  std::function<void(const TimelineEvent&)> onEvent;
};

struct SimulationReport {
  Timeline timeline;
  OutputCounts outputs;
  // When the player stopped by itself before `to` (a restart the memory
  // watchdog asked for, shows that could not be enabled), when it did.
  std::optional<DateTime> endedEarlyAt;

  bool Failed() const { return timeline.Count(EventKind::kError) > 0 || endedEarlyAt.has_value(); }
};

SimulationReport Simulate(const SimulationSetup& setup);

}  // namespace tav::simulation
