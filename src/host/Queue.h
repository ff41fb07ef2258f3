#pragma once
// A first-in first-out queue. The host keeps received tray messages in one so
// that receiving never waits for acting: the receive handler only enqueues,
// and a timer drains the queue later on the same thread.

#include <cstdint>
#include <deque>

#include "support/Error.h"

namespace tav {

template <typename T>
class Queue {
 public:
  void Enqueue(T item) { m_items.push_back(std::move(item)); }

  // The oldest item, removed from the queue. An empty queue fails with the
  // subscript error (9), as asking an empty collection for its first item does.
  T Dequeue() {
    if (m_items.empty()) throw errors::SubscriptOutOfRange("Queue.Dequeue");
    T item = std::move(m_items.front());
    m_items.pop_front();
    return item;
  }

  int32_t Count() const { return static_cast<int32_t>(m_items.size()); }

 private:
  std::deque<T> m_items;
};

}  // namespace tav
