#pragma once
// Renders effect commands (event kind 1) into the level buffers, one frame
// at a time. Each channel runs at most one effect: a new command replaces
// whatever ran on the channel, and a level block that writes the channel
// ends its effect, so the later event always wins. The command's priority
// is not used for arbitration (see docs/outputs.md).
//
//   off      level 0 at once
//   set      the start intensity at once, held until the next event
//   fade     from the start to the end intensity over the duration, then
//            held at the end intensity
//   twinkle  a random level between the two intensities, changing after a
//            random 80-400 ms, for the duration (0: until replaced); the
//            channel is off afterwards
//   shimmer  the two intensities alternating every 40 ms, for the duration
//            (0: until replaced); the channel is off afterwards
//
// Intensities are percent (0-100) and become levels 0-255 rounded to the
// nearest. Twinkle is pseudo-random but reproducible: the same commands at
// the same ticks give the same levels. Owned by the control.

#include <compare>
#include <cstdint>
#include <map>

#include "suite/channelio/LevelBuffers.h"

namespace tav {

// One channel of any family, as the events address it: TAV (network, unit,
// circuit), X10 (house, 0, unit), Fennick (network, 0, channel), DMX
// (universe, 0, slot).
struct ChannelKey {
  int32_t family = 0;
  int32_t network = 0;
  int32_t unit = 0;
  int32_t circuit = 0;
  friend auto operator<=>(const ChannelKey&, const ChannelKey&) = default;
};

struct EffectCommand {
  ChannelKey channel;
  int32_t effectType = 0;
  int32_t durationMs = 0;
  int32_t startPercent = 0;
  int32_t endPercent = 0;
};

// Percent (clamped to 0-100) to a level 0-255.
uint8_t PercentToLevel(int32_t percent);

class EffectEngine {
 public:
  static constexpr int32_t kShimmerStepMs = 40;
  static constexpr int32_t kTwinkleMinMs = 80;
  static constexpr int32_t kTwinkleMaxMs = 400;

  // Starts the command on its channel at `startTick`, replacing what ran.
  // Unknown effect types and families are ignored.
  void Start(const EffectCommand& command, uint32_t startTick);
  // A level block wrote circuits first..first+count-1 of (family, network,
  // unit): the effects running there end.
  void Cancel(int32_t family, int32_t network, int32_t unit, int32_t first, int32_t count);
  // Writes each running effect's level at `tick`; effects that are over
  // write their last level and end.
  void Render(uint32_t tick, LevelBuffers& levels);
  // Whether some effect still changes over time (and so needs frames).
  bool Active() const { return !m_running.empty(); }
  size_t RunningCount() const { return m_running.size(); }
  void Clear() { m_running.clear(); }

 private:
  struct Running {
    EffectCommand command;
    uint32_t startTick = 0;
    uint32_t random = 0;      // twinkle's generator state
    uint32_t nextChange = 0;  // twinkle: when the level changes next
    uint8_t level = 0;        // twinkle: the level held until then
  };
  static void WriteLevel(const ChannelKey& channel, uint8_t level, LevelBuffers& levels);
  // The level at `tick`; false when the effect is over after writing it.
  static bool LevelAt(Running& effect, uint32_t tick, uint8_t& level);

  std::map<ChannelKey, Running> m_running;
};

}  // namespace tav
