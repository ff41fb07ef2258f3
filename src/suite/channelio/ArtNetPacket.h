#pragma once
// Art-Net packets as bytes: ArtDmx (the levels of one universe), ArtSync
// (sent after a frame's ArtDmx packets so nodes show them together), and the
// reader of ArtDmx that the DMX listener runs. Pure functions on buffers.
// The OpCode is little-endian, the protocol version and data length
// big-endian; the layout is in docs/outputs.md.

#include <cstddef>
#include <cstdint>

namespace tav {

inline constexpr uint16_t kArtNetPort = 6454;
inline constexpr size_t kArtDmxHeaderSize = 18;
inline constexpr size_t kArtDmxMaxSlots = 512;
inline constexpr size_t kArtDmxMaxPacketSize = kArtDmxHeaderSize + kArtDmxMaxSlots;
inline constexpr size_t kArtSyncPacketSize = 14;
// The 15-bit Port-Address: Net (7 bits), Sub-Net (4), Universe (4).
inline constexpr int32_t kArtNetMaxPortAddress = 32767;
inline constexpr size_t kArtDmxSequenceOffset = 12;
inline constexpr size_t kArtDmxDataOffset = 18;

// The data length on the wire: even and at least 2, so an odd count is
// padded with one zero.
inline constexpr size_t ArtDmxDataLength(size_t slotCount) {
  size_t length = slotCount < 2 ? 2 : slotCount;
  if (length > kArtDmxMaxSlots) length = kArtDmxMaxSlots;
  return length + (length & 1);
}
inline constexpr size_t ArtDmxPacketSize(size_t slotCount) {
  return kArtDmxHeaderSize + ArtDmxDataLength(slotCount);
}

// Writes an ArtDmx packet for `slotCount` slots (padding included) into
// `out`, which holds ArtDmxPacketSize(slotCount) bytes. `slots` may be null
// to leave the slot bytes as they are (padding is still zeroed).
// `sequence` 0 disables the receivers' ordering check; a sender counts 1-255.
void EncodeArtDmx(uint8_t sequence, uint8_t physical, uint16_t portAddress, const uint8_t* slots,
                  size_t slotCount, uint8_t* out);
// Writes the 14-byte ArtSync packet into `out`.
void EncodeArtSync(uint8_t* out);

enum class ArtNetParse {
  kDmx,        // a well-formed ArtDmx packet, in `view`
  kOther,      // a well-formed Art-Net packet of another kind (ArtSync, ArtPoll, ...)
  kMalformed,  // not Art-Net, or an ArtDmx whose length does not fit
};

struct ArtDmxView {
  uint8_t sequence = 0;
  uint8_t physical = 0;
  uint16_t portAddress = 0;
  const uint8_t* data = nullptr;  // points into the datagram
  uint16_t length = 0;
};

// Never reads past `size`. An ArtDmx must carry 2-512 data bytes and the
// datagram must hold them; trailing bytes beyond the length are tolerated.
ArtNetParse ParseArtNet(const uint8_t* data, size_t size, ArtDmxView& view);

}  // namespace tav
