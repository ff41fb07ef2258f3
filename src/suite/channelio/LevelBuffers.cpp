#include "suite/channelio/LevelBuffers.h"

#include <algorithm>
#include <cstring>

namespace tav {

DMXLevels* LevelBuffers::Universe(int32_t universe) {
  if (universe < 0 || universe > kMaxDMXUniverse) return nullptr;
  auto& slot = m_dmx[universe];
  if (!slot) slot = std::make_unique<DMXLevels>();
  return slot.get();
}

const DMXLevels* LevelBuffers::FindUniverse(int32_t universe) const {
  auto it = m_dmx.find(universe);
  return it == m_dmx.end() ? nullptr : it->second.get();
}

void LevelBuffers::WriteDMX(int32_t universe, int32_t firstSlot, const uint8_t* levels,
                            int32_t count) {
  if (count <= 0 || firstSlot > kDMXSlots || firstSlot + count <= 1) return;
  if (firstSlot < 1) {
    levels += 1 - firstSlot;
    count -= 1 - firstSlot;
    firstSlot = 1;
  }
  count = std::min(count, kDMXSlots - firstSlot + 1);
  DMXLevels* buffer = Universe(universe);
  if (!buffer) return;
  buffer->written = true;
  uint8_t* target = buffer->slots.data() + (firstSlot - 1);
  if (std::memcmp(target, levels, static_cast<size_t>(count)) == 0) return;
  std::memcpy(target, levels, static_cast<size_t>(count));
  ++buffer->version;
}

void LevelBuffers::SetDMX(int32_t universe, int32_t slot, uint8_t level) {
  WriteDMX(universe, slot, &level, 1);
}

uint8_t LevelBuffers::DMXLevel(int32_t universe, int32_t slot) const {
  const DMXLevels* buffer = FindUniverse(universe);
  if (!buffer || slot < 1 || slot > kDMXSlots) return 0;
  return buffer->slots[static_cast<size_t>(slot - 1)];
}

void LevelBuffers::Write(ChannelLevels& buffer, size_t first, const uint8_t* levels, size_t count) {
  if (buffer.levels.size() < first + count) buffer.levels.resize(first + count, 0);
  uint8_t* target = buffer.levels.data() + first;
  if (std::memcmp(target, levels, count) == 0) return;
  std::memcpy(target, levels, count);
  ++buffer.version;
}

void LevelBuffers::WriteTAV(int32_t network, int32_t unit, int32_t firstCircuit,
                            const uint8_t* levels, int32_t count) {
  if (network < 1 || unit < 0 || unit > kMaxTAVUnit || count <= 0 ||
      firstCircuit > kMaxTAVCircuits || firstCircuit + count <= 1) {
    return;
  }
  if (firstCircuit < 1) {
    levels += 1 - firstCircuit;
    count -= 1 - firstCircuit;
    firstCircuit = 1;
  }
  count = std::min(count, kMaxTAVCircuits - firstCircuit + 1);
  Write(m_tav[{network, unit}], static_cast<size_t>(firstCircuit - 1), levels,
        static_cast<size_t>(count));
}

void LevelBuffers::SetTAV(int32_t network, int32_t unit, int32_t circuit, uint8_t level) {
  WriteTAV(network, unit, circuit, &level, 1);
}

uint8_t LevelBuffers::TAVLevel(int32_t network, int32_t unit, int32_t circuit) const {
  auto it = m_tav.find({network, unit});
  if (it == m_tav.end() || circuit < 1 || static_cast<size_t>(circuit) > it->second.levels.size())
    return 0;
  return it->second.levels[static_cast<size_t>(circuit - 1)];
}

void LevelBuffers::SetX10(int32_t house, int32_t unit, uint8_t level) {
  if (house < 1 || house > kX10Houses || unit < 1 || unit > kX10Units) return;
  Write(m_x10, static_cast<size_t>((house - 1) * kX10Units + (unit - 1)), &level, 1);
}

uint8_t LevelBuffers::X10Level(int32_t house, int32_t unit) const {
  if (house < 1 || house > kX10Houses || unit < 1 || unit > kX10Units) return 0;
  return m_x10.levels[static_cast<size_t>((house - 1) * kX10Units + (unit - 1))];
}

void LevelBuffers::SetFennick(int32_t network, int32_t channel, uint8_t level) {
  if (network < 1 || channel < 1 || channel > kMaxFennickChannels) return;
  Write(m_fennick[network], static_cast<size_t>(channel - 1), &level, 1);
}

uint8_t LevelBuffers::FennickLevel(int32_t network, int32_t channel) const {
  auto it = m_fennick.find(network);
  if (it == m_fennick.end() || channel < 1 ||
      static_cast<size_t>(channel) > it->second.levels.size())
    return 0;
  return it->second.levels[static_cast<size_t>(channel - 1)];
}

}  // namespace tav
