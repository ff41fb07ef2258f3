#include "suite/channelio/ArtNetPacket.h"

#include <algorithm>
#include <cstring>

namespace tav {

namespace {

constexpr uint8_t kArtNetId[8] = {'A', 'r', 't', '-', 'N', 'e', 't', 0};
constexpr uint16_t kOpDmx = 0x5000;
constexpr uint16_t kOpSync = 0x5200;
constexpr uint8_t kProtocolVersion = 14;

void PutHeader(uint8_t* out, uint16_t opCode) {
  std::memcpy(out, kArtNetId, sizeof kArtNetId);
  out[8] = static_cast<uint8_t>(opCode);  // OpCode, little-endian
  out[9] = static_cast<uint8_t>(opCode >> 8);
  out[10] = 0;  // ProtVerHi
  out[11] = kProtocolVersion;
}

}  // namespace

void EncodeArtDmx(uint8_t sequence, uint8_t physical, uint16_t portAddress, const uint8_t* slots,
                  size_t slotCount, uint8_t* out) {
  slotCount = std::min(slotCount, kArtDmxMaxSlots);
  size_t length = ArtDmxDataLength(slotCount);
  PutHeader(out, kOpDmx);
  out[kArtDmxSequenceOffset] = sequence;
  out[13] = physical;
  out[14] = static_cast<uint8_t>(portAddress);              // SubUni: Sub-Net and Universe
  out[15] = static_cast<uint8_t>(portAddress >> 8 & 0x7F);  // Net
  out[16] = static_cast<uint8_t>(length >> 8);
  out[17] = static_cast<uint8_t>(length);
  if (slots && slotCount > 0) std::memcpy(out + kArtDmxDataOffset, slots, slotCount);
  std::memset(out + kArtDmxDataOffset + slotCount, 0, length - slotCount);
}

void EncodeArtSync(uint8_t* out) {
  PutHeader(out, kOpSync);
  out[12] = 0;  // Aux1
  out[13] = 0;  // Aux2
}

ArtNetParse ParseArtNet(const uint8_t* data, size_t size, ArtDmxView& view) {
  if (size < 12 || std::memcmp(data, kArtNetId, sizeof kArtNetId) != 0)
    return ArtNetParse::kMalformed;
  uint16_t opCode = static_cast<uint16_t>(data[8] | data[9] << 8);
  if (opCode != kOpDmx) return ArtNetParse::kOther;
  if (size < kArtDmxHeaderSize) return ArtNetParse::kMalformed;
  uint16_t length = static_cast<uint16_t>(data[16] << 8 | data[17]);
  if (length < 2 || length > kArtDmxMaxSlots || size < kArtDmxHeaderSize + length)
    return ArtNetParse::kMalformed;
  view.sequence = data[kArtDmxSequenceOffset];
  view.physical = data[13];
  view.portAddress = static_cast<uint16_t>((data[15] & 0x7F) << 8 | data[14]);
  view.data = data + kArtDmxDataOffset;
  view.length = length;
  return ArtNetParse::kDmx;
}

}  // namespace tav
