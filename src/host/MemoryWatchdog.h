#pragma once
// The memory watchdog's restart check. The player runs unattended for weeks;
// when its memory has grown past a threshold while it is idle and no show is
// due soon, it ends itself so that the tray program starts it afresh. The
// decision is taken here, from the MonitorMemory settings (read at every
// check), the process's private bytes and the schedules; the host acts on
// it. (The other half of the watchdog, the decache pass, is the show
// engine's.)
//
// Owned by the host form, which calls ShutdownForRestartIfNecessary whenever
// the show engine finds no show to start. The settings, the memory probe
// and the clock must outlive it. Nothing is remembered between checks.

#include <cstdint>
#include <string>

#include "config/Settings.h"
#include "host/TrayHost.h"
#include "ports/Clock.h"
#include "ports/ProcessMemory.h"
#include "support/DateTime.h"

namespace tav {

// What the host form knows at the moment of a check.
struct WatchdogHostState {
  bool gracefulShutdownPending = false;
  bool shutdownRequested = false;
  // A scheduled show file has been read and handed to the engine since the
  // program started; ends the suppression window early.
  bool showLoadedSinceStart = false;
  DateTime startTime;
};

class MemoryWatchdog {
 public:
  static constexpr const char* kRestartReason = "Show Player shutting down for restart";

  MemoryWatchdog(const Settings& settings, const ProcessMemory& memory, const Clock& clock);

  // True when the program should end now for a restart: enabled, past the
  // suppression window, memory at or over the threshold, no show running,
  // none due now and the next one (if any) more than the threshold's seconds
  // away. `host` answers for the running show and the schedules. A memory
  // query that fails ends the check: no restart.
  bool RestartIsDue(const WatchdogHostState& state, TrayHost& host) const;
  // Decides, and on a restart asks the host for the immediate shutdown
  // with kRestartReason.
  void ShutdownForRestartIfNecessary(const WatchdogHostState& state, TrayHost& host) const;

 private:
  const Settings& m_settings;
  const ProcessMemory& m_memory;
  const Clock& m_clock;
};

}  // namespace tav
