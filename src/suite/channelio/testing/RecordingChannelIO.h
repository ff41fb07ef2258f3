#pragma once
// Test double of the ChannelIO port: records every call in order, as a
// structured record and as one line of text (so a whole show's output can be
// compared with an expected list), keeps the DMX and TAV levels it was sent
// (so a test can read what a universe holds at a chosen moment), can be told
// to fail the client set-up or any network opening, and raises input events
// on request as the real control would on the loop.

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "suite/channelio/ChannelIO.h"

namespace tav {

class RecordingChannelIO : public ChannelIO {
 public:
  struct Call {
    std::string method;  // the ChannelIO method's name
    std::string text;    // method(arguments) as one line
    uint32_t dueTick = 0;
  };

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

  // --- For tests ---
  const std::vector<Call>& Calls() const { return m_calls; }
  // The text of every call, optionally only those of the named methods.
  std::vector<std::string> CallTexts(const std::vector<std::string>& methods = {}) const;
  size_t CountOf(const std::string& method) const;
  void ClearCalls() { m_calls.clear(); }
  // Leaves out the level blocks and SendAccumulated from the call record
  // (their levels are still kept), for tests that compare the rest.
  void SetRecordLevels(bool record) { m_recordLevels = record; }
  // Called with every call as it is recorded, so a test can interleave the
  // control's calls with other records of its own (a timeline of a show).
  void SetOnCall(std::function<void(const Call&)> observer) { m_onCall = std::move(observer); }

  // The level of a DMX slot (1-based) or TAV circuit as last sent; 0 when
  // never sent.
  uint8_t DMXLevel(int32_t universe, int32_t slot) const;
  uint8_t TAVLevel(int32_t network, int32_t unit, int32_t circuit) const;
  // The registered inputs, as "network/unit/input".
  std::vector<std::string> RegisteredInputs() const;

  // Raises an input event as the control would (whether registered or not).
  void RaiseInput(int32_t network, int32_t unitId, int32_t inputNumber,
                  const std::string& name = "");
  // The next call of this method fails with the given error (once).
  void FailNext(const std::string& method, int32_t number, const std::string& description);

 private:
  void Record(const std::string& method, std::string text, uint32_t dueTick = 0);

  std::vector<Call> m_calls;
  bool m_recordLevels = true;
  std::map<int32_t, std::vector<uint8_t>> m_dmx;
  std::map<std::tuple<int32_t, int32_t>, std::vector<uint8_t>> m_tav;
  std::vector<ChannelInputEvent> m_inputs;
  std::function<void(const ChannelInputEvent&)> m_onInput;
  std::function<void(const Call&)> m_onCall;
  struct Failure {
    int32_t number;
    std::string description;
  };
  std::map<std::string, Failure> m_failNext;
};

}  // namespace tav
