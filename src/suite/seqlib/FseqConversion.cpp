#include "suite/seqlib/FseqConversion.h"

#include <cstring>

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

FseqStreamedSequence::FseqStreamedSequence(std::unique_ptr<FseqFile> file, const UniverseMap& map,
                                           uint64_t sourceHash)
    : m_file(std::move(file)), m_segments(FseqSegments(*m_file, map)) {
  m_head.lengthMs = static_cast<int64_t>(m_file->DurationMs());
  m_head.media = m_file->MediaFilename();
  m_head.sourceHash = sourceHash;
  if (m_segments.empty()) return;
  TrackGroup group;
  group.stepMs = static_cast<int32_t>(m_file->StepMs());
  group.frameCount = m_file->FrameCount();
  for (const auto& segment : m_segments) {
    group.tracks.push_back({kFamilyDMX,
                            segment.universe,
                            0,
                            segment.firstSlot,
                            static_cast<int32_t>(segment.count),
                            0,
                            group.stepMs,
                            {}});
  }
  m_groups.push_back(std::move(group));
}

const uint8_t* FseqStreamedSequence::ReadFrame(size_t, uint32_t frame) {
  const uint8_t* stored = m_file->Frame(frame);
  m_frame.resize(m_groups[0].FrameBytes());
  uint8_t* out = m_frame.data();
  for (const auto& segment : m_segments) {
    std::memcpy(out, stored + segment.storedOffset, segment.count);
    out += segment.count;
  }
  return m_frame.data();
}

}  // namespace tav
