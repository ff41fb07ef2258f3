#pragma once
// One deadline on the TimerService port, for the serial transmitters'
// timeouts and pacing: Arm(now, at) calls the handler once when the tick
// reaches `at` (at the next millisecond when it has passed); arming again
// replaces the deadline. Resolution is the TimerService's millisecond.
//
// Owned by the transmitter that uses it; the TimerService must outlive it.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "ports/TimerService.h"

namespace tav {

class OneShotTimer {
 public:
  OneShotTimer(TimerService& timers, std::string name, std::function<void()> handler);

  void Arm(uint32_t nowTick, uint32_t atTick);
  void ArmIn(uint32_t milliseconds);
  void Cancel();
  bool Armed() const { return m_timer->Enabled(); }

 private:
  std::function<void()> m_handler;
  std::unique_ptr<Timer> m_timer;
};

}  // namespace tav
