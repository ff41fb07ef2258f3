#pragma once
// DMX universes over UDP from one network interface: E1.31 (sACN) or
// Art-Net, whichever the output was made for. Each universe is a stream with
// its own packet, built once and then touched only where a send changes it
// (levels, sequence number), its own sequence counter and the time it was
// last sent.
//
// At a frame the output sends every universe whose levels changed; a
// universe that has not changed is sent again as keep-alive once
// kKeepAliveMs has passed (earlier, from kKeepAliveMs - kKeepAliveBatchMs
// on, when a send happens anyway, so keep-alives travel together). All
// packets of one call leave in one batch (one sendmmsg), followed, when a
// synchronization universe is set and levels changed, by the E1.31
// synchronization packet or the Art-Net ArtSync. A universe starts to be
// sent with its first frame and is sent until the output closes, which for
// E1.31 sends three stream-terminated packets per universe.
//
// Owned by the control; holds its sender and pointers into the level
// buffers, which outlive it.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "ports/MessageLog.h"
#include "suite/channelio/Cid.h"
#include "suite/channelio/DMXProtocol.h"
#include "suite/channelio/Datagram.h"
#include "suite/channelio/NetworkOutput.h"

namespace tav {

struct DMXStreamConfig {
  int32_t universe = 1;      // E1.31 universe, or Art-Net Port-Address
  IPv4Endpoint destination;  // multicast group, unicast address or broadcast address
  uint8_t priority = 100;    // E1.31 only
  uint16_t slots = 512;      // 1-512
  friend bool operator==(const DMXStreamConfig&, const DMXStreamConfig&) = default;
};

struct DMXOutputSettings {
  Cid cid{};                 // E1.31 only
  std::string sourceName;    // E1.31 only
  int32_t syncUniverse = 0;  // 0: no synchronization packets
  friend bool operator==(const DMXOutputSettings&, const DMXOutputSettings&) = default;
};

class UdpDMXOutput : public NetworkOutput {
 public:
  static constexpr uint32_t kKeepAliveMs = 800;
  static constexpr uint32_t kKeepAliveBatchMs = 200;
  static constexpr int kTerminatedPackets = 3;

  UdpDMXOutput(DMXProtocol protocol, std::string name, std::unique_ptr<DatagramSender> sender,
               LevelBuffers& levels, MessageLog& log);

  // Sets the universes. A universe whose configuration is unchanged keeps
  // its stream undisturbed (sequence numbers go on); one that is gone or
  // changed ends (E1.31: terminated packets) and a new stream starts.
  // New settings rebuild every packet; a new CID also ends every stream.
  void Configure(const DMXOutputSettings& settings, const std::vector<DMXStreamConfig>& streams);

  std::string Name() const override { return m_name; }
  void Send(const OutputFrame& frame) override;
  std::optional<uint32_t> NextRefresh() const override;
  void Close() override;
  OutputCounters Counters() const override { return m_counters; }

  DatagramSender& Sender() { return *m_sender; }
  size_t StreamCount() const { return m_streams.size(); }

 private:
  struct Stream {
    DMXStreamConfig config;
    const DMXLevels* levels = nullptr;
    std::vector<uint8_t> packet;
    size_t dataOffset = 0;
    uint8_t sequence = 0;
    uint64_t sentVersion = 0;
    uint32_t lastSent = 0;
    bool started = false;
    bool sentDark = false;
  };

  void BuildPacket(Stream& stream) const;
  void StampSequence(Stream& stream);
  void Terminate(std::vector<Stream>& streams);
  void Transmit();
  void SyncDestinations();

  DMXProtocol m_protocol;
  std::string m_name;
  std::unique_ptr<DatagramSender> m_sender;
  LevelBuffers& m_levels;
  MessageLog& m_log;
  DMXOutputSettings m_settings;
  std::vector<Stream> m_streams;
  std::vector<OutgoingDatagram> m_batch;
  std::vector<uint8_t> m_syncPacket;
  std::vector<IPv4Endpoint> m_syncDestinations;
  uint8_t m_syncSequence = 0;
  OutputCounters m_counters;
  bool m_failing = false;  // drops are being reported; quiet until sends succeed again
};

}  // namespace tav
