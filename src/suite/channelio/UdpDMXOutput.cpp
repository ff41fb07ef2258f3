#include "suite/channelio/UdpDMXOutput.h"

#include <algorithm>
#include <cstring>

#include "suite/channelio/ArtNetPacket.h"
#include "suite/channelio/E131Packet.h"
#include "suite/channelio/Ticks.h"

namespace tav {

UdpDMXOutput::UdpDMXOutput(DMXProtocol protocol, std::string name,
                           std::unique_ptr<DatagramSender> sender, LevelBuffers& levels,
                           MessageLog& log)
    : m_protocol(protocol),
      m_name(std::move(name)),
      m_sender(std::move(sender)),
      m_levels(levels),
      m_log(log) {}

void UdpDMXOutput::BuildPacket(Stream& stream) const {
  const DMXStreamConfig& c = stream.config;
  if (m_protocol == DMXProtocol::kE131) {
    stream.packet.assign(E131DataPacketSize(c.slots), 0);
    E131DataFields fields;
    fields.cid = m_settings.cid;
    fields.sourceName = m_settings.sourceName;
    fields.priority = c.priority;
    fields.syncAddress = static_cast<uint16_t>(m_settings.syncUniverse);
    fields.universe = static_cast<uint16_t>(c.universe);
    EncodeE131Data(fields, nullptr, c.slots, stream.packet.data());
    stream.dataOffset = kE131SlotsOffset;
  } else {
    stream.packet.assign(ArtDmxPacketSize(c.slots), 0);
    EncodeArtDmx(0, 0, static_cast<uint16_t>(c.universe), nullptr, c.slots, stream.packet.data());
    stream.dataOffset = kArtDmxDataOffset;
  }
  // The packet holds no levels yet: the next send must fill them in.
  stream.sentVersion = ~uint64_t{0};
}

void UdpDMXOutput::StampSequence(Stream& stream) {
  if (m_protocol == DMXProtocol::kE131) {
    stream.packet[kE131SequenceOffset] = stream.sequence++;
  } else {
    // Art-Net counts 1-255; 0 would switch the receivers' ordering check off.
    stream.sequence = stream.sequence == 255 ? 1 : static_cast<uint8_t>(stream.sequence + 1);
    stream.packet[kArtDmxSequenceOffset] = stream.sequence;
  }
}

void UdpDMXOutput::SyncDestinations() {
  m_syncDestinations.clear();
  if (m_settings.syncUniverse == 0) return;
  if (m_protocol == DMXProtocol::kArtNet) {
    m_syncPacket.assign(kArtSyncPacketSize, 0);
    EncodeArtSync(m_syncPacket.data());
    m_syncDestinations.push_back(m_sender->BroadcastAddress(kArtNetPort));
    return;
  }
  m_syncPacket.assign(kE131SyncPacketSize, 0);
  for (const Stream& stream : m_streams) {
    IPv4Endpoint destination = stream.config.destination;
    if (destination.IsMulticast()) {
      uint32_t u = static_cast<uint32_t>(m_settings.syncUniverse);
      destination.address = {239, 255, static_cast<uint8_t>(u >> 8), static_cast<uint8_t>(u)};
    }
    if (std::find(m_syncDestinations.begin(), m_syncDestinations.end(), destination) ==
        m_syncDestinations.end()) {
      m_syncDestinations.push_back(destination);
    }
  }
}

void UdpDMXOutput::Configure(const DMXOutputSettings& settings,
                             const std::vector<DMXStreamConfig>& configs) {
  bool restartAll = m_protocol == DMXProtocol::kE131 && settings.cid != m_settings.cid;
  bool rebuild = settings != m_settings;
  std::vector<Stream> old = std::move(m_streams);
  std::vector<bool> kept(old.size(), false);
  m_streams.clear();
  m_streams.reserve(configs.size());
  for (const DMXStreamConfig& config : configs) {
    Stream stream;
    bool found = false;
    for (size_t i = 0; i < old.size() && !restartAll; ++i) {
      if (!kept[i] && old[i].config == config) {
        kept[i] = true;
        stream = std::move(old[i]);
        found = true;
        break;
      }
    }
    if (!found) {
      stream.config = config;
      stream.levels = m_levels.Universe(config.universe);
      BuildPacket(stream);
    }
    m_streams.push_back(std::move(stream));
  }
  std::vector<Stream> ended;
  for (size_t i = 0; i < old.size(); ++i) {
    if (!kept[i]) ended.push_back(std::move(old[i]));
  }
  Terminate(ended);
  m_settings = settings;
  if (rebuild) {
    for (Stream& stream : m_streams) BuildPacket(stream);
  }
  SyncDestinations();
}

void UdpDMXOutput::Send(const OutputFrame& frame) {
  m_batch.clear();
  bool changedAny = false;
  for (Stream& s : m_streams) {
    // A universe is sourced from its first frame on.
    if (!s.levels || (!s.started && !s.levels->written)) continue;
    bool changed = !s.started || s.sentDark != frame.dark ||
                   (!frame.dark && s.levels->version != s.sentVersion);
    bool keepAlive =
        s.started && static_cast<uint32_t>(std::max(TickDistance(s.lastSent, frame.now), 0)) >=
                         kKeepAliveMs - kKeepAliveBatchMs;
    if (!changed && !keepAlive) continue;
    if (changed) {
      uint8_t* data = s.packet.data() + s.dataOffset;
      if (frame.dark) {
        std::memset(data, 0, s.config.slots);
      } else {
        std::memcpy(data, s.levels->slots.data(), s.config.slots);
      }
      s.sentVersion = s.levels->version;
      s.sentDark = frame.dark;
      changedAny = true;
    }
    s.started = true;
    s.lastSent = frame.now;
    StampSequence(s);
    m_batch.push_back({s.packet.data(), s.packet.size(), s.config.destination});
  }
  if (changedAny && frame.newFrame && !m_syncDestinations.empty()) {
    if (m_protocol == DMXProtocol::kE131) {
      EncodeE131Sync(m_settings.cid, m_syncSequence++,
                     static_cast<uint16_t>(m_settings.syncUniverse), m_syncPacket.data());
    }
    for (const IPv4Endpoint& destination : m_syncDestinations)
      m_batch.push_back({m_syncPacket.data(), m_syncPacket.size(), destination});
  }
  Transmit();
}

std::optional<uint32_t> UdpDMXOutput::NextRefresh() const {
  std::optional<uint32_t> next;
  for (const Stream& s : m_streams) {
    // A universe written but not yet started goes out with the frame that
    // wrote it; only started ones need keep-alives.
    if (!s.started) continue;
    uint32_t due = s.lastSent + kKeepAliveMs;
    next = next ? TickMin(*next, due) : due;
  }
  return next;
}

void UdpDMXOutput::Terminate(std::vector<Stream>& streams) {
  if (m_protocol != DMXProtocol::kE131) return;
  std::vector<std::vector<uint8_t>> packets;
  for (Stream& s : streams) {
    if (!s.started) continue;
    for (int k = 0; k < kTerminatedPackets; ++k) {
      StampSequence(s);
      packets.push_back(s.packet);
      packets.back()[kE131OptionsOffset] = kE131OptionTerminated;
    }
  }
  m_batch.clear();
  size_t index = 0;
  for (Stream& s : streams) {
    if (!s.started) continue;
    for (int k = 0; k < kTerminatedPackets; ++k, ++index)
      m_batch.push_back({packets[index].data(), packets[index].size(), s.config.destination});
    s.started = false;
  }
  Transmit();
}

void UdpDMXOutput::Close() {
  Terminate(m_streams);
  m_streams.clear();
}

void UdpDMXOutput::Transmit() {
  if (m_batch.empty()) return;
  SendResult result = m_sender->Send(m_batch);
  m_counters.packetsSent += result.sent;
  m_counters.packetsDropped += result.dropped;
  if (result.dropped == 0) {
    m_failing = false;
  } else if (!m_failing) {
    m_failing = true;
    m_log.LogMessage(2, m_name + ": " + std::to_string(result.dropped) + " of " +
                            std::to_string(m_batch.size()) + " packets dropped (" + result.error +
                            "); counting further drops quietly");
  }
  m_batch.clear();
}

}  // namespace tav
