#include "show/DecachePass.h"

#include <algorithm>

namespace tav {

DecachePass::DecachePass(const Settings& settings, std::shared_ptr<const ProcessMemory> memory)
    : m_settings(settings), m_memory(std::move(memory)) {}

int DecachePass::Run(const std::function<std::vector<DecacheCandidate>()>& collect,
                     MessageLog& log) {
  if (!m_memory || !m_settings.MonitorDecache()) return 0;
  const int32_t high = m_settings.MonitorDecacheHigh();
  const int32_t low = m_settings.MonitorDecacheLow();
  int32_t memory = m_memory->PrivateBytes();
  if (memory < high) return 0;
  // Only matters when the low mark is set above the high one.
  if (memory < low) return 0;

  std::vector<DecacheCandidate> candidates = collect();
  std::stable_sort(candidates.begin(), candidates.end(),
                   [](const DecacheCandidate& a, const DecacheCandidate& b) {
                     if (a.rank != b.rank) return a.rank < b.rank;
                     return a.sequence->LoadMemoryFootprint() > b.sequence->LoadMemoryFootprint();
                   });
  int released = 0;
  for (const DecacheCandidate& candidate : candidates) {
    log.LogMessage(1, "Decaching", candidate.sequence.get());
    candidate.sequence->Decache();
    ++released;
    if (m_memory->PrivateBytes() < low) break;
  }
  return released;
}

}  // namespace tav
