#pragma once
// The hardware-I/O control of a simulation: it opens no port and sends
// nothing, but takes every call the engine makes and counts what would have
// gone out, so that the summary can say which outputs a show drives and how
// much. Inputs never fire (no one presses a button in a simulation).
//
// Owned by the simulation, shared with the host form; single-threaded.

#include <cstdint>
#include <functional>
#include <set>
#include <string>
#include <utility>

#include "suite/channelio/ChannelIO.h"

namespace tav::simulation {

struct OutputCounts {
  uint64_t levelBlocks = 0;  // DMX and TAV level blocks
  uint64_t effects = 0;      // effect commands (X10, Fennick, TAV effects)
  uint64_t frames = 0;       // SendAccumulated calls
  std::set<int32_t> dmxUniverses;
  std::set<std::pair<int32_t, int32_t>> tavUnits;  // (network, unit)
  std::set<std::string> serialPorts;               // TAV, X10 and Fennick ports opened
};

class SimulatedOutputs : public ChannelIO {
 public:
  // The device types of effect commands that name a universe or a unit.
  static constexpr int32_t kDeviceTAV = 1;
  static constexpr int32_t kDeviceDMX = 7;

  const OutputCounts& Counts() const { return m_counts; }

  void SetupClient(bool, const std::string&, bool) override {}
  void ReleaseClient() override {}
  void SetLightsActive(bool) override {}
  void KeepAlive() override {}

  void SetTAVNetworkSpeed(int32_t, int32_t) override {}
  void SetTAVNetworkOldMCP(int32_t, bool) override {}
  void SetTAVNetworkEnhanced(int32_t, bool) override {}
  void SetTAVNetworkPort(int32_t, const std::string& port) override { Opened(port); }
  void OpenX10Network(const std::string& port) override { Opened(port); }
  void OpenFennickNetwork(const std::string& port) override { Opened(port); }
  void ApplyNetworkPreferences(const NetworkPreferences&) override {}

  void RegisterInput(int32_t, int32_t, int32_t, const std::string&) override {}
  void ClearInputs() override {}
  void SetOnInput(std::function<void(const ChannelInputEvent&)>) override {}

  void OutputEffect(int32_t devType, int32_t lNetwork, uint8_t byteUnit, int32_t,
                    const std::string&, int32_t, int32_t, int32_t, int32_t, int32_t,
                    uint32_t) override {
    ++m_counts.effects;
    if (devType == kDeviceDMX) m_counts.dmxUniverses.insert(lNetwork);
    if (devType == kDeviceTAV) m_counts.tavUnits.emplace(lNetwork, byteUnit);
  }
  void OutputDMXLevels(int32_t lUniverse, int32_t, int32_t, const uint8_t*, uint32_t) override {
    ++m_counts.levelBlocks;
    m_counts.dmxUniverses.insert(lUniverse);
  }
  void OutputTAVLevels(int32_t lNetwork, uint8_t byteUnit, int32_t, int32_t, const uint8_t*,
                       uint32_t) override {
    ++m_counts.levelBlocks;
    m_counts.tavUnits.emplace(lNetwork, byteUnit);
  }
  void SendAccumulated(uint32_t) override { ++m_counts.frames; }

 private:
  void Opened(const std::string& port) {
    if (!port.empty()) m_counts.serialPorts.insert(port);
  }

  OutputCounts m_counts;
};

}  // namespace tav::simulation
