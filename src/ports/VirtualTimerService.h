#pragma once
// The TimerService port on virtual time, for tests and for simulations that
// run the player through hours of shows in seconds. Nothing sleeps; Advance
// moves the virtual clock forward and fires every tick that falls due on the
// way, one at a time and in time order (ticks due at the same moment fire in
// the order their timers were armed; SetNextTickIn counts as arming). A tick
// handler may enable, disable, re-time or destroy any timer, its own
// included; the change counts from the tick's moment.
//
// A failure thrown by a tick handler leaves Advance at that tick's moment and
// reaches the caller, so tests and simulations see it; the timer that threw
// keeps ticking on the next Advance. Timers may outlive the service and vice
// versa.

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "ports/TimerService.h"

namespace tav {

class VirtualTimerService : public TimerService {
 public:
  VirtualTimerService();
  ~VirtualTimerService() override;

  std::unique_ptr<Timer> CreateTimer(std::string name, uint32_t intervalMilliseconds, bool enabled,
                                     std::function<void()> onTick) override;

  // Virtual milliseconds since the service was made.
  uint64_t NowMs() const;
  // Fires every tick due within the next `milliseconds`, then stands at the
  // end of that span. Must not be called from a tick handler.
  void Advance(uint64_t milliseconds);
  // Jumps to the next due tick and fires it. False (and no time passes) when
  // no timer is armed.
  bool FireNextTick();
  // Milliseconds from now to the next due tick, if any timer is armed.
  std::optional<uint64_t> NextTickIn() const;

  // The live timer with this name (the first made, if several share it).
  Timer* Find(const std::string& name) const;
  // Names of the timers that are enabled with a non-zero interval.
  std::vector<std::string> ArmedTimerNames() const;
  // Ticks fired so far, per timer name summed over all its timers.
  uint64_t TicksFired(const std::string& name) const;

  // A reader of the virtual time that stays valid after the service is gone
  // (it then reports the last time reached). ManualClock follows it.
  std::function<uint64_t()> TimeSource() const;

  struct Core;

 private:
  std::shared_ptr<Core> m_core;
};

}  // namespace tav
