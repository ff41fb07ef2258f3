#pragma once
// What a media player adapter keeps of the play the engine asked for last,
// apart from its position: the play state, the generation that numbers the
// plays (each OpenMedia and Stop begins one), the error queue, and the
// PlayStateChange and MediaError events. Both media players keep one:
// MpvMediaPlayer (in the media process) and MediaProcessPlayer (in the
// player).
//
// Events are raised on the loop, never from inside a call; a handler may
// destroy the owner. A play-state change that a newer play overtook before it
// was raised is raised only if it is still true, so every change raised
// holds for the play asked for last.
//
// Owned by the adapter; the EventLoop and the MessageLog must outlive it.
// Events not yet raised when it goes are dropped.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "platform/EventLoop.h"
#include "ports/MessageLog.h"
#include "show/MediaPlayer.h"

namespace tav {

class MediaPlayState {
 public:
  // The error queue keeps the latest this many descriptions.
  static constexpr size_t kMaxQueuedErrors = 100;

  // `source` names the adapter in errors and in the log line of a handler
  // that fails.
  MediaPlayState(EventLoop& loop, MessageLog& log, std::string source);
  ~MediaPlayState();
  MediaPlayState(const MediaPlayState&) = delete;
  MediaPlayState& operator=(const MediaPlayState&) = delete;

  // Begins the next play; returns its generation.
  uint64_t BeginPlay();
  uint64_t Generation() const;

  int32_t State() const;
  // Raises PlayStateChange when the state changes.
  void SetState(int32_t newState);

  // Raises MediaError with the state as it was when the error happened
  // (stopped, as a rule): the state is set first, and its change raised
  // after the error.
  void RaiseError(int32_t stateWithIt);
  // The play cannot go on: queues the description and raises MediaError
  // with the state stopped.
  void Fail(const std::string& description);

  void QueueError(std::string description);
  int32_t ErrorCount() const;
  // 0-based; fails with the subscript error (9) outside the queue.
  std::string ErrorDescription(int32_t index) const;
  void ClearErrorQueue();

  void SetOnPlayStateChange(std::function<void(int32_t newState)> handler);
  void SetOnMediaError(std::function<void()> handler);
  // Drops both handlers: nothing more is raised.
  void Silence();

 private:
  struct Shared;
  void RaiseState(int32_t newState);

  std::shared_ptr<Shared> m_shared;
};

}  // namespace tav
