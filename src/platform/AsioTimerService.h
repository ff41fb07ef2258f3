#pragma once
// The TimerService on the event loop. The service keeps its timers'
// deadlines and sets one Asio steady timer to the earliest, so the loop
// sleeps until the next deadline and never polls, and timers falling due
// together cost one wakeup. Due ticks fire in deadline order, ties in the
// order their timers were armed (as on virtual time). Deadlines follow each
// other by the interval; a tick delivered late (the loop was busy) is
// delivered once, and the next deadline then counts from that moment instead
// of queueing the missed ones. Setting the interval, or enabling a disabled
// timer, starts a fresh interval.
//
// Tick handlers are expected to catch their own failures. One that escapes
// is handed to the failure reporter (standard error by default) so that the
// loop and the other timers go on; the timer keeps ticking.
//
// Owned by the entry point beside the EventLoop, which must outlive it and
// every timer it makes. Timers may outlive the service itself.

#include <functional>
#include <memory>
#include <string>

#include "platform/EventLoop.h"
#include "ports/TimerService.h"

namespace tav {

class AsioTimerService : public TimerService {
 public:
  using FailureReporter =
      std::function<void(const std::string& timerName, const std::string& what)>;

  explicit AsioTimerService(EventLoop& loop);
  ~AsioTimerService() override;

  std::unique_ptr<Timer> CreateTimer(std::string name, uint32_t intervalMilliseconds, bool enabled,
                                     std::function<void()> onTick) override;

  void SetFailureReporter(FailureReporter reporter);

 private:
  struct Core;
  std::shared_ptr<FailureReporter> m_reporter;
  std::shared_ptr<Core> m_core;
};

}  // namespace tav
