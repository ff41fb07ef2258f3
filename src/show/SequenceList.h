#pragma once
// An ordered list of the sequences of a show, keyed by the sequence object
// itself: the engine's section lists, the play queue and the playing list.
// Positions count from 1, as the engine's indexes do. A sequence can be in a
// list once: adding it again fails with the key error (457), as the
// platform's keyed collection does, so a double start shows up instead of
// playing one object twice.

#include <cstdint>
#include <memory>
#include <vector>

#include "sequence/SequencePlayInfo.h"

namespace tav {

using SequenceRef = std::shared_ptr<SequencePlayInfo>;

class SequenceList {
 public:
  int32_t Count() const { return static_cast<int32_t>(m_items.size()); }
  bool Empty() const { return m_items.empty(); }
  // 1..Count; outside fails with the subscript error (9).
  const SequenceRef& Item(int32_t index) const;
  // Appends; a sequence already held fails with error 457.
  void Add(SequenceRef item);
  // 1..Count; outside fails with the subscript error (9).
  void Remove(int32_t index);
  // Removes by key; false when the sequence is not held.
  bool Remove(const SequencePlayInfo* item);
  bool Contains(const SequencePlayInfo* item) const;

  std::vector<SequenceRef>::const_iterator begin() const { return m_items.begin(); }
  std::vector<SequenceRef>::const_iterator end() const { return m_items.end(); }

 private:
  std::vector<SequenceRef> m_items;
};

}  // namespace tav
