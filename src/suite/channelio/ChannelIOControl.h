#pragma once
// The hardware-I/O control: the real ChannelIO. It keeps the level buffers
// of every network, holds the light events the show engine hands over until
// their frame is due, renders effects, and sends each frame on its deadline
// through the outputs the network preferences describe (E1.31 and Art-Net
// universes here; serial networks through the SerialOutputFactory). It also
// runs the DMX listener and fires the inputs registered with it.
//
// Timing: one DeadlineTimer, always set to the earliest of the next sealed
// frame, the next effect refresh (while effects run, every 1000/RefreshRate
// ms after the last frame) and the outputs' keep-alives. A frame is sent at
// its due tick, not when the engine noticed it; a frame sealed after its
// tick has passed is sent at once and counted late, and frames that fell
// due together (the loop was busy) leave at once one after the other, in
// order, so none is lost.
//
// Nothing is transmitted before SetupClient or after ReleaseClient; the
// levels are kept all the same, so the terminal view shows them. TAV
// networks count from 1 in light events and from 0 in the network calls and
// preferences: event network n is TAVNetwork(n - 1). A TAV network mapped
// onto a DMX universe (DMXUniverse != 0) also writes its circuits there.
//
// Owned by the composition root, which owns the ports and keeps them alive
// longer. Single-threaded: everything happens on the loop.

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "config/NetworkPreferences.h"
#include "config/RegistryStore.h"
#include "ports/Clock.h"
#include "ports/MessageLog.h"
#include "suite/channelio/ChannelIO.h"
#include "suite/channelio/Cid.h"
#include "suite/channelio/DMXListener.h"
#include "suite/channelio/DMXOutputPlan.h"
#include "suite/channelio/Datagram.h"
#include "suite/channelio/DeadlineTimer.h"
#include "suite/channelio/EffectEngine.h"
#include "suite/channelio/FrameQueue.h"
#include "suite/channelio/LevelBuffers.h"
#include "suite/channelio/OutputClaim.h"
#include "suite/channelio/SerialOutputFactory.h"
#include "suite/channelio/UdpDMXOutput.h"

namespace tav {

struct ChannelIOPorts {
  const Clock* clock = nullptr;
  DeadlineTimer* timer = nullptr;
  DatagramNetwork* network = nullptr;
  MessageLog* log = nullptr;
  RegistryStore* settings = nullptr;      // keeps the source CID; optional
  OutputClaim* claim = nullptr;           // optional
  SerialOutputFactory* serial = nullptr;  // optional
};

struct ChannelIOStatistics {
  uint64_t frames = 0;
  // Frames sent 2 ms or more after their due tick (sealed late, or the loop
  // was busy at the deadline), and the worst lateness seen.
  uint64_t framesLate = 0;
  uint32_t maxLatenessMs = 0;
  uint64_t packetsSent = 0;
  uint64_t packetsDropped = 0;
  uint64_t inputsFired = 0;
  DMXListener::Counters listener;
};

class ChannelIOControl : public ChannelIO {
 public:
  // A frame further ahead than this is taken as due now (a confused tick).
  static constexpr int32_t kMaxLeadMs = 10000;
  static constexpr uint32_t kLateMs = 2;

  explicit ChannelIOControl(const ChannelIOPorts& ports);
  ~ChannelIOControl() override;
  ChannelIOControl(const ChannelIOControl&) = delete;
  ChannelIOControl& operator=(const ChannelIOControl&) = delete;

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

  // An input seen by any source (the DMX listener, a serial controller, the
  // command line): fires the registered input's event; unregistered inputs
  // are ignored. Returns whether it was registered.
  bool InjectInput(int32_t network, int32_t unitId, int32_t inputNumber);

  const LevelBuffers& Levels() const { return m_levels; }
  ChannelIOStatistics Statistics() const;
  // Called on the loop after every frame has been handed to the outputs,
  // with the frame's tick: the terminal view samples the levels here, far
  // from the next deadline.
  void SetOnFrameSent(std::function<void(uint32_t tick)> onFrameSent);
  const Cid& SourceCid() const { return m_cid; }
  bool ClientIsSetUp() const { return m_setUp; }
  size_t OutputCount() const;
  bool ListenerIsOpen() const { return m_receiver != nullptr; }

 private:
  struct UdpKey {
    DMXProtocol protocol;
    std::string interfaceName;
    int32_t ttl;
    friend auto operator<=>(const UdpKey&, const UdpKey&) = default;
  };
  struct TAVMapping {
    int32_t universe = 0;
    int32_t startSlot = 1;
    int32_t circuitsPerUnit = 16;
  };

  void Service();
  void ServiceOnce();
  // A frame's levels are written: render, map, send, report.
  void SendFrame(uint32_t frameTick, uint32_t now);
  void SendToOutputs(uint32_t now, bool newFrame);
  void Arm();
  void ApplyFrame(const Frame& frame);
  void MapTAVOntoDMX();
  uint32_t Due(uint32_t dueTick) const;
  void Log(int32_t level, const std::string& text) const;
  void EnsureCid(const NetworkPreferences& prefs);
  void ConfigureUdpOutputs(const NetworkPreferences& prefs, const DMXOutputPlan& plan);
  void ConfigureListener(const NetworkPreferences& prefs);
  void OnDatagrams(std::span<const ReceivedDatagram> datagrams);
  void DispatchInputs(const std::vector<ChannelInputEvent>& events);
  void OpenSerial(const std::string& what, std::unique_ptr<NetworkOutput>& slot,
                  const std::function<std::unique_ptr<NetworkOutput>()>& open);
  void CloseOutputs();

  ChannelIOPorts m_ports;
  LevelBuffers m_levels;
  EffectEngine m_effects;
  FrameQueue m_queue;
  std::vector<Frame> m_due;

  bool m_setUp = false;
  bool m_claimed = false;
  bool m_released = false;
  bool m_inService = false;
  bool m_serviceAgain = false;
  bool m_lightsActive = true;
  std::string m_clientName;
  std::optional<NetworkPreferences> m_prefs;
  Cid m_cid{};
  bool m_cidMade = false;
  uint32_t m_refreshMs = 25;
  std::optional<uint32_t> m_refreshDue;

  std::map<UdpKey, std::unique_ptr<UdpDMXOutput>> m_udp;
  std::map<int32_t, std::unique_ptr<NetworkOutput>> m_tavSerial;  // by preferences index
  std::unique_ptr<NetworkOutput> m_x10;
  std::unique_ptr<NetworkOutput> m_fennick;
  std::vector<std::pair<DMXUniversePrefs, std::unique_ptr<NetworkOutput>>> m_widgets;
  std::vector<TAVNetworkPreferences> m_tavSettings;
  std::map<int32_t, TAVMapping> m_tavMappings;                  // by event network (index + 1)
  std::map<std::pair<int32_t, int32_t>, uint64_t> m_tavMapped;  // unit -> version mapped

  std::unique_ptr<DMXListener> m_listener;
  std::unique_ptr<DatagramReceiver> m_receiver;
  DMXListenerPrefs m_listenerPrefs;
  std::map<std::tuple<int32_t, int32_t, int32_t>, std::string> m_inputs;
  std::function<void(const ChannelInputEvent&)> m_onInput;
  std::function<void(uint32_t)> m_onFrameSent;
  std::vector<int32_t> m_pressed;

  ChannelIOStatistics m_stats;
  OutputCounters m_closedCounters;  // of outputs closed since
};

}  // namespace tav
