#pragma once
// The hardware-I/O control as the show engine is given it: every call goes
// to the real control unchanged, and inputs can also be fired from the
// tray (`showctl trigger`) for people trying a show without the hardware.
// A simulated input reaches the engine exactly as a real one would: through
// the input handler the engine gave the control, on the loop, with the name
// the input was registered under; an input that is not registered is
// ignored, as the control would ignore it.
//
// Owned by the host form; shares the real control with the composition
// root. Single-threaded.

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <tuple>

#include "suite/channelio/ChannelIO.h"

namespace tav {

class SimulatedInputControl : public ChannelIO {
 public:
  explicit SimulatedInputControl(std::shared_ptr<ChannelIO> control);

  // Raises the input if it is registered; returns whether it was.
  bool Simulate(int32_t network, int32_t unitId, int32_t inputNumber);
  const std::shared_ptr<ChannelIO>& Control() const { return m_control; }

  void SetupClient(bool boolExclusive, const std::string& szClientName,
                   bool boolLightsActive) override;
  void ReleaseClient() override;
  void SetLightsActive(bool value) override;
  void KeepAlive() override;
  void SetTAVNetworkSpeed(int32_t network, int32_t speed) override;
  void SetTAVNetworkOldMCP(int32_t network, bool value) override;
  void SetTAVNetworkEnhanced(int32_t network, bool value) override;
  void SetTAVNetworkPort(int32_t network, const std::string& port) override;
  void OpenX10Network(const std::string& port) override;
  void OpenFennickNetwork(const std::string& port) override;
  void ApplyNetworkPreferences(const NetworkPreferences& prefs) override;
  void RegisterInput(int32_t network, int32_t unitId, int32_t inputNumber,
                     const std::string& name) override;
  void ClearInputs() override;
  void SetOnInput(std::function<void(const ChannelInputEvent&)> onInput) override;
  void OutputEffect(int32_t devType, int32_t lNetwork, uint8_t byteUnit, int32_t lCircuit,
                    const std::string& szChannelName, int32_t effectType, int32_t lDuration,
                    int32_t lStartIntensity, int32_t lEndIntensity, int32_t lPriority,
                    uint32_t dueTick) override;
  void OutputDMXLevels(int32_t lUniverse, int32_t nStartSlot, int32_t nCount, const uint8_t* levels,
                       uint32_t dueTick) override;
  void OutputTAVLevels(int32_t lNetwork, uint8_t byteUnit, int32_t nStartCircuit, int32_t nCount,
                       const uint8_t* levels, uint32_t dueTick) override;
  void SendAccumulated(uint32_t dueTick) override;

 private:
  std::shared_ptr<ChannelIO> m_control;
  std::function<void(const ChannelInputEvent&)> m_onInput;
  std::map<std::tuple<int32_t, int32_t, int32_t>, std::string> m_registered;
};

}  // namespace tav
