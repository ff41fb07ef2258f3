#pragma once
// Frame tracks that share their family and timing (start, step and frame
// count), kept together frame by frame: frame k of a group is frame k of
// each of its tracks, back to back. A sequence converted from FSEQ is one
// group of one track per universe piece. Whatever streams a sequence's
// frames (the compressed export, the plain format, conversions, checks)
// moves whole frames of a group, never a whole track, so it holds a few
// blocks of frames whatever the length of the sequence.

#include <cstddef>
#include <cstdint>
#include <vector>

#include "suite/seqlib/SequenceData.h"

namespace tav {

struct TrackGroup {
  // A frame of a group may be this large: every channel an FSEQ file can
  // hold. Larger runs of tracks are split into several groups.
  static constexpr size_t kMaxFrameBytes = size_t{1} << 24;

  int64_t startMs = 0;
  int32_t stepMs = 50;
  uint32_t frameCount = 0;
  // Addresses only (family, network, unit, firstAddress, count); their
  // levels stay empty and their times are the group's.
  std::vector<LevelTrack> tracks;

  size_t FrameBytes() const;
  int64_t EndMs() const { return startMs + static_cast<int64_t>(frameCount) * stepMs; }
  // The frame on show at `ms`, if the group has begun and not ended.
  bool FrameAt(int64_t ms, uint32_t& frame) const;
  friend bool operator==(const TrackGroup&, const TrackGroup&) = default;
};

// Consecutive tracks of one family and timing become one group, so the
// tracks read back in the order given.
std::vector<TrackGroup> GroupTracks(const std::vector<LevelTrack>& tracks);

// Frames of the timeline: the moments at which any frame is due, counted
// once however many tracks share them.
size_t TimelineFrameCount(const std::vector<TrackGroup>& groups);
// When frame `index` of the timeline is due (counting from 0), or -1 past
// the last.
int64_t TimelineFrameTime(const std::vector<TrackGroup>& groups, size_t index);
// Which frame of the timeline is on show at `ms` (the last one due by
// then), or -1 before the first.
int64_t TimelineFrameAt(const std::vector<TrackGroup>& groups, int64_t ms);
// Level blocks over all tracks: one per track and frame, as played.
size_t LevelBlockCount(const std::vector<TrackGroup>& groups);
// The one step all frames of the timeline keep (the groups share step and
// start modulo the step), or 0.
int32_t CommonStepMs(const std::vector<TrackGroup>& groups);

}  // namespace tav
