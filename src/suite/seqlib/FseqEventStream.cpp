#include "suite/seqlib/FseqEventStream.h"

#include <algorithm>

namespace tav {

std::vector<FseqEventStream::Segment> FseqSegments(const FseqFile& file, const UniverseMap& map) {
  std::vector<FseqEventStream::Segment> segments;
  uint32_t stored = 0;
  for (const auto& range : file.Ranges()) {
    for (const auto& piece : map.Split(range.start, range.count)) {
      segments.push_back({piece.universe, piece.firstSlot, piece.count, stored + piece.offset});
    }
    stored += range.count;
  }
  return segments;
}

FseqEventStream::FseqEventStream(std::unique_ptr<FseqFile> file, const UniverseMap& map)
    : m_file(std::move(file)), m_segments(FseqSegments(*m_file, map)) {}

void FseqEventStream::Seek(int64_t ms) {
  m_floor = ms;
  m_segment = 0;
  int64_t frame = ms <= 0 ? 0 : ms / m_file->StepMs();
  m_frame = static_cast<uint32_t>(std::min<int64_t>(frame, m_file->FrameCount()));
}

int64_t FseqEventStream::NextTime() {
  if (m_segments.empty() || m_frame >= m_file->FrameCount()) return kEnd;
  return std::max(static_cast<int64_t>(m_frame) * m_file->StepMs(), m_floor);
}

void FseqEventStream::Next(PlayEvent& event) {
  const Segment& segment = m_segments[m_segment];
  const uint8_t* frame = m_file->Frame(m_frame);
  event.playEventType = kPlayEventLevels;
  event.devType = kFamilyDMX;
  event.lNetwork = segment.universe;
  event.byteUnit = 0;
  event.lCircuit = 0;
  event.szChannelName.clear();
  event.effectType = 0;
  event.lDuration = 0;
  event.lStartIntensity = event.lEndIntensity = event.lPriority = 0;
  event.nIntensityBlobStartAddress = segment.firstSlot;
  event.nIntensityBlobCount = static_cast<int32_t>(segment.count);
  event.byteIntensityBlob.assign(frame + segment.storedOffset,
                                 frame + segment.storedOffset + segment.count);
  event.lDueTime = std::max(static_cast<int64_t>(m_frame) * m_file->StepMs(), m_floor);
  if (++m_segment == m_segments.size()) {
    m_segment = 0;
    ++m_frame;
  }
}

std::vector<PlayEvent> FseqEventStream::LightsOff() const {
  std::vector<PlayEvent> events;
  for (const auto& segment : m_segments) {
    PlayEvent e;
    e.playEventType = kPlayEventLevels;
    e.devType = kFamilyDMX;
    e.lNetwork = segment.universe;
    e.nIntensityBlobStartAddress = segment.firstSlot;
    e.nIntensityBlobCount = static_cast<int32_t>(segment.count);
    e.byteIntensityBlob.assign(segment.count, 0);
    events.push_back(std::move(e));
  }
  return events;
}

size_t FseqEventStream::MemoryHeld() const {
  return m_file->MemoryHeld() + m_segments.capacity() * sizeof(Segment);
}

}  // namespace tav
