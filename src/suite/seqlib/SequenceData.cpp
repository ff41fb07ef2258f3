#include "suite/seqlib/SequenceData.h"

#include <algorithm>

#include "suite/seqlib/PlayEvent.h"

namespace tav {

int64_t SequenceData::EffectiveLengthMs() const {
  if (lengthMs > 0) return lengthMs;
  int64_t end = 0;
  for (const auto& channel : channels) {
    for (const auto& effect : channel.effects) end = std::max(end, effect.atMs + effect.durationMs);
  }
  for (const auto& track : tracks) end = std::max(end, track.EndMs());
  return end;
}

int32_t EffectTypeFromName(const std::string& name) {
  if (name == "off") return kEffectOff;
  if (name == "set") return kEffectSet;
  if (name == "fade") return kEffectFade;
  if (name == "twinkle") return kEffectTwinkle;
  if (name == "shimmer") return kEffectShimmer;
  return -1;
}

std::string EffectTypeName(int32_t type) {
  switch (type) {
    case kEffectOff:
      return "off";
    case kEffectSet:
      return "set";
    case kEffectFade:
      return "fade";
    case kEffectTwinkle:
      return "twinkle";
    case kEffectShimmer:
      return "shimmer";
    default:
      return "";
  }
}

std::string FamilyName(int32_t family) {
  switch (family) {
    case kFamilyTAV:
      return "TAV";
    case kFamilyX10:
      return "X10";
    case kFamilyFennick:
      return "Fennick";
    case kFamilyDMX:
      return "DMX";
    default:
      return "family " + std::to_string(family);
  }
}

}  // namespace tav
