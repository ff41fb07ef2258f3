#pragma once
// The DeadlineTimer port on a Linux timerfd watched by the event loop. The
// deadline is set as an absolute CLOCK_MONOTONIC time at the start of the
// requested millisecond of SystemClock's tick (both count steady-clock
// milliseconds), so a late wake-up never moves the next deadline and
// nothing drifts. The loop thread's timer slack is set to the minimum when
// the timer is made: the default 50 microseconds would be jitter on every
// frame.
//
// Owned by the composition root; the EventLoop must outlive it.

#include <memory>

#include "platform/EventLoop.h"
#include "suite/channelio/DeadlineTimer.h"

namespace tav {

class TimerfdDeadlineTimer : public DeadlineTimer {
 public:
  explicit TimerfdDeadlineTimer(EventLoop& loop);
  ~TimerfdDeadlineTimer() override;
  TimerfdDeadlineTimer(const TimerfdDeadlineTimer&) = delete;
  TimerfdDeadlineTimer& operator=(const TimerfdDeadlineTimer&) = delete;

  void SetOnDeadline(std::function<void()> handler) override;
  void SetDeadline(uint32_t tick) override;
  void Cancel() override;

  struct Core;

 private:
  std::shared_ptr<Core> m_core;
};

}  // namespace tav
