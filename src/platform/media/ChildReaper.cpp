#include "platform/media/ChildReaper.h"

#include <asio.hpp>
#include <optional>
#include <thread>
#include <vector>

#include "platform/media/ChildProcess.h"

namespace tav {
namespace {

constexpr auto kReapPoll = std::chrono::milliseconds(10);

}  // namespace

struct ChildReaper::State : std::enable_shared_from_this<State> {
  struct Child {
    int64_t processId;
    bool killed;
    Clock::time_point killAt;
    OnReaped onReaped;
  };

  explicit State(asio::io_context& context) : timer(context) {}

  void Add(Child child) {
    children.push_back(std::move(child));
    Schedule();
  }

  // Looks at every child; those that ended are told about and dropped.
  void Reap() {
    auto now = Clock::now();
    std::vector<std::pair<OnReaped, std::string>> told;
    std::erase_if(children, [&](Child& child) {
      std::optional<std::string> how = TryReapChild(child.processId);
      if (!how) {
        if (!child.killed && now >= child.killAt) {
          KillChild(child.processId);
          child.killed = true;
        }
        return false;
      }
      if (child.onReaped) told.emplace_back(std::move(child.onReaped), std::move(*how));
      return true;
    });
    // Told after the list is settled: a handler may hand over another child.
    for (auto& [onReaped, how] : told) onReaped(how.empty() ? "already reaped" : how);
  }

  void Schedule() {
    Reap();
    if (children.empty() || waiting) return;
    waiting = true;
    timer.expires_after(kReapPoll);
    timer.async_wait([weak = weak_from_this()](const asio::error_code& error) {
      auto self = weak.lock();
      if (error || !self) return;
      self->waiting = false;
      self->Schedule();
    });
  }

  asio::steady_timer timer;
  std::vector<Child> children;
  bool waiting = false;
};

ChildReaper::ChildReaper(EventLoop& loop) : m_state(std::make_shared<State>(loop.Context())) {}

ChildReaper::~ChildReaper() {
  m_state->timer.cancel();
}

void ChildReaper::Kill(int64_t processId, OnReaped onReaped) {
  KillChild(processId);
  m_state->Add({processId, true, Clock::now(), std::move(onReaped)});
}

void ChildReaper::AwaitQuit(int64_t processId, Clock::time_point killAt, OnReaped onReaped) {
  m_state->Add({processId, false, killAt, std::move(onReaped)});
}

void ChildReaper::WaitForAll() {
  m_state->timer.cancel();
  m_state->waiting = false;
  for (State::Child& child : m_state->children) child.onReaped = nullptr;
  while (!m_state->children.empty()) {
    m_state->Reap();
    if (!m_state->children.empty()) std::this_thread::sleep_for(std::chrono::milliseconds(2));
  }
}

size_t ChildReaper::Pending() const {
  return m_state->children.size();
}

}  // namespace tav
