#pragma once
// The light event a playing sequence yields, field for field what the show
// engine hands to the hardware-I/O control. An event is either an effect
// command for one channel (kind 1) or a block of levels for consecutive
// addresses (kind 2, whose device type tells DMX slots of a universe from
// circuits of a TAV unit). Each event carries the time it is due, both on
// the sequence's own timeline and as a tick of the Clock port, so the I/O
// control can hold an event that arrives a little early and send it on its
// exact deadline.

#include <cstdint>
#include <string>
#include <vector>

namespace tav {

// playEventType values.
constexpr int32_t kPlayEventEffect = 1;
constexpr int32_t kPlayEventLevels = 2;

// Device families (devType). For a block of levels only DMX and TAV occur.
constexpr int32_t kFamilyTAV = 1;
constexpr int32_t kFamilyX10 = 3;
constexpr int32_t kFamilyFennick = 4;
constexpr int32_t kFamilyDMX = 7;

// effectType values of an effect command. Intensities are percent (0-100);
// twinkle and shimmer vary between the start and end intensity.
constexpr int32_t kEffectOff = 0;
constexpr int32_t kEffectSet = 1;
constexpr int32_t kEffectFade = 2;
constexpr int32_t kEffectTwinkle = 3;
constexpr int32_t kEffectShimmer = 4;

struct PlayEvent {
  int32_t playEventType = 0;
  int32_t devType = 0;
  // TAV: network. X10: house code 1-16 (A-P). Fennick: network. DMX: universe.
  int32_t lNetwork = 0;
  // TAV: unit. Unused by the other families.
  uint8_t byteUnit = 0;
  // TAV: circuit. X10: unit 1-16. Fennick: channel. DMX: slot (1-512).
  int32_t lCircuit = 0;
  std::string szChannelName;
  int32_t effectType = 0;
  int32_t lDuration = 0;  // milliseconds
  int32_t lStartIntensity = 0;
  int32_t lEndIntensity = 0;
  int32_t lPriority = 0;
  // Level blocks: first slot or circuit (1-based) and the levels (0-255).
  int32_t nIntensityBlobStartAddress = 0;
  int32_t nIntensityBlobCount = 0;
  std::vector<uint8_t> byteIntensityBlob;

  // Milliseconds after the start of the sequence's timeline.
  int64_t lDueTime = 0;
  // The Clock port's TickCount() at which the event is due.
  uint32_t dueTick = 0;
};

}  // namespace tav
