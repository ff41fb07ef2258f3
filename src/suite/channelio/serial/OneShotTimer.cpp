#include "suite/channelio/serial/OneShotTimer.h"

namespace tav {

OneShotTimer::OneShotTimer(TimerService& timers, std::string name, std::function<void()> handler)
    : m_handler(std::move(handler)) {
  m_timer = timers.CreateTimer(std::move(name), 1, false, [this] {
    m_timer->SetEnabled(false);
    m_handler();
  });
}

void OneShotTimer::Arm(uint32_t nowTick, uint32_t atTick) {
  int32_t wait = static_cast<int32_t>(atTick - nowTick);
  ArmIn(wait < 1 ? 1u : static_cast<uint32_t>(wait));
}

void OneShotTimer::ArmIn(uint32_t milliseconds) {
  m_timer->SetEnabled(false);
  m_timer->SetInterval(milliseconds < 1 ? 1 : milliseconds);
  m_timer->SetEnabled(true);
}

void OneShotTimer::Cancel() {
  m_timer->SetEnabled(false);
}

}  // namespace tav
