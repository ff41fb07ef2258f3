#include "ports/ManualClock.h"

namespace tav {

ManualClock::ManualClock(DateTime now, uint32_t tickCount)
    : m_dateBase(now), m_tickBase(tickCount) {}

uint64_t ManualClock::ElapsedMs() const {
  uint64_t followed = m_followed ? m_followed() - m_followedAtStart : 0;
  return m_manualMs + followed;
}

DateTime ManualClock::Now() const {
  uint64_t ms = ElapsedMs() - m_dateBaseElapsed;
  return m_dateBase.AddSeconds(static_cast<int64_t>(ms / 1000));
}

double ManualClock::SecondsSinceMidnight() const {
  uint64_t ms = ElapsedMs() - m_dateBaseElapsed;
  return Now().SecondOfDay() + static_cast<double>(ms % 1000) / 1000.0;
}

uint32_t ManualClock::TickCount() const {
  return static_cast<uint32_t>(m_tickBase + (ElapsedMs() - m_tickBaseElapsed));
}

void ManualClock::SetNow(DateTime now) {
  m_dateBase = now;
  m_dateBaseElapsed = ElapsedMs();
}

void ManualClock::SetTickCount(uint32_t tickCount) {
  m_tickBase = tickCount;
  m_tickBaseElapsed = ElapsedMs();
}

void ManualClock::AdvanceMilliseconds(uint64_t milliseconds) {
  m_manualMs += milliseconds;
}

void ManualClock::Follow(const VirtualTimerService& timers) {
  // Fold what the previous source contributed into the manual share so that
  // switching sources makes no jump.
  m_manualMs = ElapsedMs();
  m_followed = timers.TimeSource();
  m_followedAtStart = m_followed();
}

}  // namespace tav
