#pragma once
// Port: the two clocks of the program. Wall-clock time (local, for schedules
// and log lines) and a monotonic millisecond tick (for pacing and
// durations) are kept apart on purpose: the wall clock may jump, the tick
// never does.

#include <cstdint>

#include "support/DateTime.h"

namespace tav {

class Clock {
 public:
  virtual ~Clock() = default;
  // Local wall-clock date and time.
  virtual DateTime Now() const = 0;
  // Seconds since local midnight, with the fraction of the present second
  // (0 to just under 86400): the clock the show engine times its pauses
  // between musical pieces by. The default has whole seconds only.
  virtual double SecondsSinceMidnight() const { return Now().SecondOfDay(); }
  // Milliseconds since an arbitrary start, wrapping at 2^32 like the
  // platform's multimedia tick count.
  virtual uint32_t TickCount() const = 0;
};

}  // namespace tav
