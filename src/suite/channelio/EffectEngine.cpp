#include "suite/channelio/EffectEngine.h"

#include <algorithm>

#include "suite/channelio/Ticks.h"
#include "suite/seqlib/PlayEvent.h"

namespace tav {

namespace {

uint32_t NextRandom(uint32_t& state) {
  // xorshift32: small, fast and reproducible; the quality is plenty for
  // twinkling lights.
  state ^= state << 13;
  state ^= state >> 17;
  state ^= state << 5;
  return state;
}

uint32_t Seed(const ChannelKey& channel, uint32_t tick) {
  uint32_t seed = 2166136261u;
  for (uint32_t part :
       {static_cast<uint32_t>(channel.family), static_cast<uint32_t>(channel.network),
        static_cast<uint32_t>(channel.unit), static_cast<uint32_t>(channel.circuit), tick}) {
    seed = (seed ^ part) * 16777619u;
  }
  return seed ? seed : 1;
}

bool KnownFamily(int32_t family) {
  return family == kFamilyTAV || family == kFamilyX10 || family == kFamilyFennick ||
         family == kFamilyDMX;
}

}  // namespace

uint8_t PercentToLevel(int32_t percent) {
  percent = std::clamp(percent, 0, 100);
  return static_cast<uint8_t>((percent * 255 + 50) / 100);
}

void EffectEngine::Start(const EffectCommand& command, uint32_t startTick) {
  if (command.effectType < kEffectOff || command.effectType > kEffectShimmer ||
      !KnownFamily(command.channel.family)) {
    return;
  }
  Running effect;
  effect.command = command;
  effect.command.durationMs = std::max(command.durationMs, 0);
  effect.startTick = startTick;
  effect.random = Seed(command.channel, startTick);
  effect.nextChange = startTick;
  m_running[command.channel] = effect;
}

void EffectEngine::Cancel(int32_t family, int32_t network, int32_t unit, int32_t first,
                          int32_t count) {
  if (m_running.empty() || count <= 0) return;
  auto begin = m_running.lower_bound({family, network, unit, first});
  auto end = m_running.lower_bound({family, network, unit, first + count});
  m_running.erase(begin, end);
}

bool EffectEngine::LevelAt(Running& effect, uint32_t tick, uint8_t& level) {
  const EffectCommand& c = effect.command;
  int32_t elapsed = std::max(TickDistance(effect.startTick, tick), 0);
  bool over = c.durationMs > 0 && elapsed >= c.durationMs;
  uint8_t from = PercentToLevel(c.startPercent);
  uint8_t to = PercentToLevel(c.endPercent);
  switch (c.effectType) {
    case kEffectOff:
      level = 0;
      return false;
    case kEffectSet:
      level = from;
      return false;
    case kEffectFade:
      if (c.durationMs == 0 || over) {
        level = to;
        return false;
      }
      level = static_cast<uint8_t>(
          (from * (c.durationMs - elapsed) + to * elapsed + c.durationMs / 2) / c.durationMs);
      return true;
    case kEffectShimmer:
      if (over) {
        level = 0;
        return false;
      }
      level = (elapsed / kShimmerStepMs) % 2 ? to : from;
      return true;
    case kEffectTwinkle: {
      if (over) {
        level = 0;
        return false;
      }
      uint8_t low = std::min(from, to);
      uint8_t high = std::max(from, to);
      // After a long stall, pick up from now rather than replay every change.
      if (TickDistance(effect.nextChange, tick) > 10 * kTwinkleMaxMs) effect.nextChange = tick;
      while (TickDistance(effect.nextChange, tick) >= 0) {
        effect.level = static_cast<uint8_t>(low + NextRandom(effect.random) % (high - low + 1u));
        effect.nextChange +=
            kTwinkleMinMs + NextRandom(effect.random) % (kTwinkleMaxMs - kTwinkleMinMs + 1u);
      }
      level = effect.level;
      return true;
    }
  }
  level = 0;
  return false;
}

void EffectEngine::WriteLevel(const ChannelKey& channel, uint8_t level, LevelBuffers& levels) {
  switch (channel.family) {
    case kFamilyDMX:
      levels.SetDMX(channel.network, channel.circuit, level);
      break;
    case kFamilyTAV:
      levels.SetTAV(channel.network, channel.unit, channel.circuit, level);
      break;
    case kFamilyX10:
      levels.SetX10(channel.network, channel.circuit, level);
      break;
    case kFamilyFennick:
      levels.SetFennick(channel.network, channel.circuit, level);
      break;
  }
}

void EffectEngine::Render(uint32_t tick, LevelBuffers& levels) {
  for (auto it = m_running.begin(); it != m_running.end();) {
    uint8_t level = 0;
    bool goesOn = LevelAt(it->second, tick, level);
    WriteLevel(it->first, level, levels);
    it = goesOn ? std::next(it) : m_running.erase(it);
  }
}

}  // namespace tav
