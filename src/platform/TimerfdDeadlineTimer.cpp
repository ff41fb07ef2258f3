#include "platform/TimerfdDeadlineTimer.h"

#include <sys/prctl.h>
#include <sys/timerfd.h>
#include <unistd.h>

#include <asio.hpp>
#include <cerrno>
#include <chrono>
#include <cstring>

#include "support/Error.h"

namespace tav {

struct TimerfdDeadlineTimer::Core : std::enable_shared_from_this<Core> {
  explicit Core(asio::io_context& context) : descriptor(context) {}

  void Wait() {
    waiting = true;
    descriptor.async_wait(asio::posix::descriptor_base::wait_read,
                          [self = shared_from_this()](const asio::error_code& error) {
                            self->waiting = false;
                            if (error || self->closed) return;
                            uint64_t expirations = 0;
                            ssize_t n = ::read(self->descriptor.native_handle(), &expirations,
                                               sizeof expirations);
                            // Re-armed since it became readable: not yet due.
                            if (n == static_cast<ssize_t>(sizeof expirations)) {
                              self->armed = false;
                              if (self->handler) self->handler();
                            }
                            if (self->armed && !self->waiting && !self->closed) self->Wait();
                          });
  }

  asio::posix::stream_descriptor descriptor;
  std::function<void()> handler;
  bool waiting = false;
  bool armed = false;
  uint32_t deadline = 0;
  bool closed = false;
};

TimerfdDeadlineTimer::TimerfdDeadlineTimer(EventLoop& loop)
    : m_core(std::make_shared<Core>(loop.Context())) {
  int fd = ::timerfd_create(CLOCK_MONOTONIC, TFD_NONBLOCK | TFD_CLOEXEC);
  if (fd < 0)
    throw Error(errno, "TimerfdDeadlineTimer", std::string("timerfd: ") + std::strerror(errno));
  m_core->descriptor.assign(fd);
  ::prctl(PR_SET_TIMERSLACK, 1UL, 0UL, 0UL, 0UL);
}

TimerfdDeadlineTimer::~TimerfdDeadlineTimer() {
  m_core->closed = true;
  m_core->handler = nullptr;
  asio::error_code ignored;
  m_core->descriptor.close(ignored);
}

void TimerfdDeadlineTimer::SetOnDeadline(std::function<void()> handler) {
  m_core->handler = std::move(handler);
}

void TimerfdDeadlineTimer::SetDeadline(uint32_t tick) {
  // Set again to the same tick (each frame re-arms): nothing to change.
  if (m_core->armed && m_core->deadline == tick) return;
  m_core->deadline = tick;
  // SystemClock's tick is the steady clock in milliseconds, cut to 32 bits:
  // put the tick back on the full time line next to now.
  using namespace std::chrono;
  int64_t nowMs = duration_cast<milliseconds>(steady_clock::now().time_since_epoch()).count();
  int64_t targetMs = nowMs + static_cast<int32_t>(tick - static_cast<uint32_t>(nowMs));
  if (targetMs < 1) targetMs = 1;  // zero would disarm the timer
  itimerspec spec{};
  spec.it_value.tv_sec = static_cast<time_t>(targetMs / 1000);
  spec.it_value.tv_nsec = static_cast<long>(targetMs % 1000) * 1000000L;
  ::timerfd_settime(m_core->descriptor.native_handle(), TFD_TIMER_ABSTIME, &spec, nullptr);
  m_core->armed = true;
  if (!m_core->waiting) m_core->Wait();
}

void TimerfdDeadlineTimer::Cancel() {
  if (!m_core->armed) return;
  itimerspec spec{};
  ::timerfd_settime(m_core->descriptor.native_handle(), 0, &spec, nullptr);
  m_core->armed = false;
}

}  // namespace tav
