#include "host/SimulatedInputControl.h"

#include "support/Error.h"

namespace tav {

SimulatedInputControl::SimulatedInputControl(std::shared_ptr<ChannelIO> control)
    : m_control(std::move(control)) {
  if (!m_control) throw errors::ObjectNotSet("SimulatedInputControl");
}

bool SimulatedInputControl::Simulate(int32_t network, int32_t unitId, int32_t inputNumber) {
  auto found = m_registered.find({network, unitId, inputNumber});
  if (found == m_registered.end() || !m_onInput) return false;
  m_onInput(ChannelInputEvent{network, unitId, inputNumber, found->second});
  return true;
}

void SimulatedInputControl::RegisterInput(int32_t network, int32_t unitId, int32_t inputNumber,
                                          const std::string& name) {
  m_control->RegisterInput(network, unitId, inputNumber, name);
  m_registered[{network, unitId, inputNumber}] = name;
}

void SimulatedInputControl::ClearInputs() {
  m_control->ClearInputs();
  m_registered.clear();
}

void SimulatedInputControl::SetOnInput(std::function<void(const ChannelInputEvent&)> onInput) {
  m_onInput = onInput;
  m_control->SetOnInput(std::move(onInput));
}

// Everything else is the real control's business.

void SimulatedInputControl::SetupClient(bool boolExclusive, const std::string& szClientName,
                                        bool boolLightsActive) {
  m_control->SetupClient(boolExclusive, szClientName, boolLightsActive);
}
void SimulatedInputControl::ReleaseClient() {
  m_control->ReleaseClient();
}
void SimulatedInputControl::SetLightsActive(bool value) {
  m_control->SetLightsActive(value);
}
void SimulatedInputControl::KeepAlive() {
  m_control->KeepAlive();
}
void SimulatedInputControl::SetTAVNetworkSpeed(int32_t network, int32_t speed) {
  m_control->SetTAVNetworkSpeed(network, speed);
}
void SimulatedInputControl::SetTAVNetworkOldMCP(int32_t network, bool value) {
  m_control->SetTAVNetworkOldMCP(network, value);
}
void SimulatedInputControl::SetTAVNetworkEnhanced(int32_t network, bool value) {
  m_control->SetTAVNetworkEnhanced(network, value);
}
void SimulatedInputControl::SetTAVNetworkPort(int32_t network, const std::string& port) {
  m_control->SetTAVNetworkPort(network, port);
}
void SimulatedInputControl::OpenX10Network(const std::string& port) {
  m_control->OpenX10Network(port);
}
void SimulatedInputControl::OpenFennickNetwork(const std::string& port) {
  m_control->OpenFennickNetwork(port);
}
void SimulatedInputControl::ApplyNetworkPreferences(const NetworkPreferences& prefs) {
  m_control->ApplyNetworkPreferences(prefs);
}
void SimulatedInputControl::OutputEffect(int32_t devType, int32_t lNetwork, uint8_t byteUnit,
                                         int32_t lCircuit, const std::string& szChannelName,
                                         int32_t effectType, int32_t lDuration,
                                         int32_t lStartIntensity, int32_t lEndIntensity,
                                         int32_t lPriority, uint32_t dueTick) {
  m_control->OutputEffect(devType, lNetwork, byteUnit, lCircuit, szChannelName, effectType,
                          lDuration, lStartIntensity, lEndIntensity, lPriority, dueTick);
}
void SimulatedInputControl::OutputDMXLevels(int32_t lUniverse, int32_t nStartSlot, int32_t nCount,
                                            const uint8_t* levels, uint32_t dueTick) {
  m_control->OutputDMXLevels(lUniverse, nStartSlot, nCount, levels, dueTick);
}
void SimulatedInputControl::OutputTAVLevels(int32_t lNetwork, uint8_t byteUnit,
                                            int32_t nStartCircuit, int32_t nCount,
                                            const uint8_t* levels, uint32_t dueTick) {
  m_control->OutputTAVLevels(lNetwork, byteUnit, nStartCircuit, nCount, levels, dueTick);
}
void SimulatedInputControl::SendAccumulated(uint32_t dueTick) {
  m_control->SendAccumulated(dueTick);
}

}  // namespace tav
