#pragma once
// Port: one deadline on the Clock port's millisecond tick. The control sends
// each frame from this timer at the frame's tick, so the deadline is
// absolute: a wake-up that comes late does not push later deadlines back,
// and nothing drifts. The adapter (platform/TimerfdDeadlineTimer) wakes the
// loop on a timerfd at the start of that millisecond; the test double fires
// when a test moves its clock.
//
// Single-threaded: the handler runs on the loop, never inside SetDeadline.

#include <cstdint>
#include <functional>

namespace tav {

class DeadlineTimer {
 public:
  virtual ~DeadlineTimer() = default;
  // The handler to call when the deadline is reached.
  virtual void SetOnDeadline(std::function<void()> handler) = 0;
  // Calls the handler once when the tick reaches `tick` (soon, when it has
  // already passed). Replaces the deadline set before.
  virtual void SetDeadline(uint32_t tick) = 0;
  virtual void Cancel() = 0;
};

}  // namespace tav
