#include "suite/seqlib/FseqConversion.h"

#include "suite/seqlib/FseqEventStream.h"
#include "suite/seqlib/PlayEvent.h"

namespace tav {

SequenceData FseqToSequenceData(FseqFile& file, const UniverseMap& map,
                                const std::function<void()>& keepAlive) {
  SequenceData data;
  data.media = file.MediaFilename();
  data.lengthMs = static_cast<int64_t>(file.DurationMs());
  auto segments = FseqSegments(file, map);
  for (const auto& segment : segments) {
    LevelTrack track;
    track.family = kFamilyDMX;
    track.network = segment.universe;
    track.firstAddress = segment.firstSlot;
    track.count = static_cast<int32_t>(segment.count);
    track.stepMs = static_cast<int32_t>(file.StepMs());
    track.levels.reserve(static_cast<size_t>(file.FrameCount()) * segment.count);
    data.tracks.push_back(std::move(track));
  }
  for (uint32_t f = 0; f < file.FrameCount(); ++f) {
    const uint8_t* frame = file.Frame(f);
    for (size_t s = 0; s < segments.size(); ++s) {
      const uint8_t* p = frame + segments[s].storedOffset;
      data.tracks[s].levels.insert(data.tracks[s].levels.end(), p, p + segments[s].count);
    }
    if (keepAlive && f % 64 == 0) keepAlive();
  }
  return data;
}

}  // namespace tav
