#pragma once
// The TimerService on the event loop: each enabled timer waits on an Asio
// steady timer for its next deadline, so the loop sleeps until the nearest
// deadline and never polls. Deadlines follow each other by the interval; a
// tick delivered late (the loop was busy) is delivered once, and the next
// deadline then counts from that moment instead of queueing the missed ones.
// Setting the interval, or enabling a disabled timer, starts a fresh interval.
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
#include "platform/TimerService.h"

namespace tav {

class AsioTimerService : public TimerService {
 public:
  using FailureReporter =
      std::function<void(const std::string& timerName, const std::string& what)>;

  explicit AsioTimerService(EventLoop& loop);

  std::unique_ptr<Timer> CreateTimer(std::string name, uint32_t intervalMilliseconds, bool enabled,
                                     std::function<void()> onTick) override;

  void SetFailureReporter(FailureReporter reporter);

 private:
  EventLoop& m_loop;
  std::shared_ptr<FailureReporter> m_reporter;
};

}  // namespace tav
