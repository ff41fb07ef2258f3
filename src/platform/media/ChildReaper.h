#pragma once
// Reaps child processes that are on their way out, without waiting: each
// is looked at on a short timer until it has ended, so that none is left a
// zombie. One that was asked to quit and has not ended by its deadline is
// killed. Whoever hands a child over may be told how it ended.
//
// Owned by the object that started the children; the EventLoop must
// outlive it. Used on the loop's thread only. Pending timers hold only a
// weak reference, so destroying the reaper while one is under way is safe.

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "platform/EventLoop.h"

namespace tav {

class ChildReaper {
 public:
  using Clock = std::chrono::steady_clock;
  // Told how the child ended ("exited with status 1", "killed by signal 9
  // (Killed)"), or "already reaped".
  using OnReaped = std::function<void(const std::string& how)>;

  explicit ChildReaper(EventLoop& loop);
  ~ChildReaper();
  ChildReaper(const ChildReaper&) = delete;
  ChildReaper& operator=(const ChildReaper&) = delete;

  // Kills `processId` now and reaps it.
  void Kill(int64_t processId, OnReaped onReaped = {});
  // Reaps `processId` once it ends, killing it if it still runs at `killAt`.
  void AwaitQuit(int64_t processId, Clock::time_point killAt, OnReaped onReaped = {});
  // Blocks until every child handed over has been reaped (killed at its
  // deadline), telling nobody: for shutting down only.
  void WaitForAll();

  size_t Pending() const;

 private:
  struct State;
  std::shared_ptr<State> m_state;
};

}  // namespace tav
