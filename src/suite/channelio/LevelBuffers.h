#pragma once
// The levels of every lighting network as they stand after the last frame:
// DMX universes (512 slots each), TAV units (circuits of one unit on one
// network), the X10 house and unit grid and Fennick channels. The effect
// engine and the level blocks write here; each transmitter reads the
// buffers of its own network family when a frame is sent.
//
// Each buffer carries a version that moves whenever one of its levels
// changes value, so a transmitter sends what changed since it last looked
// and a write of the same levels costs nothing on the wire.
//
// Owned by the control. Buffers are made on first use and never move, so a
// transmitter may keep a pointer to the buffers it sends. Addresses out of
// range are ignored, never grown into.

#include <array>
#include <cstdint>
#include <map>
#include <memory>
#include <unordered_map>
#include <utility>
#include <vector>

namespace tav {

inline constexpr int32_t kDMXSlots = 512;
inline constexpr int32_t kMaxDMXUniverse = 63999;  // 0 is Art-Net's first universe
inline constexpr int32_t kMaxTAVUnit = 255;
inline constexpr int32_t kMaxTAVCircuits = 4096;
inline constexpr int32_t kX10Houses = 16;
inline constexpr int32_t kX10Units = 16;
inline constexpr int32_t kMaxFennickChannels = 4096;

struct DMXLevels {
  std::array<uint8_t, kDMXSlots> slots{};
  uint64_t version = 0;
  bool written = false;  // by anything, even the levels it already had
};

struct ChannelLevels {
  std::vector<uint8_t> levels;
  uint64_t version = 0;
};

class LevelBuffers {
 public:
  // --- DMX (universe 0-63999, slots 1-512) ---
  // The universe's buffer, made (all zero) when new; null out of range.
  DMXLevels* Universe(int32_t universe);
  const DMXLevels* FindUniverse(int32_t universe) const;
  // Levels for `count` consecutive slots from `firstSlot`; the part outside
  // 1-512 is cut off.
  void WriteDMX(int32_t universe, int32_t firstSlot, const uint8_t* levels, int32_t count);
  void SetDMX(int32_t universe, int32_t slot, uint8_t level);
  uint8_t DMXLevel(int32_t universe, int32_t slot) const;

  // --- TAV (network >= 1, unit 0-255, circuits 1-4096) ---
  void WriteTAV(int32_t network, int32_t unit, int32_t firstCircuit, const uint8_t* levels,
                int32_t count);
  void SetTAV(int32_t network, int32_t unit, int32_t circuit, uint8_t level);
  uint8_t TAVLevel(int32_t network, int32_t unit, int32_t circuit) const;
  // Every TAV unit written so far, by (network, unit); its levels are as
  // long as the highest circuit written.
  const std::map<std::pair<int32_t, int32_t>, ChannelLevels>& TAVUnits() const { return m_tav; }

  // --- X10 (house 1-16 for A-P, unit 1-16) ---
  void SetX10(int32_t house, int32_t unit, uint8_t level);
  uint8_t X10Level(int32_t house, int32_t unit) const;
  // 256 levels, house-major: (house - 1) * 16 + (unit - 1).
  const ChannelLevels& X10() const { return m_x10; }

  // --- Fennick (network >= 1, channels 1-4096) ---
  void SetFennick(int32_t network, int32_t channel, uint8_t level);
  uint8_t FennickLevel(int32_t network, int32_t channel) const;
  const std::map<int32_t, ChannelLevels>& FennickNetworks() const { return m_fennick; }

 private:
  static void Write(ChannelLevels& buffer, size_t first, const uint8_t* levels, size_t count);

  std::unordered_map<int32_t, std::unique_ptr<DMXLevels>> m_dmx;
  std::map<std::pair<int32_t, int32_t>, ChannelLevels> m_tav;
  ChannelLevels m_x10{std::vector<uint8_t>(kX10Houses * kX10Units, 0), 0};
  std::map<int32_t, ChannelLevels> m_fennick;
};

}  // namespace tav
