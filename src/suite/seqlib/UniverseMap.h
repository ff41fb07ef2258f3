#pragma once
// Where the absolute channels of an FSEQ file land: consecutive DMX
// universes of 512 slots from universe 1 unless the network preferences
// supply start channels of their own. A value type; the sequence library
// copies it into each FSEQ sequence it opens.

#include <cstdint>
#include <vector>

namespace tav {

struct UniverseSpan {
  int32_t universe = 1;
  uint32_t startChannel = 0;  // absolute, 0-based
  uint32_t size = 512;        // slots, 1-512
};

class UniverseMap {
 public:
  // Universe firstUniverse + k holds absolute channels [k * slots, (k+1) * slots).
  static UniverseMap Uniform(uint32_t slotsPerUniverse = 512, int32_t firstUniverse = 1);
  // Explicit spans, for instance from the network preferences. Channels no
  // span covers are not played. Spans may overlap (one channel feeds both).
  static UniverseMap FromSpans(std::vector<UniverseSpan> spans);

  // One contiguous part of a channel range inside one universe.
  struct Piece {
    int32_t universe;
    int32_t firstSlot;  // 1-based
    uint32_t count;
    uint32_t offset;  // from the start of the range that was split
  };
  std::vector<Piece> Split(uint32_t absoluteStart, uint32_t count) const;

 private:
  UniverseMap() = default;
  bool m_uniform = true;
  uint32_t m_slots = 512;
  int32_t m_firstUniverse = 1;
  std::vector<UniverseSpan> m_spans;
};

}  // namespace tav
