#pragma once
// A sequence compiled for play: its subsequences merged in at their
// offsets, every effect an entry of one time-ordered list that refers to a
// table of channels, and the frame tracks at absolute times. This is what
// the compressed export stores and what plays from memory. Immutable once
// built; shared by every player of the sequence.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "suite/seqlib/SequenceData.h"

namespace tav {

struct CompiledChannel {
  ChannelAddress address;
  std::string name;

  friend bool operator==(const CompiledChannel&, const CompiledChannel&) = default;
};

struct CompiledEffect {
  int64_t atMs = 0;
  uint32_t channel = 0;  // index into CompiledSequence::channels
  int32_t durationMs = 0;
  int32_t type = 0;
  int32_t startIntensity = 0;
  int32_t endIntensity = 0;
  int32_t priority = 0;

  friend bool operator==(const CompiledEffect&, const CompiledEffect&) = default;
};

struct CompiledSequence {
  int64_t lengthMs = 0;
  std::string media;
  std::string shellCommand;
  // The files merged in: for a compiled plain sequence and its export every
  // included file as the library found it (nested ones too, at their offset
  // in this sequence), kept so a stale export can be recognised; as the
  // authored data names them when compiled from data alone.
  std::vector<SubsequenceRef> subsequences;
  uint64_t sourceHash = 0;
  std::vector<CompiledChannel> channels;
  std::vector<CompiledEffect> effects;  // in play order
  std::vector<LevelTrack> tracks;

  bool UsesFamily(int32_t family) const;
  // Frames of the timeline: moments at which a frame is due, counted once
  // however many tracks share them.
  size_t TimelineFrameCount() const;
  // Level blocks as played: one per track and frame.
  size_t LevelBlockCount() const;
  friend bool operator==(const CompiledSequence&, const CompiledSequence&) = default;
};

// Supplies a subsequence, itself compiled; throws tav::Error when it
// cannot.
using SubsequenceLoader =
    std::function<std::shared_ptr<const CompiledSequence>(const SubsequenceRef&)>;

// Merges the subsequences in (channels with the same address and name
// become one) and orders the effects by time, keeping the written order of
// effects due at the same time.
CompiledSequence Compile(const SequenceData& data, const SubsequenceLoader& loadSubsequence);

// Back to the authored form, one channel per channel-table entry. The
// subsequences are already merged in, so the result names none.
SequenceData Decompile(const CompiledSequence& compiled);

}  // namespace tav
