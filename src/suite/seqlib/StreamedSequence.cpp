#include "suite/seqlib/StreamedSequence.h"

#include <algorithm>
#include <cstring>

namespace tav {

void StreamedSequence::MovePastEmptyGroups() {
  const auto& groups = Groups();
  while (m_group < groups.size() && m_frame >= groups[m_group].frameCount) {
    ++m_group;
    m_frame = 0;
  }
}

const uint8_t* StreamedSequence::NextFrame() {
  MovePastEmptyGroups();
  if (m_group >= Groups().size()) return nullptr;
  const uint8_t* frame = ReadFrame(m_group, m_frame);
  ++m_frame;
  return frame;
}

void StreamedSequence::SkipTo(size_t group, uint32_t frame) {
  if (group < m_group || (group == m_group && frame < m_frame)) return;
  m_group = group;
  m_frame = frame;
}

CompiledStreamedSequence::CompiledStreamedSequence(std::shared_ptr<const CompiledSequence> sequence)
    : m_sequence(std::move(sequence)) {
  m_head.lengthMs = m_sequence->lengthMs;
  m_head.media = m_sequence->media;
  m_head.shellCommand = m_sequence->shellCommand;
  m_head.subsequences = m_sequence->subsequences;
  m_head.sourceHash = m_sequence->sourceHash;
  m_head.channels = m_sequence->channels;
  m_head.effects = m_sequence->effects;
  m_groups = GroupTracks(m_sequence->tracks);
  size_t first = 0;
  for (const auto& group : m_groups) {
    m_firstTrack.push_back(first);
    first += group.tracks.size();
  }
}

const uint8_t* CompiledStreamedSequence::ReadFrame(size_t group, uint32_t frame) {
  m_frame.resize(m_groups[group].FrameBytes());
  uint8_t* out = m_frame.data();
  for (size_t t = 0; t < m_groups[group].tracks.size(); ++t) {
    const LevelTrack& track = m_sequence->tracks[m_firstTrack[group] + t];
    size_t count = static_cast<size_t>(track.count);
    std::memcpy(out, track.levels.data() + frame * count, count);
    out += count;
  }
  return m_frame.data();
}

namespace {

// The head with one (empty) track per track of the groups, at the group's
// times.
CompiledSequence HeadWithTracks(const StreamedSequence& source) {
  CompiledSequence out = source.Head();
  for (const auto& group : source.Groups()) {
    for (const auto& shape : group.tracks) {
      out.tracks.push_back(shape);
      out.tracks.back().startMs = group.startMs;
      out.tracks.back().stepMs = group.stepMs;
    }
  }
  return out;
}

// Spreads a group's frame over its tracks, which start at out.tracks[first].
void Scatter(const TrackGroup& group, const uint8_t* frame, CompiledSequence& out, size_t first) {
  for (size_t t = 0; t < group.tracks.size(); ++t) {
    auto& levels = out.tracks[first + t].levels;
    size_t count = static_cast<size_t>(group.tracks[t].count);
    levels.insert(levels.end(), frame, frame + count);
    frame += count;
  }
}

std::vector<size_t> FirstTracks(const std::vector<TrackGroup>& groups) {
  std::vector<size_t> first;
  size_t next = 0;
  for (const auto& group : groups) {
    first.push_back(next);
    next += group.tracks.size();
  }
  return first;
}

}  // namespace

CompiledSequence ReadWhole(StreamedSequence& source) {
  CompiledSequence out = HeadWithTracks(source);
  const auto& groups = source.Groups();
  std::vector<size_t> first = FirstTracks(groups);
  for (size_t g = 0; g < groups.size(); ++g) {
    for (size_t t = 0; t < groups[g].tracks.size(); ++t) {
      out.tracks[first[g] + t].levels.reserve(static_cast<size_t>(groups[g].frameCount) *
                                              static_cast<size_t>(groups[g].tracks[t].count));
    }
  }
  while (const uint8_t* frame = source.NextFrame()) {
    size_t g = source.GroupIndex();
    Scatter(groups[g], frame, out, first[g]);
  }
  return out;
}

CompiledSequence FramesAt(StreamedSequence& source, int64_t ms) {
  CompiledSequence out = HeadWithTracks(source);
  const auto& groups = source.Groups();
  std::vector<size_t> first = FirstTracks(groups);
  std::vector<bool> keep(out.tracks.size(), false);
  for (size_t g = 0; g < groups.size(); ++g) {
    uint32_t frame = 0;
    if (!groups[g].FrameAt(ms, frame)) continue;
    if (g < source.GroupIndex() || (g == source.GroupIndex() && frame < source.FrameIndex())) {
      continue;  // already read past
    }
    source.SkipTo(g, frame);
    Scatter(groups[g], source.NextFrame(), out, first[g]);
    for (size_t t = 0; t < groups[g].tracks.size(); ++t) {
      out.tracks[first[g] + t].startMs =
          groups[g].startMs + static_cast<int64_t>(frame) * groups[g].stepMs;
      keep[first[g] + t] = true;
    }
  }
  std::vector<LevelTrack> kept;
  for (size_t t = 0; t < out.tracks.size(); ++t) {
    if (keep[t]) kept.push_back(std::move(out.tracks[t]));
  }
  out.tracks = std::move(kept);
  return out;
}

}  // namespace tav
