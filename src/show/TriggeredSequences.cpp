#include "show/TriggeredSequences.h"

#include "support/Error.h"

namespace tav {

void TriggeredSequences::AddSequence(std::string name) {
  m_sequences.push_back(std::move(name));
}

void TriggeredSequences::BumpRoundRobinIndex() {
  // The index never leaves 0..NumSequences-1 through this path, but the names
  // may have shrunk since the last bump, so the wrap test covers both ends.
  int64_t next = static_cast<int64_t>(m_roundRobinIndex) + 1;
  m_roundRobinIndex = (next >= 0 && next < NumSequences()) ? static_cast<int32_t>(next) : 0;
}

void TriggeredSequences::ClearSequences() {
  m_sequences.clear();
}

void TriggeredSequences::Copy(const std::shared_ptr<TriggeredSequences>& other) {
  if (!other) throw errors::ObjectNotSet("TriggeredSequences.Copy");
  Copy(*other);
}

void TriggeredSequences::Copy(const TriggeredSequences& other) {
  // Hold the source trigger before replacing ours: other may be this object.
  std::shared_ptr<Trigger> source = other.m_trig;
  m_trig = std::make_shared<Trigger>();
  m_trig->Copy(source);
  m_sequences = other.m_sequences;
}

const std::string& TriggeredSequences::Sequence(int32_t index) const {
  if (index < 0 || index >= NumSequences()) {
    throw errors::SubscriptOutOfRange("TriggeredSequences.Sequence");
  }
  return m_sequences[static_cast<size_t>(index)];
}

void TriggeredSequences::SetSequence(int32_t index, std::string name) {
  if (index < 0 || index >= NumSequences()) {
    throw errors::SubscriptOutOfRange("TriggeredSequences.Sequence");
  }
  m_sequences[static_cast<size_t>(index)] = std::move(name);
}

void TriggeredSequences::SetSequences(const std::vector<std::string>& names) {
  ClearSequences();
  for (const auto& name : names) AddSequence(name);
}

}  // namespace tav
