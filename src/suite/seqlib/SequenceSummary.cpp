#include "suite/seqlib/SequenceSummary.h"

#include <algorithm>
#include <tuple>

#include "suite/seqlib/PlayEvent.h"

namespace tav {

SequenceSummary Summarize(const CompiledSequence& head, const std::vector<TrackGroup>& groups) {
  SequenceSummary s;
  s.effectCount = head.effects.size();
  s.effectChannels = head.channels.size();
  s.timelineFrames = TimelineFrameCount(groups);
  s.levelBlocks = LevelBlockCount(groups);
  s.stepMs = CommonStepMs(groups);
  // Runs of addresses per (family, network, unit), merged so an address
  // that several channels or tracks use counts once.
  std::map<std::tuple<int32_t, int32_t, int32_t>, std::vector<std::pair<int64_t, int64_t>>> runs;
  for (const auto& channel : head.channels) {
    const ChannelAddress& a = channel.address;
    runs[{a.family, a.network, a.unit}].push_back({a.circuit, int64_t{a.circuit} + 1});
  }
  for (const auto& group : groups) {
    s.frameTracks += group.tracks.size();
    for (const auto& t : group.tracks) {
      runs[{t.family, t.network, t.unit}].push_back(
          {t.firstAddress, int64_t{t.firstAddress} + t.count});
    }
  }
  for (auto& [key, list] : runs) {
    auto [family, network, unit] = key;
    if (family == kFamilyDMX) s.dmxUniverses.insert(network);
    std::sort(list.begin(), list.end());
    int64_t covered = 0, end = INT64_MIN;
    for (const auto& [from, to] : list) {
      int64_t start = std::max(from, end);
      if (to > start) covered += to - start;
      end = std::max(end, to);
    }
    s.addressesPerFamily[family] += static_cast<size_t>(covered);
  }
  return s;
}

}  // namespace tav
