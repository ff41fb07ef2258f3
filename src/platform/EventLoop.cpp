#include "platform/EventLoop.h"

#include <asio.hpp>
#include <vector>

namespace tav {

struct EventLoop::Impl {
  asio::io_context context{1};  // one thread: let Asio skip its locking
  std::vector<std::unique_ptr<asio::signal_set>> signals;
};

EventLoop::EventLoop() : m_impl(std::make_unique<Impl>()) {}

EventLoop::~EventLoop() {
  // Cancel signal waits before the context goes, so their handlers are
  // destroyed while the objects they refer to still exist.
  for (auto& set : m_impl->signals) {
    asio::error_code ignored;
    set->cancel(ignored);
  }
  m_impl->signals.clear();
}

void EventLoop::Run() {
  auto guard = asio::make_work_guard(m_impl->context);
  m_impl->context.restart();
  m_impl->context.run();
}

void EventLoop::RunFor(std::chrono::milliseconds duration) {
  auto guard = asio::make_work_guard(m_impl->context);
  m_impl->context.restart();
  m_impl->context.run_for(duration);
}

void EventLoop::Stop() {
  m_impl->context.stop();
}

bool EventLoop::Stopped() const {
  return m_impl->context.stopped();
}

void EventLoop::Post(std::function<void()> work) {
  asio::post(m_impl->context, std::move(work));
}

namespace {
void WaitForSignal(asio::signal_set& set, std::shared_ptr<std::function<void(int)>> handler) {
  set.async_wait([&set, handler](const asio::error_code& error, int signalNumber) {
    if (error) return;  // cancelled: the loop is going away
    (*handler)(signalNumber);
    WaitForSignal(set, handler);
  });
}
}  // namespace

void EventLoop::OnSignal(int signalNumber, std::function<void(int)> handler) {
  auto set = std::make_unique<asio::signal_set>(m_impl->context, signalNumber);
  WaitForSignal(*set, std::make_shared<std::function<void(int)>>(std::move(handler)));
  m_impl->signals.push_back(std::move(set));
}

asio::io_context& EventLoop::Context() {
  return m_impl->context;
}

}  // namespace tav
