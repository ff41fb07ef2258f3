#pragma once
// One binding of an interactive group: a trigger and the sequence files it
// starts. Groups that play one sequence at a time walk the names round robin;
// RoundRobinIndex says which comes next and belongs to the run-time state of
// this binding, so a copy keeps its own. Owned by its group (shared pointer);
// the trigger is shared by reference and may be null until one is set.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "show/Trigger.h"

namespace tav {

class TriggeredSequences {
 public:
  // Appends a name; NumSequences grows by one.
  void AddSequence(std::string name);
  // Moves to the next name, back to 0 after the last (stays 0 without names).
  void BumpRoundRobinIndex();
  void ClearSequences();
  // Trig becomes a new trigger copied from other's; the names become a copy of
  // other's. RoundRobinIndex is deliberately kept. A null source, or a source
  // without a trigger, fails with the object-not-set error (91).
  void Copy(const std::shared_ptr<TriggeredSequences>& other);
  void Copy(const TriggeredSequences& other);

  int32_t NumSequences() const { return static_cast<int32_t>(m_sequences.size()); }
  int32_t RoundRobinIndex() const { return m_roundRobinIndex; }

  // 0-based; outside 0..NumSequences-1 fails with the subscript error (9).
  const std::string& Sequence(int32_t index) const;
  void SetSequence(int32_t index, std::string name);
  // ClearSequences, then AddSequence of each name in order.
  void SetSequences(const std::vector<std::string>& names);

  const std::shared_ptr<Trigger>& Trig() const { return m_trig; }
  void SetTrig(std::shared_ptr<Trigger> value) { m_trig = std::move(value); }

 private:
  int32_t m_roundRobinIndex = 0;
  std::vector<std::string> m_sequences;
  std::shared_ptr<Trigger> m_trig;
};

}  // namespace tav
