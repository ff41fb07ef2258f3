#include "host/MemoryWatchdog.h"

#include "support/Error.h"

namespace tav {

MemoryWatchdog::MemoryWatchdog(const Settings& settings, const ProcessMemory& memory,
                               const Clock& clock)
    : m_settings(settings), m_memory(memory), m_clock(clock) {}

bool MemoryWatchdog::RestartIsDue(const WatchdogHostState& state, TrayHost& host) const {
  if (state.gracefulShutdownPending || state.shutdownRequested) return false;
  if (!m_settings.MonitorRestart()) return false;
  const DateTime now = m_clock.Now();
  // Just started: give the schedules a chance, unless a show has already
  // been loaded.
  if (!state.showLoadedSinceStart &&
      now < state.startTime.AddSeconds(m_settings.MonitorRestartSuppressSeconds())) {
    return false;
  }
  try {
    if (m_memory.PrivateBytes() < m_settings.MonitorRestartBytesThreshold()) return false;
  } catch (const Error&) {
    return false;
  }
  if (host.RunningShowEvent()) return false;
  std::shared_ptr<MonitoredShowEvent> scheduled = host.CurrentShowEvent(now);
  if (scheduled && !scheduled->Filename().empty()) return false;

  std::shared_ptr<MonitoredShowEvent> next = host.NextShowEvent(scheduled, now);
  if (!next || next->Filename().empty()) return true;
  if (!next->Range()->HasStart()) return false;
  // A show exactly the threshold away (60 s by default) does not allow it.
  return next->Range()->StartTime().SecondsSince(now) > m_settings.MonitorRestartSecondsThreshold();
}

void MemoryWatchdog::ShutdownForRestartIfNecessary(const WatchdogHostState& state,
                                                   TrayHost& host) const {
  if (RestartIsDue(state, host)) host.ImmediateShutdown(kRestartReason);
}

}  // namespace tav
