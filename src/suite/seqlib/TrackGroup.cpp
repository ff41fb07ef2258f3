#include "suite/seqlib/TrackGroup.h"

#include <algorithm>

namespace tav {

size_t TrackGroup::FrameBytes() const {
  size_t bytes = 0;
  for (const auto& track : tracks) bytes += static_cast<size_t>(track.count);
  return bytes;
}

bool TrackGroup::FrameAt(int64_t ms, uint32_t& frame) const {
  if (ms < startMs || ms >= EndMs() || stepMs <= 0) return false;
  frame = static_cast<uint32_t>((ms - startMs) / stepMs);
  return true;
}

std::vector<TrackGroup> GroupTracks(const std::vector<LevelTrack>& tracks) {
  std::vector<TrackGroup> groups;
  for (const auto& track : tracks) {
    auto frames = static_cast<uint32_t>(track.FrameCount());
    bool joins =
        !groups.empty() && !groups.back().tracks.empty() &&
        groups.back().tracks.front().family == track.family &&
        groups.back().startMs == track.startMs && groups.back().stepMs == track.stepMs &&
        groups.back().frameCount == frames &&
        groups.back().FrameBytes() + static_cast<size_t>(track.count) <= TrackGroup::kMaxFrameBytes;
    if (!joins) groups.push_back({track.startMs, track.stepMs, frames, {}});
    groups.back().tracks.push_back({track.family,
                                    track.network,
                                    track.unit,
                                    track.firstAddress,
                                    track.count,
                                    track.startMs,
                                    track.stepMs,
                                    {}});
  }
  return groups;
}

namespace {

// All groups start together and keep one step: the timeline is theirs.
bool Alike(const std::vector<TrackGroup>& groups) {
  return std::all_of(groups.begin(), groups.end(), [&](const TrackGroup& g) {
    return g.startMs == groups[0].startMs && g.stepMs == groups[0].stepMs;
  });
}

uint32_t MostFrames(const std::vector<TrackGroup>& groups) {
  uint32_t most = 0;
  for (const auto& g : groups) most = std::max(most, g.frameCount);
  return most;
}

// Every moment a frame is due, once each, in order.
std::vector<int64_t> FrameTimes(const std::vector<TrackGroup>& groups) {
  std::vector<int64_t> times;
  for (const auto& g : groups) {
    for (uint32_t k = 0; k < g.frameCount; ++k) {
      times.push_back(g.startMs + static_cast<int64_t>(k) * g.stepMs);
    }
  }
  std::sort(times.begin(), times.end());
  times.erase(std::unique(times.begin(), times.end()), times.end());
  return times;
}

}  // namespace

size_t TimelineFrameCount(const std::vector<TrackGroup>& groups) {
  if (groups.empty()) return 0;
  return Alike(groups) ? MostFrames(groups) : FrameTimes(groups).size();
}

int64_t TimelineFrameTime(const std::vector<TrackGroup>& groups, size_t index) {
  if (groups.empty()) return -1;
  if (Alike(groups)) {
    if (index >= MostFrames(groups)) return -1;
    return groups[0].startMs + static_cast<int64_t>(index) * groups[0].stepMs;
  }
  std::vector<int64_t> times = FrameTimes(groups);
  return index < times.size() ? times[index] : -1;
}

int64_t TimelineFrameAt(const std::vector<TrackGroup>& groups, int64_t ms) {
  if (groups.empty()) return -1;
  if (Alike(groups)) {
    const TrackGroup& g = groups[0];
    if (ms < g.startMs || MostFrames(groups) == 0) return -1;
    return std::min<int64_t>((ms - g.startMs) / g.stepMs, MostFrames(groups) - 1);
  }
  std::vector<int64_t> times = FrameTimes(groups);
  return static_cast<int64_t>(std::upper_bound(times.begin(), times.end(), ms) - times.begin()) - 1;
}

size_t LevelBlockCount(const std::vector<TrackGroup>& groups) {
  size_t blocks = 0;
  for (const auto& g : groups) blocks += static_cast<size_t>(g.frameCount) * g.tracks.size();
  return blocks;
}

int32_t CommonStepMs(const std::vector<TrackGroup>& groups) {
  if (groups.empty()) return 0;
  int32_t step = groups[0].stepMs;
  for (const auto& g : groups) {
    if (g.stepMs != step || step <= 0 || (g.startMs - groups[0].startMs) % step != 0) return 0;
  }
  return step;
}

}  // namespace tav
