#pragma once
// Test double for the ProcessMemory port: reports whatever the test set.
// Values queued with QueueValues are returned one per query, in order, before
// the set value is reported again; that lets a test make memory fall while a
// decache pass releases sequences; a queued failure fails that one query.
// Fail makes every query fail until Set.

#include <cstdint>
#include <deque>
#include <optional>
#include <vector>

#include "ports/ProcessMemory.h"

namespace tav {

class FixedProcessMemory : public ProcessMemory {
 public:
  explicit FixedProcessMemory(int32_t bytes = 0) : m_bytes(bytes) {}

  int32_t PrivateBytes() const override {
    ++m_queries;
    if (m_failure) throw ProcessMemoryError(*m_failure);
    if (!m_queued.empty()) {
      std::optional<int32_t> next = m_queued.front();
      m_queued.pop_front();
      if (!next) throw ProcessMemoryError(5);
      return *next;
    }
    return m_bytes;
  }

  void Set(int32_t bytes) {
    m_bytes = bytes;
    m_failure.reset();
  }
  void QueueValues(const std::vector<int32_t>& values) {
    m_queued.insert(m_queued.end(), values.begin(), values.end());
  }
  // The next query in the queue fails (with the access-denied code 5).
  void QueueFailure() { m_queued.push_back(std::nullopt); }
  void Fail(int32_t systemErrorCode) { m_failure = systemErrorCode; }
  int QueryCount() const { return m_queries; }

 private:
  int32_t m_bytes;
  std::optional<int32_t> m_failure;
  mutable std::deque<std::optional<int32_t>> m_queued;
  mutable int m_queries = 0;
};

}  // namespace tav
