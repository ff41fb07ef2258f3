#include "suite/seqlib/CompiledEventStream.h"

#include <algorithm>
#include <set>
#include <tuple>

namespace tav {

CompiledEventStream::CompiledEventStream(std::shared_ptr<const CompiledSequence> sequence)
    : m_sequence(std::move(sequence)), m_nextFrame(m_sequence->tracks.size(), 0) {}

void CompiledEventStream::Seek(int64_t ms) {
  const auto& effects = m_sequence->effects;
  m_floor = ms;
  m_nextEffect = static_cast<size_t>(
      std::lower_bound(effects.begin(), effects.end(), ms,
                       [](const CompiledEffect& e, int64_t t) { return e.atMs < t; }) -
      effects.begin());
  // Each channel's latest effect before the seek tells its state there.
  m_resumed.clear();
  m_nextResumed = 0;
  if (m_nextEffect > 0) {
    std::vector<int64_t> latest(m_sequence->channels.size(), -1);
    for (size_t i = 0; i < m_nextEffect; ++i) latest[effects[i].channel] = static_cast<int64_t>(i);
    for (int64_t index : latest) {
      if (index < 0) continue;
      CompiledEffect e = effects[static_cast<size_t>(index)];
      int64_t end = e.atMs + e.durationMs;
      if (end > ms) {
        // Under way: the rest of it, a fade starting where it stands.
        if (e.type == kEffectFade && e.durationMs > 0) {
          e.startIntensity += static_cast<int32_t>((e.endIntensity - e.startIntensity) *
                                                   (ms - e.atMs) / e.durationMs);
        }
        e.durationMs = static_cast<int32_t>(end - ms);
      } else if (e.type == kEffectSet || e.type == kEffectFade) {
        // Finished: the level it left behind.
        e = {e.atMs, e.channel, 0, kEffectSet, e.endIntensity, e.endIntensity, e.priority};
      } else if (e.type != kEffectOff) {
        continue;  // a finished twinkle or shimmer leaves nothing to restore
      }
      m_resumed.push_back(e);
    }
  }
  for (size_t t = 0; t < m_sequence->tracks.size(); ++t) {
    const LevelTrack& track = m_sequence->tracks[t];
    // The frame on show at `ms` is due at once.
    int64_t k = ms <= track.startMs ? 0 : (ms - track.startMs) / track.stepMs;
    m_nextFrame[t] =
        static_cast<size_t>(std::min<int64_t>(k, static_cast<int64_t>(track.FrameCount())));
  }
}

int CompiledEventStream::NextTrack() const {
  int best = -1;
  int64_t bestTime = kEnd;
  for (size_t t = 0; t < m_nextFrame.size(); ++t) {
    const LevelTrack& track = m_sequence->tracks[t];
    if (m_nextFrame[t] >= track.FrameCount()) continue;
    int64_t time = track.startMs + static_cast<int64_t>(m_nextFrame[t]) * track.stepMs;
    if (time < bestTime) {
      bestTime = time;
      best = static_cast<int>(t);
    }
  }
  return best;
}

int64_t CompiledEventStream::NextTime() {
  if (m_nextResumed < m_resumed.size()) return m_floor;
  int64_t time = kEnd;
  if (m_nextEffect < m_sequence->effects.size()) time = m_sequence->effects[m_nextEffect].atMs;
  int t = NextTrack();
  if (t >= 0) {
    const LevelTrack& track = m_sequence->tracks[static_cast<size_t>(t)];
    time =
        std::min(time, track.startMs + static_cast<int64_t>(m_nextFrame[static_cast<size_t>(t)]) *
                                           track.stepMs);
  }
  return time == kEnd ? kEnd : std::max(time, m_floor);
}

void CompiledEventStream::FillEffect(const CompiledEffect& e, PlayEvent& event) const {
  const CompiledChannel& channel = m_sequence->channels[e.channel];
  event.playEventType = kPlayEventEffect;
  event.devType = channel.address.family;
  event.lNetwork = channel.address.network;
  event.byteUnit = static_cast<uint8_t>(channel.address.unit);
  event.lCircuit = channel.address.circuit;
  event.szChannelName = channel.name;
  event.effectType = e.type;
  event.lDuration = e.durationMs;
  event.lStartIntensity = e.startIntensity;
  event.lEndIntensity = e.endIntensity;
  event.lPriority = e.priority;
  event.nIntensityBlobStartAddress = 0;
  event.nIntensityBlobCount = 0;
  event.byteIntensityBlob.clear();
  event.lDueTime = std::max(e.atMs, m_floor);
}

void CompiledEventStream::Next(PlayEvent& event) {
  if (m_nextResumed < m_resumed.size()) {
    FillEffect(m_resumed[m_nextResumed++], event);
    return;
  }
  int t = NextTrack();
  int64_t trackTime = kEnd;
  if (t >= 0) {
    const LevelTrack& track = m_sequence->tracks[static_cast<size_t>(t)];
    trackTime =
        track.startMs + static_cast<int64_t>(m_nextFrame[static_cast<size_t>(t)]) * track.stepMs;
  }
  // Effects go before frames due at the same time.
  if (m_nextEffect < m_sequence->effects.size() &&
      m_sequence->effects[m_nextEffect].atMs <= trackTime) {
    FillEffect(m_sequence->effects[m_nextEffect++], event);
    return;
  }
  const LevelTrack& track = m_sequence->tracks[static_cast<size_t>(t)];
  size_t frame = m_nextFrame[static_cast<size_t>(t)]++;
  event = PlayEvent{};
  event.playEventType = kPlayEventLevels;
  event.devType = track.family;
  event.lNetwork = track.network;
  event.byteUnit = static_cast<uint8_t>(track.unit);
  event.nIntensityBlobStartAddress = track.firstAddress;
  event.nIntensityBlobCount = track.count;
  const uint8_t* levels = track.levels.data() + frame * static_cast<size_t>(track.count);
  event.byteIntensityBlob.assign(levels, levels + track.count);
  event.lDueTime = std::max(trackTime, m_floor);
}

std::vector<PlayEvent> CompiledEventStream::LightsOff() const {
  std::vector<PlayEvent> events;
  std::set<ChannelAddress> seen;
  for (const auto& channel : m_sequence->channels) {
    if (!seen.insert(channel.address).second) continue;
    PlayEvent e;
    e.playEventType = kPlayEventEffect;
    e.devType = channel.address.family;
    e.lNetwork = channel.address.network;
    e.byteUnit = static_cast<uint8_t>(channel.address.unit);
    e.lCircuit = channel.address.circuit;
    e.szChannelName = channel.name;
    e.effectType = kEffectOff;
    events.push_back(std::move(e));
  }
  std::set<std::tuple<int32_t, int32_t, int32_t, int32_t, int32_t>> blocks;
  for (const auto& track : m_sequence->tracks) {
    auto key =
        std::make_tuple(track.family, track.network, track.unit, track.firstAddress, track.count);
    if (!blocks.insert(key).second) continue;
    PlayEvent e;
    e.playEventType = kPlayEventLevels;
    e.devType = track.family;
    e.lNetwork = track.network;
    e.byteUnit = static_cast<uint8_t>(track.unit);
    e.nIntensityBlobStartAddress = track.firstAddress;
    e.nIntensityBlobCount = track.count;
    e.byteIntensityBlob.assign(static_cast<size_t>(track.count), 0);
    events.push_back(std::move(e));
  }
  return events;
}

size_t CompiledEventStream::MemoryHeld() const {
  return m_resumed.capacity() * sizeof(CompiledEffect) + m_nextFrame.capacity() * sizeof(size_t);
}

}  // namespace tav
