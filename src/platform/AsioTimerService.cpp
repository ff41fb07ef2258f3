#include "platform/AsioTimerService.h"

#include <asio.hpp>
#include <cstdio>
#include <exception>
#include <optional>
#include <vector>

#include "support/Error.h"

namespace tav {

namespace {

using SteadyClock = std::chrono::steady_clock;

struct TimerState;

// One Asio timer for the whole service, set to the earliest deadline of all
// its timers: however many timers fall due together, the loop wakes once and
// re-arms once.
struct ServiceCore : std::enable_shared_from_this<ServiceCore> {
  ServiceCore(asio::io_context& context,
              std::shared_ptr<AsioTimerService::FailureReporter> reporter)
      : wake(context), reporter(std::move(reporter)) {}

  void Rearm();
  void RunDue();
  void Report(const std::string& name, const std::string& what) const;

  asio::steady_timer wake;
  std::optional<SteadyClock::time_point> armedFor;
  std::vector<TimerState*> timers;  // live timers, in creation order
  uint64_t armSequence = 0;
  bool running = false;  // inside RunDue: re-arm once at its end
  std::shared_ptr<AsioTimerService::FailureReporter> reporter;
};

struct TimerState {
  std::string name;
  uint32_t interval = 0;
  bool enabled = false;
  std::shared_ptr<std::function<void()>> onTick;
  std::optional<SteadyClock::time_point> deadline;
  uint64_t armOrder = 0;  // ties between equal deadlines go by arming order
};

void ServiceCore::Report(const std::string& name, const std::string& what) const {
  if (reporter && *reporter) {
    (*reporter)(name, what);
  } else {
    std::fprintf(stderr, "timer %s: uncaught failure in tick: %s\n", name.c_str(), what.c_str());
  }
}

void ServiceCore::Rearm() {
  if (running) return;
  std::optional<SteadyClock::time_point> earliest;
  for (const TimerState* timer : timers) {
    if (timer->deadline && (!earliest || *timer->deadline < *earliest)) earliest = timer->deadline;
  }
  if (earliest == armedFor) return;
  armedFor = earliest;
  if (!earliest) {
    wake.cancel();
    return;
  }
  wake.expires_at(*earliest);  // cancels the wait for the previous deadline
  std::weak_ptr<ServiceCore> weak = shared_from_this();
  wake.async_wait([weak](const asio::error_code& error) {
    if (error) return;  // superseded by a new deadline, or shut down
    if (auto core = weak.lock()) core->RunDue();
  });
}

void ServiceCore::RunDue() {
  // Keep the core alive even if a handler destroys the service.
  std::shared_ptr<ServiceCore> self = shared_from_this();
  armedFor.reset();
  running = true;
  const auto now = SteadyClock::now();
  while (true) {
    // Picked afresh each time: a handler may create, change or destroy timers.
    TimerState* next = nullptr;
    for (TimerState* timer : timers) {
      if (!timer->deadline || *timer->deadline > now) continue;
      if (!next || *timer->deadline < *next->deadline ||
          (*timer->deadline == *next->deadline && timer->armOrder < next->armOrder)) {
        next = timer;
      }
    }
    if (!next) break;
    // The next deadline follows by the interval; one that would already be
    // past (the loop was busy) counts from now instead, so missed ticks are
    // not queued up.
    const auto interval = std::chrono::milliseconds(next->interval);
    if (next->interval == 0) {
      next->deadline.reset();  // ticks only when asked again
    } else {
      *next->deadline += interval;
      if (*next->deadline <= now) next->deadline = now + interval;
    }
    next->armOrder = ++armSequence;
    std::string name = next->name;
    std::shared_ptr<std::function<void()>> onTick = next->onTick;
    // `next` may be gone once the handler has run.
    if (!*onTick) continue;
    try {
      (*onTick)();
    } catch (const Error& e) {
      Report(name, e.Description());
    } catch (const std::exception& e) {
      Report(name, e.what());
    } catch (...) {
      Report(name, "unknown failure");
    }
  }
  running = false;
  Rearm();
}

class AsioTimer : public Timer {
 public:
  AsioTimer(std::shared_ptr<ServiceCore> core, std::string name, uint32_t interval, bool enabled,
            std::function<void()> onTick)
      : m_core(std::move(core)) {
    m_state.name = std::move(name);
    m_state.interval = interval;
    m_state.enabled = enabled;
    m_state.onTick = std::make_shared<std::function<void()>>(std::move(onTick));
    m_core->timers.push_back(&m_state);
    Restart();
  }
  ~AsioTimer() override {
    std::erase(m_core->timers, &m_state);
    m_core->Rearm();
  }

  const std::string& Name() const override { return m_state.name; }
  uint32_t Interval() const override { return m_state.interval; }
  void SetInterval(uint32_t milliseconds) override {
    m_state.interval = milliseconds;
    Restart();
  }
  bool Enabled() const override { return m_state.enabled; }
  void SetEnabled(bool enabled) override {
    if (enabled == m_state.enabled) return;
    m_state.enabled = enabled;
    Restart();
  }
  void SetOnTick(std::function<void()> onTick) override {
    m_state.onTick = std::make_shared<std::function<void()>>(std::move(onTick));
  }
  void SetNextTickIn(uint32_t milliseconds) override {
    if (!m_state.enabled) return;
    // A deadline of now, set from a handler, is later than the moment the
    // running batch of due ticks was taken, so it fires on the next turn of
    // the loop rather than inside this one.
    m_state.deadline = SteadyClock::now() + std::chrono::milliseconds(milliseconds);
    m_state.armOrder = ++m_core->armSequence;
    m_core->Rearm();
  }

 private:
  void Restart() {
    if (m_state.enabled && m_state.interval > 0) {
      m_state.deadline = SteadyClock::now() + std::chrono::milliseconds(m_state.interval);
      m_state.armOrder = ++m_core->armSequence;
    } else {
      m_state.deadline.reset();
    }
    m_core->Rearm();
  }

  std::shared_ptr<ServiceCore> m_core;
  TimerState m_state;
};

}  // namespace

struct AsioTimerService::Core : ServiceCore {
  using ServiceCore::ServiceCore;
};

AsioTimerService::AsioTimerService(EventLoop& loop)
    : m_reporter(std::make_shared<FailureReporter>()),
      m_core(std::make_shared<Core>(loop.Context(), m_reporter)) {}

AsioTimerService::~AsioTimerService() = default;

std::unique_ptr<Timer> AsioTimerService::CreateTimer(std::string name,
                                                     uint32_t intervalMilliseconds, bool enabled,
                                                     std::function<void()> onTick) {
  return std::make_unique<AsioTimer>(m_core, std::move(name), intervalMilliseconds, enabled,
                                     std::move(onTick));
}

void AsioTimerService::SetFailureReporter(FailureReporter reporter) {
  *m_reporter = std::move(reporter);
}

}  // namespace tav
