#include "suite/channelio/testing/ManualDeadlineTimer.h"

#include "suite/channelio/Ticks.h"

namespace tav {

int ManualDeadlineTimer::RunUntil(uint32_t tick) {
  int fired = 0;
  while (m_deadline && !TickBefore(tick, *m_deadline)) {
    // A deadline already behind the clock fires at the clock's tick.
    if (TickBefore(m_clock.TickCount(), *m_deadline)) m_clock.SetTickCount(*m_deadline);
    m_deadline.reset();
    ++fired;
    if (m_handler) m_handler();
  }
  if (TickBefore(m_clock.TickCount(), tick)) m_clock.SetTickCount(tick);
  return fired;
}

}  // namespace tav
