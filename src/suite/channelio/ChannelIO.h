#pragma once
// Port: the suite's hardware-I/O control as the player reaches it. It holds
// the lighting networks open, keeps a level buffer per network, renders
// effect commands, sends frames on their deadlines and raises input events.
//
// The calls are the ones the player makes, in the words of the player:
//  - the host sets up and releases the client and keeps the lights active;
//  - the show engine opens networks (TAV networks through four settings each,
//    X10 and Fennick with their ports), registers and clears inputs, hands
//    over each light event of a playing sequence and then asks the control
//    to send what has been accumulated;
//  - a loading sequence raises the keep-alive.
//
// Every light event carries the tick of the Clock port at which it is due.
// The control holds events that arrive early and sends each frame at its
// deadline from its own timer; an event already late is sent at once.
//
// Single-threaded: every call and every input event happens on the event
// loop. Failures are tav::Error; a port held by another program is error
// 8005.

#include <cstdint>
#include <functional>
#include <string>

namespace tav {

class NetworkPreferences;

// The error number of a port that another program holds open.
inline constexpr int32_t kErrorPortAlreadyOpen = 8005;

// An input that fired on a network: the unit and input (circuit) on that
// network, and the name the control knows it by (may be empty).
struct ChannelInputEvent {
  int32_t network = 0;
  int32_t unitId = 0;
  int32_t inputNumber = 0;
  std::string name;
};

class ChannelIO {
 public:
  virtual ~ChannelIO() = default;

  // --- The host ---
  // Names this client and claims the outputs; the host calls it once with
  // (true, "Show Player", true). Fails with 8005 when a port is held by
  // another program.
  virtual void SetupClient(bool boolExclusive, const std::string& szClientName,
                           bool boolLightsActive) = 0;
  // Releases everything: outputs end cleanly (E1.31 sends its stream-
  // terminated packets), ports close, inputs are dropped.
  virtual void ReleaseClient() = 0;
  // The lights-active keep-alive, set to true every second by the host.
  virtual void SetLightsActive(bool value) = 0;
  // Keeps outputs refreshing while the caller blocks the loop for a while
  // (a large sequence loading).
  virtual void KeepAlive() = 0;

  // --- Networks ---
  // The four settings of a TAV network (index 0-15), handed over in this
  // order; setting the port (re)opens the network with the other three.
  // An empty port closes it.
  virtual void SetTAVNetworkSpeed(int32_t network, int32_t speed) = 0;
  virtual void SetTAVNetworkOldMCP(int32_t network, bool value) = 0;
  virtual void SetTAVNetworkEnhanced(int32_t network, bool value) = 0;
  virtual void SetTAVNetworkPort(int32_t network, const std::string& port) = 0;
  virtual void OpenX10Network(const std::string& port) = 0;
  virtual void OpenFennickNetwork(const std::string& port) = 0;
  // Everything else the preferences describe (DMX universes and their
  // transports, the DMX listener, the serial details of each family). Called
  // at start-up and whenever the preferences changed; networks whose
  // settings did not change keep running undisturbed.
  virtual void ApplyNetworkPreferences(const NetworkPreferences& prefs) = 0;

  // --- Inputs ---
  virtual void RegisterInput(int32_t network, int32_t unitId, int32_t inputNumber,
                             const std::string& name) = 0;
  virtual void ClearInputs() = 0;
  // Called on the loop for every registered input that fires.
  virtual void SetOnInput(std::function<void(const ChannelInputEvent&)> onInput) = 0;

  // --- Light events (due at `dueTick` of the Clock port) ---
  // An effect command for one channel (playEventType 1): devType 1 TAV
  // (network, unit, circuit), 3 X10 (house 1-16, unit 1-16), 4 Fennick
  // (network, channel), 7 DMX (universe, slot). Intensities in percent.
  virtual void OutputEffect(int32_t devType, int32_t lNetwork, uint8_t byteUnit, int32_t lCircuit,
                            const std::string& szChannelName, int32_t effectType, int32_t lDuration,
                            int32_t lStartIntensity, int32_t lEndIntensity, int32_t lPriority,
                            uint32_t dueTick) = 0;
  // Levels (0-255) for consecutive slots of a DMX universe, from nStartSlot
  // (1-based).
  virtual void OutputDMXLevels(int32_t lUniverse, int32_t nStartSlot, int32_t nCount,
                               const uint8_t* levels, uint32_t dueTick) = 0;
  // Levels (0-255) for consecutive circuits of a TAV unit, from
  // nStartCircuit (1-based).
  virtual void OutputTAVLevels(int32_t lNetwork, uint8_t byteUnit, int32_t nStartCircuit,
                               int32_t nCount, const uint8_t* levels, uint32_t dueTick) = 0;
  // Seals what has been accumulated into the frame due at `dueTick`; the
  // control sends it on that deadline (at once when it has passed).
  virtual void SendAccumulated(uint32_t dueTick) = 0;
};

}  // namespace tav
