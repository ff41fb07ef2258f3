#include "suite/channelio/E131Packet.h"

#include <algorithm>
#include <cstring>

namespace tav {

namespace {

constexpr uint8_t kAcnIdentifier[12] = {0x41, 0x53, 0x43, 0x2D, 0x45, 0x31,
                                        0x2E, 0x31, 0x37, 0x00, 0x00, 0x00};
constexpr uint32_t kRootVectorData = 0x00000004;
constexpr uint32_t kRootVectorExtended = 0x00000008;
constexpr uint32_t kFramingVectorData = 0x00000002;
constexpr uint32_t kFramingVectorSync = 0x00000001;
constexpr uint8_t kDmpVectorSetProperty = 0x02;
constexpr uint8_t kDmpAddressAndDataType = 0xA1;

void Put16(uint8_t* out, uint16_t value) {
  out[0] = static_cast<uint8_t>(value >> 8);
  out[1] = static_cast<uint8_t>(value);
}
void Put32(uint8_t* out, uint32_t value) {
  out[0] = static_cast<uint8_t>(value >> 24);
  out[1] = static_cast<uint8_t>(value >> 16);
  out[2] = static_cast<uint8_t>(value >> 8);
  out[3] = static_cast<uint8_t>(value);
}
uint16_t Get16(const uint8_t* in) {
  return static_cast<uint16_t>(in[0] << 8 | in[1]);
}
uint32_t Get32(const uint8_t* in) {
  return static_cast<uint32_t>(in[0]) << 24 | static_cast<uint32_t>(in[1]) << 16 |
         static_cast<uint32_t>(in[2]) << 8 | in[3];
}
// A PDU's flags and length: the flags nibble 0x7 and the bytes from the field
// to the end of the packet.
void PutFlagsAndLength(uint8_t* out, size_t length) {
  Put16(out, static_cast<uint16_t>(0x7000 | (length & 0x0FFF)));
}
bool FlagsAndLengthIs(const uint8_t* in, size_t length) {
  return Get16(in) == (0x7000 | length);
}

void PutRootLayer(uint8_t* out, size_t packetSize, uint32_t vector, const Cid& cid) {
  Put16(out + 0, 0x0010);  // preamble size
  Put16(out + 2, 0x0000);  // post-amble size
  std::memcpy(out + 4, kAcnIdentifier, sizeof kAcnIdentifier);
  PutFlagsAndLength(out + 16, packetSize - 16);
  Put32(out + 18, vector);
  std::memcpy(out + 22, cid.data(), cid.size());
}

}  // namespace

void EncodeE131Data(const E131DataFields& fields, const uint8_t* slots, size_t slotCount,
                    uint8_t* out) {
  slotCount = std::min(slotCount, kE131MaxSlots);
  size_t size = E131DataPacketSize(slotCount);
  PutRootLayer(out, size, kRootVectorData, fields.cid);
  // Framing layer.
  PutFlagsAndLength(out + 38, size - 38);
  Put32(out + 40, kFramingVectorData);
  std::memset(out + 44, 0, kE131SourceNameSize);
  size_t nameSize = std::min(fields.sourceName.size(), kE131SourceNameSize - 1);
  if (nameSize > 0) std::memcpy(out + 44, fields.sourceName.data(), nameSize);
  out[kE131PriorityOffset] = fields.priority;
  Put16(out + 109, fields.syncAddress);
  out[kE131SequenceOffset] = fields.sequence;
  out[kE131OptionsOffset] = fields.options;
  Put16(out + 113, fields.universe);
  // DMP layer.
  PutFlagsAndLength(out + 115, size - 115);
  out[117] = kDmpVectorSetProperty;
  out[118] = kDmpAddressAndDataType;
  Put16(out + 119, 0x0000);  // first property address
  Put16(out + 121, 0x0001);  // address increment
  Put16(out + 123, static_cast<uint16_t>(slotCount + 1));
  out[125] = 0x00;  // START code: levels
  if (slots && slotCount > 0) std::memcpy(out + kE131SlotsOffset, slots, slotCount);
}

void EncodeE131Sync(const Cid& cid, uint8_t sequence, uint16_t syncAddress, uint8_t* out) {
  PutRootLayer(out, kE131SyncPacketSize, kRootVectorExtended, cid);
  PutFlagsAndLength(out + 38, kE131SyncPacketSize - 38);
  Put32(out + 40, kFramingVectorSync);
  out[44] = sequence;
  Put16(out + 45, syncAddress);
  Put16(out + 47, 0);  // reserved
}

E131Parse ParseE131(const uint8_t* data, size_t size, E131DataView& view) {
  if (size < 38 || Get16(data) != 0x0010 || Get16(data + 2) != 0 ||
      std::memcmp(data + 4, kAcnIdentifier, sizeof kAcnIdentifier) != 0 ||
      !FlagsAndLengthIs(data + 16, size - 16)) {
    return E131Parse::kMalformed;
  }
  uint32_t rootVector = Get32(data + 18);
  if (rootVector == kRootVectorExtended) return E131Parse::kOther;
  if (rootVector != kRootVectorData) return E131Parse::kMalformed;
  if (size < kE131HeaderSize || size > kE131MaxPacketSize) return E131Parse::kMalformed;
  if (!FlagsAndLengthIs(data + 38, size - 38) || Get32(data + 40) != kFramingVectorData ||
      !FlagsAndLengthIs(data + 115, size - 115) || data[117] != kDmpVectorSetProperty ||
      data[118] != kDmpAddressAndDataType || Get16(data + 119) != 0 || Get16(data + 121) != 1 ||
      Get16(data + 123) != size - 125) {
    return E131Parse::kMalformed;
  }
  uint16_t universe = Get16(data + 113);
  if (universe < kE131MinUniverse || universe > kE131MaxUniverse) return E131Parse::kMalformed;
  std::memcpy(view.cid.data(), data + 22, view.cid.size());
  view.priority = data[kE131PriorityOffset];
  view.syncAddress = Get16(data + 109);
  view.sequence = data[kE131SequenceOffset];
  view.options = data[kE131OptionsOffset];
  view.universe = universe;
  view.startCode = data[125];
  view.slots = data + kE131SlotsOffset;
  view.slotCount = static_cast<uint16_t>(size - kE131SlotsOffset);
  return E131Parse::kData;
}

}  // namespace tav
