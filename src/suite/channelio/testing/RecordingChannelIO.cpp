#include "suite/channelio/testing/RecordingChannelIO.h"

#include <algorithm>
#include <tuple>

#include "support/Error.h"

namespace tav {

namespace {

std::string Bool(bool value) {
  return value ? "true" : "false";
}

std::string Levels(const uint8_t* levels, int32_t count) {
  std::string text;
  for (int32_t i = 0; i < count; ++i) {
    if (i) text += ' ';
    text += std::to_string(levels[i]);
  }
  return text;
}

}  // namespace

void RecordingChannelIO::Record(const std::string& method, std::string text, uint32_t dueTick) {
  auto failure = m_failNext.find(method);
  if (failure != m_failNext.end()) {
    Failure f = failure->second;
    m_failNext.erase(failure);
    m_calls.push_back({method, std::move(text) + " failed", dueTick});
    if (m_onCall) m_onCall(m_calls.back());
    throw Error(f.number, "RecordingChannelIO." + method, f.description);
  }
  m_calls.push_back({method, std::move(text), dueTick});
  if (m_onCall) m_onCall(m_calls.back());
}

void RecordingChannelIO::SetupClient(bool boolExclusive, const std::string& szClientName,
                                     bool boolLightsActive) {
  Record("SetupClient", "SetupClient(" + Bool(boolExclusive) + ", " + szClientName + ", " +
                            Bool(boolLightsActive) + ")");
}

void RecordingChannelIO::ReleaseClient() {
  Record("ReleaseClient", "ReleaseClient()");
}

void RecordingChannelIO::SetLightsActive(bool value) {
  Record("SetLightsActive", "SetLightsActive(" + Bool(value) + ")");
}

void RecordingChannelIO::KeepAlive() {
  Record("KeepAlive", "KeepAlive()");
}

void RecordingChannelIO::SetTAVNetworkSpeed(int32_t network, int32_t speed) {
  Record("SetTAVNetworkSpeed",
         "SetTAVNetworkSpeed(" + std::to_string(network) + ", " + std::to_string(speed) + ")");
}

void RecordingChannelIO::SetTAVNetworkOldMCP(int32_t network, bool value) {
  Record("SetTAVNetworkOldMCP",
         "SetTAVNetworkOldMCP(" + std::to_string(network) + ", " + Bool(value) + ")");
}

void RecordingChannelIO::SetTAVNetworkEnhanced(int32_t network, bool value) {
  Record("SetTAVNetworkEnhanced",
         "SetTAVNetworkEnhanced(" + std::to_string(network) + ", " + Bool(value) + ")");
}

void RecordingChannelIO::SetTAVNetworkPort(int32_t network, const std::string& port) {
  Record("SetTAVNetworkPort", "SetTAVNetworkPort(" + std::to_string(network) + ", " + port + ")");
}

void RecordingChannelIO::OpenX10Network(const std::string& port) {
  Record("OpenX10Network", "OpenX10Network(" + port + ")");
}

void RecordingChannelIO::OpenFennickNetwork(const std::string& port) {
  Record("OpenFennickNetwork", "OpenFennickNetwork(" + port + ")");
}

void RecordingChannelIO::ApplyNetworkPreferences(const NetworkPreferences&) {
  Record("ApplyNetworkPreferences", "ApplyNetworkPreferences()");
}

void RecordingChannelIO::RegisterInput(int32_t network, int32_t unitId, int32_t inputNumber,
                                       const std::string& name) {
  Record("RegisterInput", "RegisterInput(" + std::to_string(network) + ", " +
                              std::to_string(unitId) + ", " + std::to_string(inputNumber) + ", " +
                              name + ")");
  m_inputs.push_back({network, unitId, inputNumber, name});
}

void RecordingChannelIO::ClearInputs() {
  Record("ClearInputs", "ClearInputs()");
  m_inputs.clear();
}

void RecordingChannelIO::SetOnInput(std::function<void(const ChannelInputEvent&)> onInput) {
  m_onInput = std::move(onInput);
}

void RecordingChannelIO::OutputEffect(int32_t devType, int32_t lNetwork, uint8_t byteUnit,
                                      int32_t lCircuit, const std::string& szChannelName,
                                      int32_t effectType, int32_t lDuration,
                                      int32_t lStartIntensity, int32_t lEndIntensity,
                                      int32_t lPriority, uint32_t dueTick) {
  Record("OutputEffect",
         "OutputEffect(" + std::to_string(devType) + ", " + std::to_string(lNetwork) + ", " +
             std::to_string(byteUnit) + ", " + std::to_string(lCircuit) + ", " + szChannelName +
             ", " + std::to_string(effectType) + ", " + std::to_string(lDuration) + ", " +
             std::to_string(lStartIntensity) + ", " + std::to_string(lEndIntensity) + ", " +
             std::to_string(lPriority) + ")",
         dueTick);
}

void RecordingChannelIO::OutputDMXLevels(int32_t lUniverse, int32_t nStartSlot, int32_t nCount,
                                         const uint8_t* levels, uint32_t dueTick) {
  if (m_recordLevels) {
    Record("OutputDMXLevels",
           "OutputDMXLevels(" + std::to_string(lUniverse) + ", " + std::to_string(nStartSlot) +
               ", " + std::to_string(nCount) + ", [" + Levels(levels, std::min(nCount, 8)) +
               (nCount > 8 ? " ...]" : "]") + ")",
           dueTick);
  }
  if (nStartSlot < 1 || nCount < 0 || nStartSlot + nCount - 1 > 512) return;
  auto& universe = m_dmx[lUniverse];
  universe.resize(512, 0);
  std::copy(levels, levels + nCount, universe.begin() + (nStartSlot - 1));
}

void RecordingChannelIO::OutputTAVLevels(int32_t lNetwork, uint8_t byteUnit, int32_t nStartCircuit,
                                         int32_t nCount, const uint8_t* levels, uint32_t dueTick) {
  if (m_recordLevels) {
    Record("OutputTAVLevels",
           "OutputTAVLevels(" + std::to_string(lNetwork) + ", " + std::to_string(byteUnit) + ", " +
               std::to_string(nStartCircuit) + ", " + std::to_string(nCount) + ", [" +
               Levels(levels, std::min(nCount, 8)) + (nCount > 8 ? " ...]" : "]") + ")",
           dueTick);
  }
  if (nStartCircuit < 1 || nCount < 0) return;
  auto& unit = m_tav[{lNetwork, byteUnit}];
  if (unit.size() < static_cast<size_t>(nStartCircuit - 1 + nCount))
    unit.resize(nStartCircuit - 1 + nCount, 0);
  std::copy(levels, levels + nCount, unit.begin() + (nStartCircuit - 1));
}

void RecordingChannelIO::SendAccumulated(uint32_t dueTick) {
  if (m_recordLevels) Record("SendAccumulated", "SendAccumulated()", dueTick);
}

std::vector<std::string> RecordingChannelIO::CallTexts(
    const std::vector<std::string>& methods) const {
  std::vector<std::string> texts;
  for (const Call& call : m_calls) {
    if (methods.empty() || std::find(methods.begin(), methods.end(), call.method) != methods.end())
      texts.push_back(call.text);
  }
  return texts;
}

size_t RecordingChannelIO::CountOf(const std::string& method) const {
  return std::count_if(m_calls.begin(), m_calls.end(),
                       [&](const Call& call) { return call.method == method; });
}

uint8_t RecordingChannelIO::DMXLevel(int32_t universe, int32_t slot) const {
  auto it = m_dmx.find(universe);
  if (it == m_dmx.end() || slot < 1 || slot > 512) return 0;
  return it->second[slot - 1];
}

uint8_t RecordingChannelIO::TAVLevel(int32_t network, int32_t unit, int32_t circuit) const {
  auto it = m_tav.find({network, unit});
  if (it == m_tav.end() || circuit < 1 || static_cast<size_t>(circuit) > it->second.size())
    return 0;
  return it->second[circuit - 1];
}

std::vector<std::string> RecordingChannelIO::RegisteredInputs() const {
  std::vector<std::string> texts;
  for (const auto& input : m_inputs) {
    texts.push_back(std::to_string(input.network) + "/" + std::to_string(input.unitId) + "/" +
                    std::to_string(input.inputNumber));
  }
  return texts;
}

void RecordingChannelIO::RaiseInput(int32_t network, int32_t unitId, int32_t inputNumber,
                                    const std::string& name) {
  if (m_onInput) m_onInput({network, unitId, inputNumber, name});
}

void RecordingChannelIO::FailNext(const std::string& method, int32_t number,
                                  const std::string& description) {
  m_failNext[method] = {number, description};
}

}  // namespace tav
