#include "ports/VirtualTimerService.h"

#include <algorithm>
#include <map>
#include <stdexcept>

namespace tav {

namespace {
class VirtualTimer;
}

struct VirtualTimerService::Core {
  uint64_t now = 0;
  uint64_t armSequence = 0;
  bool advancing = false;
  std::vector<VirtualTimer*> timers;  // live timers, in creation order
  std::map<std::string, uint64_t> ticksFired;
};

namespace {

class VirtualTimer : public Timer {
 public:
  VirtualTimer(std::shared_ptr<VirtualTimerService::Core> core, std::string name, uint32_t interval,
               bool enabled, std::function<void()> onTick)
      : m_core(std::move(core)),
        m_name(std::move(name)),
        m_interval(interval),
        m_enabled(enabled),
        m_onTick(std::make_shared<std::function<void()>>(std::move(onTick))),
        m_ticksFired(&m_core->ticksFired[m_name]) {
    m_core->timers.push_back(this);
    Arm();
  }
  ~VirtualTimer() override {
    auto& timers = m_core->timers;
    timers.erase(std::remove(timers.begin(), timers.end(), this), timers.end());
  }

  const std::string& Name() const override { return m_name; }
  uint32_t Interval() const override { return m_interval; }
  // Setting the interval always starts a fresh interval, as the platform's
  // timers do; an interval of 0 stops the ticks but keeps Enabled.
  void SetInterval(uint32_t milliseconds) override {
    m_interval = milliseconds;
    Arm();
  }
  bool Enabled() const override { return m_enabled; }
  void SetEnabled(bool enabled) override {
    if (enabled == m_enabled) return;
    m_enabled = enabled;
    Arm();
  }
  void SetOnTick(std::function<void()> onTick) override {
    m_onTick = std::make_shared<std::function<void()>>(std::move(onTick));
  }
  void SetNextTickIn(uint32_t milliseconds) override {
    if (!m_enabled) return;
    m_due = m_core->now + milliseconds;
    m_armOrder = ++m_core->armSequence;
  }

  bool Armed() const { return m_due.has_value(); }
  uint64_t Due() const { return *m_due; }
  uint64_t ArmOrder() const { return m_armOrder; }

  // Called by the service at the tick's moment: schedules the next tick first,
  // so that whatever the handler does (or throws) the timer stays consistent.
  void Fire() {
    if (m_interval > 0) {
      m_due = *m_due + m_interval;
    } else {
      m_due.reset();  // ticks only when asked again
    }
    m_armOrder = ++m_core->armSequence;
    ++*m_ticksFired;
    // Keep the handler alive even if it destroys its own timer.
    std::shared_ptr<std::function<void()>> onTick = m_onTick;
    if (*onTick) (*onTick)();
  }

 private:
  void Arm() {
    if (m_enabled && m_interval > 0) {
      m_due = m_core->now + m_interval;
      m_armOrder = ++m_core->armSequence;
    } else {
      m_due.reset();
    }
  }

  std::shared_ptr<VirtualTimerService::Core> m_core;
  std::string m_name;
  uint32_t m_interval;
  bool m_enabled;
  std::shared_ptr<std::function<void()>> m_onTick;
  std::optional<uint64_t> m_due;
  uint64_t m_armOrder = 0;
  uint64_t* m_ticksFired;  // a map node: stays valid while the core lives
};

VirtualTimer* NextDue(const VirtualTimerService::Core& core) {
  VirtualTimer* best = nullptr;
  for (VirtualTimer* timer : core.timers) {
    if (!timer->Armed()) continue;
    if (!best || timer->Due() < best->Due() ||
        (timer->Due() == best->Due() && timer->ArmOrder() < best->ArmOrder())) {
      best = timer;
    }
  }
  return best;
}

// Marks the service busy for the duration of a tick run; nested runs from a
// handler would fire ticks out of order.
class AdvancingGuard {
 public:
  explicit AdvancingGuard(VirtualTimerService::Core& core) : m_core(core) {
    if (m_core.advancing)
      throw std::logic_error("VirtualTimerService advanced from a tick handler");
    m_core.advancing = true;
  }
  ~AdvancingGuard() { m_core.advancing = false; }

 private:
  VirtualTimerService::Core& m_core;
};

}  // namespace

VirtualTimerService::VirtualTimerService() : m_core(std::make_shared<Core>()) {}
VirtualTimerService::~VirtualTimerService() = default;

std::unique_ptr<Timer> VirtualTimerService::CreateTimer(std::string name,
                                                        uint32_t intervalMilliseconds, bool enabled,
                                                        std::function<void()> onTick) {
  return std::make_unique<VirtualTimer>(m_core, std::move(name), intervalMilliseconds, enabled,
                                        std::move(onTick));
}

uint64_t VirtualTimerService::NowMs() const {
  return m_core->now;
}

void VirtualTimerService::Advance(uint64_t milliseconds) {
  AdvancingGuard guard(*m_core);
  const uint64_t target = m_core->now + milliseconds;
  while (VirtualTimer* next = NextDue(*m_core)) {
    if (next->Due() > target) break;
    m_core->now = next->Due();
    next->Fire();
  }
  m_core->now = target;
}

bool VirtualTimerService::FireNextTick() {
  AdvancingGuard guard(*m_core);
  VirtualTimer* next = NextDue(*m_core);
  if (!next) return false;
  m_core->now = next->Due();
  next->Fire();
  return true;
}

std::optional<uint64_t> VirtualTimerService::NextTickIn() const {
  VirtualTimer* next = NextDue(*m_core);
  if (!next) return std::nullopt;
  return next->Due() - m_core->now;
}

Timer* VirtualTimerService::Find(const std::string& name) const {
  for (VirtualTimer* timer : m_core->timers) {
    if (timer->Name() == name) return timer;
  }
  return nullptr;
}

std::vector<std::string> VirtualTimerService::ArmedTimerNames() const {
  std::vector<std::string> names;
  for (VirtualTimer* timer : m_core->timers) {
    if (timer->Armed()) names.push_back(timer->Name());
  }
  return names;
}

uint64_t VirtualTimerService::TicksFired(const std::string& name) const {
  auto it = m_core->ticksFired.find(name);
  return it == m_core->ticksFired.end() ? 0 : it->second;
}

std::function<uint64_t()> VirtualTimerService::TimeSource() const {
  std::shared_ptr<const Core> core = m_core;
  return [core] { return core->now; };
}

}  // namespace tav
