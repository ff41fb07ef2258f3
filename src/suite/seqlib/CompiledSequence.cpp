#include "suite/seqlib/CompiledSequence.h"

#include <algorithm>
#include <map>

#include "suite/seqlib/TrackGroup.h"

namespace tav {

bool CompiledSequence::UsesFamily(int32_t family) const {
  for (const auto& channel : channels) {
    if (channel.address.family == family) return true;
  }
  for (const auto& track : tracks) {
    if (track.family == family) return true;
  }
  return false;
}

size_t CompiledSequence::TimelineFrameCount() const {
  return tav::TimelineFrameCount(GroupTracks(tracks));
}

size_t CompiledSequence::LevelBlockCount() const {
  size_t blocks = 0;
  for (const auto& track : tracks) blocks += track.FrameCount();
  return blocks;
}

namespace {

class Builder {
 public:
  explicit Builder(CompiledSequence& out) : m_out(out) {}

  uint32_t ChannelIndex(const ChannelAddress& address, const std::string& name) {
    auto key = std::make_pair(address, name);
    auto it = m_index.find(key);
    if (it != m_index.end()) return it->second;
    auto index = static_cast<uint32_t>(m_out.channels.size());
    m_out.channels.push_back({address, name});
    m_index.emplace(std::move(key), index);
    return index;
  }

 private:
  CompiledSequence& m_out;
  std::map<std::pair<ChannelAddress, std::string>, uint32_t> m_index;
};

}  // namespace

CompiledSequence Compile(const SequenceData& data, const SubsequenceLoader& loadSubsequence) {
  CompiledSequence out;
  out.media = data.media;
  out.shellCommand = data.shellCommand;
  out.subsequences = data.subsequences;
  out.lengthMs = data.EffectiveLengthMs();
  Builder builder(out);
  size_t total = 0;
  for (const auto& channel : data.channels) total += channel.effects.size();
  out.effects.reserve(total);
  for (const auto& channel : data.channels) {
    uint32_t index = builder.ChannelIndex(channel.address, channel.name);
    for (const auto& e : channel.effects) {
      out.effects.push_back(
          {e.atMs, index, e.durationMs, e.type, e.startIntensity, e.endIntensity, e.priority});
    }
  }
  out.tracks = data.tracks;
  for (const auto& ref : data.subsequences) {
    auto sub = loadSubsequence(ref);
    if (!sub) continue;
    for (const auto& e : sub->effects) {
      CompiledEffect copy = e;
      copy.atMs += ref.offsetMs;
      copy.channel =
          builder.ChannelIndex(sub->channels[e.channel].address, sub->channels[e.channel].name);
      out.effects.push_back(copy);
    }
    for (const auto& track : sub->tracks) {
      out.tracks.push_back(track);
      out.tracks.back().startMs += ref.offsetMs;
    }
    if (data.lengthMs == 0) out.lengthMs = std::max(out.lengthMs, ref.offsetMs + sub->lengthMs);
  }
  std::stable_sort(
      out.effects.begin(), out.effects.end(),
      [](const CompiledEffect& a, const CompiledEffect& b) { return a.atMs < b.atMs; });
  return out;
}

SequenceData Decompile(const CompiledSequence& compiled) {
  SequenceData data;
  data.lengthMs = compiled.lengthMs;
  data.media = compiled.media;
  data.shellCommand = compiled.shellCommand;
  data.channels.resize(compiled.channels.size());
  for (size_t i = 0; i < compiled.channels.size(); ++i) {
    data.channels[i].address = compiled.channels[i].address;
    data.channels[i].name = compiled.channels[i].name;
  }
  for (const auto& e : compiled.effects) {
    data.channels[e.channel].effects.push_back(
        {e.atMs, e.durationMs, e.type, e.startIntensity, e.endIntensity, e.priority});
  }
  data.tracks = compiled.tracks;
  return data;
}

}  // namespace tav
