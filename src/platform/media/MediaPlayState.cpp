#include "platform/media/MediaPlayState.h"

#include <deque>
#include <exception>

#include "support/Error.h"

namespace tav {

// Shared with the events on their way, which hold it weakly: an event that
// finds it gone is dropped, one being raised keeps it alive to the end.
struct MediaPlayState::Shared {
  Shared(EventLoop& loop, MessageLog& log, std::string source)
      : loop(loop), log(log), source(std::move(source)) {}

  template <typename Call>
  void Raise(const std::shared_ptr<Shared>& self, Call call) {
    loop.Post([weak = std::weak_ptr<Shared>(self), call = std::move(call)] {
      auto shared = weak.lock();
      if (!shared) return;
      try {
        call(*shared);
      } catch (const std::exception& e) {
        shared->log.LogMessage(3, shared->source + " event handler Error: " + e.what());
      }
    });
  }

  EventLoop& loop;
  MessageLog& log;
  std::string source;
  uint64_t generation = 0;
  int32_t state = kMediaStopped;
  std::deque<std::string> errors;
  std::function<void(int32_t)> onPlayStateChange;
  std::function<void()> onMediaError;
};

MediaPlayState::MediaPlayState(EventLoop& loop, MessageLog& log, std::string source)
    : m_shared(std::make_shared<Shared>(loop, log, std::move(source))) {}

MediaPlayState::~MediaPlayState() = default;

uint64_t MediaPlayState::BeginPlay() {
  return ++m_shared->generation;
}

uint64_t MediaPlayState::Generation() const {
  return m_shared->generation;
}

int32_t MediaPlayState::State() const {
  return m_shared->state;
}

void MediaPlayState::SetState(int32_t newState) {
  if (newState == m_shared->state) return;
  m_shared->state = newState;
  RaiseState(newState);
}

void MediaPlayState::RaiseState(int32_t newState) {
  m_shared->Raise(m_shared, [newState, forGeneration = m_shared->generation](Shared& shared) {
    // Overtaken by OpenMedia or Stop: said only when still true.
    if (shared.generation != forGeneration && shared.state != newState) return;
    // A copy: the handler may replace itself.
    if (auto handler = shared.onPlayStateChange) handler(newState);
  });
}

void MediaPlayState::RaiseError(int32_t stateWithIt) {
  int32_t before = m_shared->state;
  m_shared->state = stateWithIt;
  m_shared->Raise(m_shared, [](Shared& shared) {
    // A copy: the handler may replace itself.
    if (auto handler = shared.onMediaError) handler();
  });
  if (stateWithIt != before) RaiseState(stateWithIt);
}

void MediaPlayState::Fail(const std::string& description) {
  QueueError(description);
  RaiseError(kMediaStopped);
}

void MediaPlayState::QueueError(std::string description) {
  m_shared->errors.push_back(std::move(description));
  while (m_shared->errors.size() > kMaxQueuedErrors) m_shared->errors.pop_front();
}

int32_t MediaPlayState::ErrorCount() const {
  return static_cast<int32_t>(m_shared->errors.size());
}

std::string MediaPlayState::ErrorDescription(int32_t index) const {
  if (index < 0 || index >= ErrorCount()) {
    throw errors::SubscriptOutOfRange(m_shared->source + ".ErrorDescription");
  }
  return m_shared->errors[static_cast<size_t>(index)];
}

void MediaPlayState::ClearErrorQueue() {
  m_shared->errors.clear();
}

void MediaPlayState::SetOnPlayStateChange(std::function<void(int32_t)> handler) {
  m_shared->onPlayStateChange = std::move(handler);
}

void MediaPlayState::SetOnMediaError(std::function<void()> handler) {
  m_shared->onMediaError = std::move(handler);
}

void MediaPlayState::Silence() {
  m_shared->onPlayStateChange = nullptr;
  m_shared->onMediaError = nullptr;
}

}  // namespace tav
