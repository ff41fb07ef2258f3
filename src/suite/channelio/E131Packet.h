#pragma once
// E1.31 (sACN) packets as bytes: the data packet a source sends for each
// universe, the universe synchronization packet, and the reader the DMX
// listener runs on every datagram it receives. Pure functions on buffers:
// building a packet fills memory, sending it is somebody else's job.
// Multi-byte fields are big-endian; the layout is in docs/outputs.md.

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "suite/channelio/Cid.h"

namespace tav {

inline constexpr uint16_t kE131Port = 5568;
inline constexpr size_t kE131HeaderSize = 126;  // a data packet without slots
inline constexpr size_t kE131MaxSlots = 512;
inline constexpr size_t kE131MaxPacketSize = kE131HeaderSize + kE131MaxSlots;
inline constexpr size_t kE131SyncPacketSize = 49;
inline constexpr size_t kE131SourceNameSize = 64;
// Data universes; 0 and 64000 and up are reserved.
inline constexpr int32_t kE131MinUniverse = 1;
inline constexpr int32_t kE131MaxUniverse = 63999;
inline constexpr uint8_t kE131MaxPriority = 200;

// Options (byte 112).
inline constexpr uint8_t kE131OptionPreview = 0x80;
inline constexpr uint8_t kE131OptionTerminated = 0x40;
inline constexpr uint8_t kE131OptionForceSync = 0x20;

// Where the fields that change from packet to packet sit, so a sender can
// keep a packet built once and touch only these.
inline constexpr size_t kE131PriorityOffset = 108;
inline constexpr size_t kE131SequenceOffset = 111;
inline constexpr size_t kE131OptionsOffset = 112;
inline constexpr size_t kE131SlotsOffset = 126;

struct E131DataFields {
  Cid cid{};
  std::string_view sourceName;  // cut to 63 bytes
  uint8_t priority = 100;
  uint16_t syncAddress = 0;
  uint8_t sequence = 0;
  uint8_t options = 0;
  uint16_t universe = 1;
};

inline constexpr size_t E131DataPacketSize(size_t slotCount) {
  return kE131HeaderSize + slotCount;
}
// Writes a data packet with START code 0 and `slotCount` (0-512) slots into
// `out`, which holds E131DataPacketSize(slotCount) bytes. `slots` may be
// null to leave the slot bytes as they are.
void EncodeE131Data(const E131DataFields& fields, const uint8_t* slots, size_t slotCount,
                    uint8_t* out);
// Writes a 49-byte synchronization packet into `out`.
void EncodeE131Sync(const Cid& cid, uint8_t sequence, uint16_t syncAddress, uint8_t* out);

// What the reader found in a datagram.
enum class E131Parse {
  kData,       // a well-formed data packet, in `view`
  kOther,      // well-formed E1.31 that carries no levels (sync, discovery)
  kMalformed,  // not E1.31, or broken: wrong sizes, lengths, vectors or ranges
};

// A data packet as received; `slots` points into the datagram.
struct E131DataView {
  Cid cid{};
  uint8_t priority = 0;
  uint16_t syncAddress = 0;
  uint8_t sequence = 0;
  uint8_t options = 0;
  uint16_t universe = 0;
  uint8_t startCode = 0;
  const uint8_t* slots = nullptr;
  uint16_t slotCount = 0;
};

// Checks every field a receiver relies on (identifier, each layer's flags
// and length against the datagram's size, vectors, the DMP address and
// data types, the universe range, at most 512 slots) and never reads past
// `size`. Policy (priority, preview, sequence order) is the listener's.
E131Parse ParseE131(const uint8_t* data, size_t size, E131DataView& view);

}  // namespace tav
