#include "suite/channelio/DMXListener.h"

#include <algorithm>
#include <cstring>

#include "suite/channelio/ArtNetPacket.h"
#include "suite/channelio/E131Packet.h"
#include "suite/channelio/Ticks.h"

namespace tav {

DMXListener::DMXListener(const Settings& settings)
    : m_settings(settings), m_edges(settings.firstSlot, settings.slotCount, settings.threshold) {
  m_sources.reserve(kMaxSources);
}

void DMXListener::Receive(const ReceivedDatagram& datagram, uint32_t tick,
                          std::vector<int32_t>& pressed) {
  if (datagram.truncated) {
    ++m_counters.malformed;
    return;
  }
  ExpireSilent(tick);
  if (m_settings.protocol == DMXProtocol::kE131) {
    ReceiveE131(datagram, tick, pressed);
  } else {
    ReceiveArtNet(datagram, tick, pressed);
  }
}

void DMXListener::ReceiveE131(const ReceivedDatagram& datagram, uint32_t tick,
                              std::vector<int32_t>& pressed) {
  E131DataView packet;
  switch (ParseE131(datagram.data, datagram.size, packet)) {
    case E131Parse::kMalformed:
      ++m_counters.malformed;
      return;
    case E131Parse::kOther:
      ++m_counters.ignored;
      return;
    case E131Parse::kData:
      break;
  }
  if (packet.universe != m_settings.universe || packet.cid == m_settings.ownCid ||
      (packet.options & kE131OptionPreview) || packet.priority > kE131MaxPriority) {
    ++m_counters.ignored;
    return;
  }
  bool terminated = packet.options & kE131OptionTerminated;
  Source* source = Find(packet.cid, {});
  if (source && !InOrder(*source, packet.sequence)) {
    ++m_counters.outOfOrder;
    return;
  }
  if (terminated) {
    if (source) {
      ++m_counters.terminated;
      Remove(source);
      Merge(pressed);
    } else {
      ++m_counters.ignored;
    }
    return;
  }
  if (packet.startCode != 0) {
    ++m_counters.ignored;
    return;
  }
  if (!source) source = Add(packet.cid, {}, packet.sequence);
  if (!source) return;
  source->priority = packet.priority;
  source->lastSeen = tick;
  source->levels.fill(0);
  std::memcpy(source->levels.data(), packet.slots, packet.slotCount);
  ++m_counters.accepted;
  Merge(pressed);
}

void DMXListener::ReceiveArtNet(const ReceivedDatagram& datagram, uint32_t tick,
                                std::vector<int32_t>& pressed) {
  ArtDmxView packet;
  switch (ParseArtNet(datagram.data, datagram.size, packet)) {
    case ArtNetParse::kMalformed:
      ++m_counters.malformed;
      return;
    case ArtNetParse::kOther:
      ++m_counters.ignored;
      return;
    case ArtNetParse::kDmx:
      break;
  }
  if (packet.portAddress != m_settings.universe) {
    ++m_counters.ignored;
    return;
  }
  // Art-Net tells sources apart by address and physical port.
  IPv4Endpoint key = datagram.source;
  key.port = packet.physical;
  Source* source = Find({}, key);
  if (source && packet.sequence != 0 && source->sequence != 0 &&
      !InOrder(*source, packet.sequence)) {
    ++m_counters.outOfOrder;
    return;
  }
  if (!source) source = Add({}, key, packet.sequence);
  if (!source) return;
  source->sequence = packet.sequence;
  source->priority = 100;
  source->lastSeen = tick;
  source->levels.fill(0);
  std::memcpy(source->levels.data(), packet.data, packet.length);
  ++m_counters.accepted;
  Merge(pressed);
}

bool DMXListener::InOrder(Source& source, uint8_t sequence) {
  int difference = static_cast<int8_t>(static_cast<uint8_t>(sequence - source.sequence));
  if (difference <= 0 && difference > -kSequenceWindow) return false;
  source.sequence = sequence;
  return true;
}

void DMXListener::ExpireSilent(uint32_t tick) {
  size_t before = m_sources.size();
  std::erase_if(m_sources, [&](const Source& s) {
    return TickDistance(s.lastSeen, tick) > static_cast<int32_t>(kDataLossMs);
  });
  if (m_sources.size() == before) return;
  m_counters.lost += before - m_sources.size();
  std::vector<int32_t> ignored;
  Merge(ignored);  // levels only fall: nothing can press
}

DMXListener::Source* DMXListener::Find(const Cid& cid, const IPv4Endpoint& address) {
  for (Source& s : m_sources) {
    if (s.cid == cid && s.address == address) return &s;
  }
  return nullptr;
}

DMXListener::Source* DMXListener::Add(const Cid& cid, const IPv4Endpoint& address,
                                      uint8_t sequence) {
  if (m_sources.size() >= kMaxSources) {
    ++m_counters.refused;
    return nullptr;
  }
  Source source;
  source.cid = cid;
  source.address = address;
  source.sequence = sequence;
  m_sources.push_back(source);
  return &m_sources.back();
}

void DMXListener::Remove(Source* source) {
  m_sources.erase(m_sources.begin() + (source - m_sources.data()));
}

void DMXListener::Merge(std::vector<int32_t>& pressed) {
  m_merged.fill(0);
  if (m_sources.empty()) {
    m_edges.Forget();
    return;
  }
  uint8_t top = 0;
  for (const Source& s : m_sources) top = std::max(top, s.priority);
  for (const Source& s : m_sources) {
    if (s.priority != top) continue;
    for (size_t i = 0; i < m_merged.size(); ++i) m_merged[i] = std::max(m_merged[i], s.levels[i]);
  }
  m_edges.Update(m_merged.data(), pressed);
}

}  // namespace tav
