#pragma once
// The program's one event loop: every timer tick, socket read, media event and
// signal is delivered here, on the thread that calls Run, one at a time. It
// wraps an Asio io_context; adapters in platform/ that need the context reach
// it through Context() and include Asio themselves, so this header stays free
// of Asio and core code never sees it.
//
// Owned by the program's entry point; it must outlive every timer, socket and
// signal hook made on it.

#include <chrono>
#include <functional>
#include <memory>

namespace asio {
class io_context;
}

namespace tav {

class EventLoop {
 public:
  EventLoop();
  ~EventLoop();
  EventLoop(const EventLoop&) = delete;
  EventLoop& operator=(const EventLoop&) = delete;

  // Delivers events until Stop is called, even while nothing is pending.
  void Run();
  // Delivers events for about the given time, then returns (tests, benches).
  void RunFor(std::chrono::milliseconds duration);
  // Makes Run return after the handler in progress. Safe from any thread.
  void Stop();
  bool Stopped() const;
  // Runs `work` on the loop's thread soon. Safe from any thread (libmpv's
  // wakeup callback uses it).
  void Post(std::function<void()> work);
  // Calls `handler` on the loop's thread each time the signal arrives, for as
  // long as the loop lives. The signal's default action is replaced.
  void OnSignal(int signalNumber, std::function<void(int)> handler);

  asio::io_context& Context();

 private:
  struct Impl;
  std::unique_ptr<Impl> m_impl;
};

}  // namespace tav
