#pragma once
// Port: timers that behave like the platform's message-loop timers. All ticks
// run on the program's one thread, one at a time. A timer ticks every
// Interval() milliseconds while Enabled(); an interval of 0 never ticks.
// Enabling a timer, or changing its interval, starts a fresh interval.
// A tick that falls due while the program is busy is delivered once, late;
// missed ticks are not queued up. A tick handler may disable its own timer,
// change its interval, or enable other timers. Destroying a Timer cancels it.
//
// A timer can also be told when its next tick comes (SetNextTickIn): that is
// how a caller sleeps until the next moment it has work, instead of polling
// at a short interval, and how it is woken at once when something happens.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace tav {

class Timer {
 public:
  virtual ~Timer() = default;
  virtual const std::string& Name() const = 0;
  virtual uint32_t Interval() const = 0;
  virtual void SetInterval(uint32_t milliseconds) = 0;
  virtual bool Enabled() const = 0;
  virtual void SetEnabled(bool enabled) = 0;
  virtual void SetOnTick(std::function<void()> onTick) = 0;
  // Moves the next tick to `milliseconds` from now; 0 means as soon as the
  // program is free (after the handler that is running, if any). Later ticks
  // follow by the interval as usual; a timer whose interval is 0 ticks only
  // when asked this way, once per request. Ignored while disabled.
  virtual void SetNextTickIn(uint32_t milliseconds) = 0;
};

class TimerService {
 public:
  virtual ~TimerService() = default;
  virtual std::unique_ptr<Timer> CreateTimer(std::string name, uint32_t intervalMilliseconds,
                                             bool enabled, std::function<void()> onTick) = 0;
};

}  // namespace tav
