#pragma once
// Test double for the DeadlineTimer port on a ManualClock: nothing sleeps.
// RunUntil moves the clock from deadline to deadline up to a tick, firing
// each on the way with the clock standing at its tick, as the loop would.

#include <cstdint>
#include <functional>
#include <optional>

#include "ports/testing/ManualClock.h"
#include "suite/channelio/DeadlineTimer.h"

namespace tav {

class ManualDeadlineTimer : public DeadlineTimer {
 public:
  explicit ManualDeadlineTimer(ManualClock& clock) : m_clock(clock) {}

  void SetOnDeadline(std::function<void()> handler) override { m_handler = std::move(handler); }
  void SetDeadline(uint32_t tick) override { m_deadline = tick; }
  void Cancel() override { m_deadline.reset(); }

  std::optional<uint32_t> Deadline() const { return m_deadline; }
  // Fires every deadline up to `tick` (the clock stands at each), then
  // leaves the clock at `tick`. Returns how many fired.
  int RunUntil(uint32_t tick);
  // The same for a span of milliseconds from the clock's tick.
  int RunFor(uint32_t milliseconds) { return RunUntil(m_clock.TickCount() + milliseconds); }

 private:
  ManualClock& m_clock;
  std::function<void()> m_handler;
  std::optional<uint32_t> m_deadline;
};

}  // namespace tav
