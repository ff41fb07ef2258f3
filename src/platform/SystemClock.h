#pragma once
// The Clock port on the system's clocks: Now is the local wall-clock time to
// the whole second (as the platform's Now), from the system time zone with
// daylight saving applied (SecondsSinceMidnight adds the milliseconds of
// the present second); TickCount is the monotonic clock in milliseconds,
// wrapping at 2^32 like the multimedia tick count. Stateless; make one where
// the program starts and pass it by reference.

#include "ports/Clock.h"

namespace tav {

class SystemClock : public Clock {
 public:
  DateTime Now() const override;
  double SecondsSinceMidnight() const override;
  uint32_t TickCount() const override;
};

}  // namespace tav
