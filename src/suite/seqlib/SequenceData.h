#pragma once
// A sequence as authored: channels of every family with their timed
// effects, tracks of frame data for consecutive DMX slots or TAV circuits,
// a media file, a shell command and the subsequences it includes at a time
// offset. Plain values; the plain format reads and writes exactly this, and
// compiling turns it into events in play order.

#include <cstdint>
#include <string>
#include <vector>

namespace tav {

// TAV: network, unit, circuit. X10: network is the house code (1-16 for
// A-P), circuit the unit (1-16). Fennick: network and circuit (its channel).
// DMX: network is the universe, circuit the slot (1-512).
struct ChannelAddress {
  int32_t family = 0;
  int32_t network = 0;
  int32_t unit = 0;
  int32_t circuit = 0;

  friend bool operator==(const ChannelAddress&, const ChannelAddress&) = default;
  friend auto operator<=>(const ChannelAddress&, const ChannelAddress&) = default;
};

struct Effect {
  int64_t atMs = 0;
  int32_t durationMs = 0;
  int32_t type = 0;  // kEffect* of PlayEvent.h
  int32_t startIntensity = 0;
  int32_t endIntensity = 0;
  int32_t priority = 0;

  friend bool operator==(const Effect&, const Effect&) = default;
};

struct SequenceChannel {
  std::string name;
  ChannelAddress address;
  std::vector<Effect> effects;

  friend bool operator==(const SequenceChannel&, const SequenceChannel&) = default;
};

// Frames of levels (0-255) for `count` consecutive addresses from
// firstAddress: DMX slots of universe `network`, or circuits of TAV unit
// `unit` on `network`. Frame k is due at startMs + k * stepMs.
struct LevelTrack {
  int32_t family = 0;  // kFamilyDMX or kFamilyTAV
  int32_t network = 0;
  int32_t unit = 0;
  int32_t firstAddress = 1;
  int32_t count = 0;
  int64_t startMs = 0;
  int32_t stepMs = 50;
  std::vector<uint8_t> levels;  // frame after frame, `count` bytes each

  size_t FrameCount() const { return count > 0 ? levels.size() / static_cast<size_t>(count) : 0; }
  int64_t EndMs() const { return startMs + static_cast<int64_t>(FrameCount()) * stepMs; }
  friend bool operator==(const LevelTrack&, const LevelTrack&) = default;
};

struct SubsequenceRef {
  std::string file;
  int64_t offsetMs = 0;

  friend bool operator==(const SubsequenceRef&, const SubsequenceRef&) = default;
};

struct SequenceData {
  // 0 means "until the last effect or frame ends".
  int64_t lengthMs = 0;
  std::string media;
  std::string shellCommand;
  std::vector<SequenceChannel> channels;
  std::vector<LevelTrack> tracks;
  std::vector<SubsequenceRef> subsequences;

  // The stated length, or the end of the last effect or frame.
  int64_t EffectiveLengthMs() const;
  friend bool operator==(const SequenceData&, const SequenceData&) = default;
};

// "set", "fade", "twinkle", "shimmer", "off"; -1 / "" for anything else.
int32_t EffectTypeFromName(const std::string& name);
std::string EffectTypeName(int32_t type);
// "TAV", "X10", "Fennick", "DMX".
std::string FamilyName(int32_t family);

}  // namespace tav
