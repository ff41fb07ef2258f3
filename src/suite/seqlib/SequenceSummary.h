#pragma once
// What a sequence holds, counted from its head and the shape of its frame
// tracks without reading a frame: effects, frames of the timeline, level
// blocks, and the addresses used per device family. showctl's inspect
// prints it; it costs the same for a sequence of any length.

#include <cstddef>
#include <cstdint>
#include <map>
#include <set>
#include <vector>

#include "suite/seqlib/CompiledSequence.h"
#include "suite/seqlib/TrackGroup.h"

namespace tav {

struct SequenceSummary {
  size_t effectCount = 0;
  size_t effectChannels = 0;
  size_t frameTracks = 0;
  size_t timelineFrames = 0;
  size_t levelBlocks = 0;
  int32_t stepMs = 0;  // when every frame keeps one step, else 0
  // Distinct addresses per family: effect channels and track slots.
  std::map<int32_t, size_t> addressesPerFamily;
  std::set<int32_t> dmxUniverses;
};

SequenceSummary Summarize(const CompiledSequence& head, const std::vector<TrackGroup>& groups);

}  // namespace tav
