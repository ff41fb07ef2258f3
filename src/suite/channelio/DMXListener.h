#pragma once
// The DMX listener's logic: every datagram that arrives on the listened port
// goes through here. It keeps the receiver rules of E1.31 (and the Art-Net
// equivalents), merges the sources of the listened universe and hands the
// slots that were pressed to the control, which fires the inputs registered
// on them.
//
// Receiver rules:
//  - only data packets of the listened universe with START code 0 count;
//    malformed, truncated and oversized datagrams are dropped and counted;
//  - per source (E1.31: its CID; Art-Net: its address and physical port),
//    a packet whose sequence number is 1-19 behind the last one is out of
//    order and dropped (a jump back of 20 or more is a restarted source);
//  - preview data and priorities above 200 are ignored, and so are our own
//    packets (our CID);
//  - a stream-terminated packet ends its source at once (its levels are
//    ignored); a source silent for 2.5 s is gone;
//  - the sources of the highest priority present are merged highest level
//    wins (HTP); at most kMaxSources sources are followed, more are counted
//    and ignored;
//  - when the last source is gone, the slots forget their levels, so the
//    first levels of the next source set a baseline without pressing.
//
// Pure: no sockets, no clock. Bounded memory whatever arrives.

#include <array>
#include <cstdint>
#include <vector>

#include "suite/channelio/Cid.h"
#include "suite/channelio/DMXProtocol.h"
#include "suite/channelio/Datagram.h"
#include "suite/channelio/InputEdgeDetector.h"

namespace tav {

class DMXListener {
 public:
  static constexpr uint32_t kDataLossMs = 2500;
  static constexpr size_t kMaxSources = 8;
  static constexpr int kSequenceWindow = 20;

  struct Settings {
    DMXProtocol protocol = DMXProtocol::kE131;
    int32_t universe = 1;  // E1.31 universe or Art-Net Port-Address
    int32_t firstSlot = 1;
    int32_t slotCount = 512;
    uint8_t threshold = 128;
    Cid ownCid{};
  };

  struct Counters {
    uint64_t accepted = 0;
    uint64_t malformed = 0;  // not the protocol, broken or truncated
    uint64_t ignored = 0;    // other universes and packet kinds, preview, priority, START code
    uint64_t outOfOrder = 0;
    uint64_t terminated = 0;  // sources that ended their stream
    uint64_t lost = 0;        // sources that fell silent
    uint64_t refused = 0;     // packets of sources beyond kMaxSources
  };

  explicit DMXListener(const Settings& settings);

  // One datagram, received at `tick`. Pressed slots (1-based) are appended.
  void Receive(const ReceivedDatagram& datagram, uint32_t tick, std::vector<int32_t>& pressed);

  const Settings& GetSettings() const { return m_settings; }
  const Counters& GetCounters() const { return m_counters; }
  size_t SourceCount() const { return m_sources.size(); }
  // The merged levels of the listened universe (zero without sources).
  const std::array<uint8_t, 512>& Levels() const { return m_merged; }

 private:
  struct Source {
    Cid cid{};
    IPv4Endpoint address;  // Art-Net: the port is the physical input instead
    uint8_t priority = 0;
    uint8_t sequence = 0;
    uint32_t lastSeen = 0;
    std::array<uint8_t, 512> levels{};
  };

  void ReceiveE131(const ReceivedDatagram& datagram, uint32_t tick, std::vector<int32_t>& pressed);
  void ReceiveArtNet(const ReceivedDatagram& datagram, uint32_t tick,
                     std::vector<int32_t>& pressed);
  void ExpireSilent(uint32_t tick);
  // Sequence rule; true when the packet is in order (and remembered).
  bool InOrder(Source& source, uint8_t sequence);
  Source* Find(const Cid& cid, const IPv4Endpoint& address);
  Source* Add(const Cid& cid, const IPv4Endpoint& address, uint8_t sequence);
  void Remove(Source* source);
  void Merge(std::vector<int32_t>& pressed);

  Settings m_settings;
  Counters m_counters;
  std::vector<Source> m_sources;
  std::array<uint8_t, 512> m_merged{};
  InputEdgeDetector m_edges;
};

}  // namespace tav
