#pragma once
// The composition root of the show player: builds every real adapter (the
// event loop, timers on it, the system clock, the settings file, the tray
// socket, local files, the sequence library, shell commands, the process
// memory probe, the hardware-I/O control with its UDP and serial outputs, and
// the media player served by the media process), hands them to the host
// form, loads it and runs the loop until the form has unloaded.
//
// Before anything is built it takes the instance lock beside the tray
// socket; without it the player ends at once. Signals: the first SIGTERM or
// SIGINT asks for a graceful shutdown (as the tray's message 8), any further
// one for an immediate shutdown.

#include <string>

namespace tav::player {

// Exit statuses, for the service manager (docs/running.md).
inline constexpr int kExitEnded = 0;
inline constexpr int kExitShowsNotEnabled = 1;
inline constexpr int kExitUsage = 2;
inline constexpr int kExitAnotherInstance = 3;
inline constexpr int kExitRestart = 75;

struct PlayerOptions {
  // Compared with "/noschedule" by the form.
  std::string commandLine;
  bool view = false;
  // Which universes (and TAV units) the view shows; "" for every universe
  // of the network preferences.
  std::string viewSpec;
  // SCHED_FIFO priority for the loop's thread; 0: normal priority.
  int realtimePriority = 0;
};

// Runs the player; returns the exit status.
int RunPlayer(const PlayerOptions& options);

}  // namespace tav::player
