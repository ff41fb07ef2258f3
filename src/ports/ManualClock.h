#pragma once
// The Clock port on virtual time, for tests and simulations: a clock that
// moves only when told. Set the date-time and the tick directly, advance
// both by milliseconds, or let the clock follow a VirtualTimerService so that
// tick handlers see the time of their tick:
//
//   VirtualTimerService timers;
//   ManualClock clock(DateTime::FromParts(2024, 12, 24, 17, 59, 58));
//   clock.Follow(timers);
//   timers.Advance(2000);  // clock.Now() is now 18:00:00
//
// The date-time moves in whole seconds (like the platform's Now); the tick in
// milliseconds, wrapping at 2^32. SetNow and SetTickCount re-base one without
// disturbing the other.

#include <cstdint>
#include <functional>

#include "ports/Clock.h"
#include "ports/VirtualTimerService.h"

namespace tav {

class ManualClock : public Clock {
 public:
  explicit ManualClock(DateTime now = DateTime::FromParts(2024, 1, 1), uint32_t tickCount = 0);

  DateTime Now() const override;
  double SecondsSinceMidnight() const override;
  uint32_t TickCount() const override;

  void SetNow(DateTime now);
  void SetTickCount(uint32_t tickCount);
  void AdvanceMilliseconds(uint64_t milliseconds);
  // From here on, the time the service advances moves this clock too.
  void Follow(const VirtualTimerService& timers);

 private:
  uint64_t ElapsedMs() const;

  DateTime m_dateBase;
  uint64_t m_dateBaseElapsed = 0;  // ElapsedMs() when m_dateBase was set
  uint32_t m_tickBase;
  uint64_t m_tickBaseElapsed = 0;
  uint64_t m_manualMs = 0;
  std::function<uint64_t()> m_followed;
  uint64_t m_followedAtStart = 0;
};

}  // namespace tav
