#include "suite/seqlib/UniverseMap.h"

#include <algorithm>

#include "support/Error.h"

namespace tav {

UniverseMap UniverseMap::Uniform(uint32_t slotsPerUniverse, int32_t firstUniverse) {
  if (slotsPerUniverse == 0 || slotsPerUniverse > 512) {
    throw errors::InvalidProcedureCall("UniverseMap.Uniform");
  }
  UniverseMap map;
  map.m_slots = slotsPerUniverse;
  map.m_firstUniverse = firstUniverse;
  return map;
}

UniverseMap UniverseMap::FromSpans(std::vector<UniverseSpan> spans) {
  for (const auto& span : spans) {
    if (span.size == 0 || span.size > 512)
      throw errors::InvalidProcedureCall("UniverseMap.FromSpans");
  }
  UniverseMap map;
  map.m_uniform = false;
  std::stable_sort(spans.begin(), spans.end(), [](const UniverseSpan& a, const UniverseSpan& b) {
    return a.startChannel < b.startChannel;
  });
  map.m_spans = std::move(spans);
  return map;
}

std::vector<UniverseMap::Piece> UniverseMap::Split(uint32_t absoluteStart, uint32_t count) const {
  std::vector<Piece> pieces;
  uint64_t end = static_cast<uint64_t>(absoluteStart) + count;
  if (m_uniform) {
    uint64_t channel = absoluteStart;
    while (channel < end) {
      uint64_t index = channel / m_slots;
      uint64_t universeEnd = (index + 1) * m_slots;
      uint64_t pieceEnd = std::min(end, universeEnd);
      pieces.push_back(Piece{static_cast<int32_t>(m_firstUniverse + static_cast<int64_t>(index)),
                             static_cast<int32_t>(channel - index * m_slots + 1),
                             static_cast<uint32_t>(pieceEnd - channel),
                             static_cast<uint32_t>(channel - absoluteStart)});
      channel = pieceEnd;
    }
    return pieces;
  }
  for (const auto& span : m_spans) {
    uint64_t spanEnd = static_cast<uint64_t>(span.startChannel) + span.size;
    uint64_t from = std::max<uint64_t>(absoluteStart, span.startChannel);
    uint64_t to = std::min(end, spanEnd);
    if (from >= to) continue;
    pieces.push_back(Piece{span.universe, static_cast<int32_t>(from - span.startChannel + 1),
                           static_cast<uint32_t>(to - from),
                           static_cast<uint32_t>(from - absoluteStart)});
  }
  return pieces;
}

}  // namespace tav
