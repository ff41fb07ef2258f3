#include "platform/AsioTimerService.h"

#include <asio.hpp>
#include <cstdio>
#include <exception>

#include "support/Error.h"

namespace tav {

namespace {

using SteadyClock = std::chrono::steady_clock;

struct TimerState {
  TimerState(asio::io_context& context, std::string name, uint32_t interval, bool enabled,
             std::function<void()> onTick,
             std::shared_ptr<AsioTimerService::FailureReporter> reporter)
      : timer(context),
        name(std::move(name)),
        interval(interval),
        enabled(enabled),
        onTick(std::make_shared<std::function<void()>>(std::move(onTick))),
        reporter(std::move(reporter)) {}

  asio::steady_timer timer;
  std::string name;
  uint32_t interval;
  bool enabled;
  std::shared_ptr<std::function<void()>> onTick;
  std::shared_ptr<AsioTimerService::FailureReporter> reporter;
  SteadyClock::time_point deadline;
  // Bumped whenever the schedule changes, so a wait that completes after a
  // change (or that cancellation could not stop in time) is recognised as
  // stale and ignored.
  uint64_t generation = 0;
};

void Wait(const std::shared_ptr<TimerState>& state);

void ReportFailure(TimerState& state, const std::string& what) {
  if (state.reporter && *state.reporter) {
    (*state.reporter)(state.name, what);
  } else {
    std::fprintf(stderr, "timer %s: uncaught failure in tick: %s\n", state.name.c_str(),
                 what.c_str());
  }
}

void OnDeadline(const std::weak_ptr<TimerState>& weak, uint64_t generation,
                const asio::error_code& error) {
  std::shared_ptr<TimerState> state = weak.lock();
  if (!state || error || state->generation != generation) return;

  // Schedule the next tick before running this one: whatever the handler
  // changes then simply supersedes it.
  const auto now = SteadyClock::now();
  const auto interval = std::chrono::milliseconds(state->interval);
  state->deadline += interval;
  if (state->deadline <= now) state->deadline = now + interval;
  Wait(state);

  std::shared_ptr<std::function<void()>> onTick = state->onTick;
  if (!*onTick) return;
  try {
    (*onTick)();
  } catch (const Error& e) {
    ReportFailure(*state, e.Description());
  } catch (const std::exception& e) {
    ReportFailure(*state, e.what());
  } catch (...) {
    ReportFailure(*state, "unknown failure");
  }
}

void Wait(const std::shared_ptr<TimerState>& state) {
  state->timer.expires_at(state->deadline);
  std::weak_ptr<TimerState> weak = state;
  uint64_t generation = state->generation;
  state->timer.async_wait(
      [weak, generation](const asio::error_code& error) { OnDeadline(weak, generation, error); });
}

class AsioTimer : public Timer {
 public:
  explicit AsioTimer(std::shared_ptr<TimerState> state) : m_state(std::move(state)) { Restart(); }
  ~AsioTimer() override { m_state->timer.cancel(); }

  const std::string& Name() const override { return m_state->name; }
  uint32_t Interval() const override { return m_state->interval; }
  void SetInterval(uint32_t milliseconds) override {
    m_state->interval = milliseconds;
    Restart();
  }
  bool Enabled() const override { return m_state->enabled; }
  void SetEnabled(bool enabled) override {
    if (enabled == m_state->enabled) return;
    m_state->enabled = enabled;
    Restart();
  }
  void SetOnTick(std::function<void()> onTick) override {
    m_state->onTick = std::make_shared<std::function<void()>>(std::move(onTick));
  }

 private:
  void Restart() {
    ++m_state->generation;
    m_state->timer.cancel();
    if (!m_state->enabled || m_state->interval == 0) return;
    m_state->deadline = SteadyClock::now() + std::chrono::milliseconds(m_state->interval);
    Wait(m_state);
  }

  std::shared_ptr<TimerState> m_state;
};

}  // namespace

AsioTimerService::AsioTimerService(EventLoop& loop)
    : m_loop(loop), m_reporter(std::make_shared<FailureReporter>()) {}

std::unique_ptr<Timer> AsioTimerService::CreateTimer(std::string name,
                                                     uint32_t intervalMilliseconds, bool enabled,
                                                     std::function<void()> onTick) {
  auto state = std::make_shared<TimerState>(m_loop.Context(), std::move(name), intervalMilliseconds,
                                            enabled, std::move(onTick), m_reporter);
  return std::make_unique<AsioTimer>(std::move(state));
}

void AsioTimerService::SetFailureReporter(FailureReporter reporter) {
  *m_reporter = std::move(reporter);
}

}  // namespace tav
