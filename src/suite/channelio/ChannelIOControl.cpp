#include "suite/channelio/ChannelIOControl.h"

#include <algorithm>

#include "config/LibRegistry.h"
#include "suite/channelio/ArtNetPacket.h"
#include "suite/channelio/DMXOutputPlan.h"
#include "suite/channelio/E131Packet.h"
#include "suite/channelio/Ticks.h"
#include "suite/seqlib/PlayEvent.h"
#include "support/Error.h"

namespace tav {

namespace {

constexpr const char* kSource = "ChannelIO";

std::string ProtocolName(DMXProtocol protocol) {
  return protocol == DMXProtocol::kE131 ? "E1.31" : "Art-Net";
}

std::string InterfaceText(const std::string& name) {
  return name.empty() ? "the default interface" : "interface \"" + name + "\"";
}

}  // namespace

ChannelIOControl::ChannelIOControl(const ChannelIOPorts& ports)
    : m_ports(ports), m_tavSettings(kTAVNetworkCount) {
  if (!m_ports.clock || !m_ports.timer || !m_ports.network || !m_ports.log)
    throw errors::ObjectNotSet("ChannelIOControl");
  m_ports.timer->SetOnDeadline([this] {
    try {
      Service();
    } catch (const std::exception& e) {
      Log(3, std::string("ChannelIO frame error: ") + e.what());
      Arm();
    }
  });
}

ChannelIOControl::~ChannelIOControl() {
  m_ports.timer->Cancel();
  m_ports.timer->SetOnDeadline({});
  m_receiver.reset();
  CloseOutputs();
  if (m_claimed) m_ports.claim->Release();
}

void ChannelIOControl::Log(int32_t level, const std::string& text) const {
  m_ports.log->LogMessage(level, text);
}

// --- The host ---

void ChannelIOControl::SetupClient(bool boolExclusive, const std::string& szClientName,
                                   bool boolLightsActive) {
  m_lightsActive = boolLightsActive;
  if (m_setUp) {
    Service();
    return;
  }
  if (boolExclusive && m_ports.claim && !m_claimed) {
    std::string holder;
    if (!m_ports.claim->TryClaim(szClientName, holder)) {
      throw Error(kErrorPortAlreadyOpen, std::string(kSource) + ".SetupClient",
                  "The lighting outputs are already open in another program" +
                      (holder.empty() ? std::string() : " (" + holder + ")"));
    }
    m_claimed = true;
  }
  m_clientName = szClientName;
  m_setUp = true;
  // After a release the networks of the preferences open again as they were
  // (serial networks wait for their opening calls).
  if (m_released && m_prefs) ApplyNetworkPreferences(*m_prefs);
  m_released = false;
  Service();
}

void ChannelIOControl::ReleaseClient() {
  // What was sealed goes out now, a little early, rather than never.
  if (m_setUp && !m_inService && m_queue.NextSealedDue()) {
    m_queue.TakeAllSealed(m_due);
    Service();
  }
  m_ports.timer->Cancel();
  m_receiver.reset();
  m_listener.reset();
  m_inputs.clear();
  CloseOutputs();
  m_queue.Clear();
  m_effects.Clear();
  m_refreshDue.reset();
  if (m_claimed) {
    m_ports.claim->Release();
    m_claimed = false;
  }
  m_setUp = false;
  m_released = true;
}

void ChannelIOControl::CloseOutputs() {
  auto close = [this](std::unique_ptr<NetworkOutput>& output) {
    if (!output) return;
    output->Close();
    OutputCounters c = output->Counters();
    m_closedCounters.packetsSent += c.packetsSent;
    m_closedCounters.packetsDropped += c.packetsDropped;
    output.reset();
  };
  for (auto& [key, output] : m_udp) {
    std::unique_ptr<NetworkOutput> owned = std::move(output);
    close(owned);
  }
  m_udp.clear();
  for (auto& [index, output] : m_tavSerial) close(output);
  m_tavSerial.clear();
  for (auto& [index, output] : m_widgets) close(output);
  m_widgets.clear();
  close(m_x10);
  close(m_fennick);
}

void ChannelIOControl::SetLightsActive(bool value) {
  if (value == m_lightsActive) return;
  m_lightsActive = value;
  Service();
}

void ChannelIOControl::KeepAlive() {
  Service();
}

// --- Serial networks ---

void ChannelIOControl::SetTAVNetworkSpeed(int32_t network, int32_t speed) {
  if (network >= 0 && network < kTAVNetworkCount) m_tavSettings[network].SetSpeed(speed);
}

void ChannelIOControl::SetTAVNetworkOldMCP(int32_t network, bool value) {
  if (network >= 0 && network < kTAVNetworkCount) m_tavSettings[network].SetOldMCP(value);
}

void ChannelIOControl::SetTAVNetworkEnhanced(int32_t network, bool value) {
  if (network >= 0 && network < kTAVNetworkCount) m_tavSettings[network].SetEnhanced(value);
}

void ChannelIOControl::OpenSerial(const std::string& what, std::unique_ptr<NetworkOutput>& slot,
                                  const std::function<std::unique_ptr<NetworkOutput>()>& open) {
  if (slot) {
    slot->Close();
    slot.reset();
  }
  if (!m_ports.serial) {
    Log(2, what + ": no serial transmitter is available, so its levels are not sent");
    return;
  }
  slot = open();  // 8005 and other failures reach the caller
}

void ChannelIOControl::SetTAVNetworkPort(int32_t network, const std::string& port) {
  if (network < 0 || network >= kTAVNetworkCount)
    throw errors::SubscriptOutOfRange(std::string(kSource) + ".SetTAVNetworkPort");
  m_tavSettings[network].SetPort(port);
  // The four settings as last handed over; units and circuits from the
  // preferences.
  TAVNetworkPreferences settings = m_prefs ? m_prefs->TAVNetwork(network) : TAVNetworkPreferences();
  settings.SetSpeed(m_tavSettings[network].Speed());
  settings.SetOldMCP(m_tavSettings[network].OldMCP());
  settings.SetEnhanced(m_tavSettings[network].Enhanced());
  settings.SetPort(port);
  auto existing = m_tavSerial.find(network);
  std::unique_ptr<NetworkOutput> output;
  if (existing != m_tavSerial.end()) {
    output = std::move(existing->second);
    m_tavSerial.erase(existing);
  }
  if (port.empty()) {
    if (output) output->Close();
    return;
  }
  OpenSerial("TAV network " + std::to_string(network + 1) + " on " + port, output,
             [&] { return m_ports.serial->OpenTAVNetwork(network + 1, settings, m_levels); });
  if (output) m_tavSerial[network] = std::move(output);
}

void ChannelIOControl::OpenX10Network(const std::string& port) {
  if (port.empty()) return;
  NetworkPreferences prefs = m_prefs ? *m_prefs : NetworkPreferences();
  OpenSerial("X10 network on " + port, m_x10,
             [&] { return m_ports.serial->OpenX10(port, prefs, m_levels); });
}

void ChannelIOControl::OpenFennickNetwork(const std::string& port) {
  if (port.empty()) return;
  FennickPreferences prefs = m_prefs ? m_prefs->Fennick() : FennickPreferences();
  OpenSerial("Fennick network on " + port, m_fennick,
             [&] { return m_ports.serial->OpenFennick(port, prefs, m_levels); });
}

// --- Preferences ---

void ChannelIOControl::EnsureCid(const NetworkPreferences& prefs) {
  Cid cid;
  if (ParseCid(prefs.SourceCID(), cid)) {
    m_cid = cid;
    m_cidMade = true;
    return;
  }
  if (!prefs.SourceCID().empty()) {
    Log(2, "The E1.31 source identifier \"" + prefs.SourceCID() +
               "\" in the network preferences is not a UUID; a new one replaces it");
  }
  if (!m_cidMade) {
    m_cid = NewRandomCid();
    m_cidMade = true;
  }
  if (!m_ports.settings) return;
  try {
    SetStringSetting(*m_ports.settings, "SourceCID", prefs.NetPrefUUIDKey(), FormatCid(m_cid));
    Log(1, "New E1.31 source identifier " + FormatCid(m_cid) + " kept in the network preferences");
  } catch (const Error& e) {
    Log(2, "Could not keep the E1.31 source identifier in the settings: " + e.Description());
  }
}

void ChannelIOControl::ApplyNetworkPreferences(const NetworkPreferences& prefs) {
  m_prefs = prefs;
  EnsureCid(prefs);
  int32_t rate = std::clamp(prefs.RefreshRate(), 1, 1000);
  m_refreshMs = static_cast<uint32_t>(std::max(1, (1000 + rate / 2) / rate));

  m_tavMappings.clear();
  m_tavMapped.clear();
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const TAVNetworkPreferences& tav = prefs.TAVNetwork(i);
    if (tav.DMXUniverse() == 0) continue;
    if (tav.DMXUniverse() < 0 || tav.DMXUniverse() > kMaxDMXUniverse || tav.DMXStartSlot() < 1 ||
        tav.DMXStartSlot() > kDMXSlots || tav.CircuitsPerUnit() < 1) {
      Log(2, "TAV network " + std::to_string(i + 1) + ": its DMX mapping (universe " +
                 std::to_string(tav.DMXUniverse()) + ", slot " +
                 std::to_string(tav.DMXStartSlot()) + ") is out of range; it is not mapped");
      continue;
    }
    m_tavMappings[i + 1] = {tav.DMXUniverse(), tav.DMXStartSlot(), tav.CircuitsPerUnit()};
  }

  DMXOutputPlan plan = PlanDMXOutputs(prefs);
  for (const std::string& problem : plan.problems) Log(2, problem);
  ConfigureUdpOutputs(prefs, plan);
  ConfigureListener(prefs);

  // USB widgets: one whose entry is unchanged keeps running; others open.
  std::vector<std::pair<DMXUniversePrefs, std::unique_ptr<NetworkOutput>>> widgets;
  for (int32_t index : plan.serialEntries) {
    const DMXUniversePrefs& entry = prefs.DMXUniverse(index);
    auto same = std::find_if(m_widgets.begin(), m_widgets.end(),
                             [&](const auto& w) { return w.first == entry && w.second; });
    if (same != m_widgets.end()) {
      widgets.push_back(std::move(*same));
      m_widgets.erase(same);
      continue;
    }
    std::string what = "DMX universe " + std::to_string(entry.Universe()) + " (" +
                       DMXTransportName(entry.Transport()) + " on " + entry.Port() + ")";
    std::unique_ptr<NetworkOutput> output;
    try {
      OpenSerial(what, output, [&] { return m_ports.serial->OpenDMXWidget(entry, m_levels); });
    } catch (const Error& e) {
      Log(2, what + ": " + e.Description() + "; it stays off");
    }
    if (output) widgets.push_back({entry, std::move(output)});
  }
  for (auto& [entry, output] : m_widgets) {
    if (output) output->Close();
  }
  m_widgets = std::move(widgets);
  if (m_setUp) Service();
}

void ChannelIOControl::ConfigureUdpOutputs(const NetworkPreferences& prefs,
                                           const DMXOutputPlan& plan) {
  std::map<UdpKey, std::vector<const PlannedUniverse*>> groups;
  for (const PlannedUniverse& u : plan.udp)
    groups[{u.protocol, u.interfaceName, prefs.MulticastTTL()}].push_back(&u);

  DMXOutputSettings settings;
  settings.cid = m_cid;
  settings.sourceName = prefs.SourceName();
  settings.syncUniverse = prefs.SyncUniverse();

  std::map<UdpKey, std::unique_ptr<UdpDMXOutput>> outputs;
  for (const auto& [key, universes] : groups) {
    std::unique_ptr<UdpDMXOutput> output;
    auto existing = m_udp.find(key);
    if (existing != m_udp.end()) {
      output = std::move(existing->second);
      m_udp.erase(existing);
    } else {
      try {
        output = std::make_unique<UdpDMXOutput>(
            key.protocol, ProtocolName(key.protocol) + " on " + InterfaceText(key.interfaceName),
            m_ports.network->OpenSender(key.interfaceName, key.ttl), m_levels, *m_ports.log);
      } catch (const Error& e) {
        Log(2, "The " + ProtocolName(key.protocol) + " universes on " +
                   InterfaceText(key.interfaceName) + " stay off: " + e.Description());
        continue;
      }
    }
    uint16_t defaultPort = key.protocol == DMXProtocol::kE131 ? kE131Port : kArtNetPort;
    std::vector<DMXStreamConfig> streams;
    for (const PlannedUniverse* u : universes) {
      DMXStreamConfig stream;
      stream.universe = u->universe;
      stream.priority = u->priority;
      stream.slots = u->slots;
      if (u->destination.empty()) {
        if (key.protocol == DMXProtocol::kE131) {
          uint32_t n = static_cast<uint32_t>(u->universe);
          stream.destination = {{239, 255, static_cast<uint8_t>(n >> 8), static_cast<uint8_t>(n)},
                                kE131Port};
        } else {
          stream.destination = output->Sender().BroadcastAddress(kArtNetPort);
        }
      } else {
        if (!ParseIPv4Endpoint(u->destination, defaultPort, stream.destination)) {
          IPv4Endpoint resolved;
          if (!m_ports.network->Resolve(u->destination, resolved)) {
            Log(2, DescribeUniverse(*u) + ": the destination \"" + u->destination +
                       "\" cannot be found; it stays off");
            continue;
          }
          stream.destination = resolved;
          if (stream.destination.port == 0) stream.destination.port = defaultPort;
        }
        if (!stream.destination.IsMulticast()) {
          std::string why = output->Sender().CheckDestination(stream.destination);
          if (!why.empty()) {
            Log(2, DescribeUniverse(*u) + ": " + stream.destination.ToString() +
                       " cannot be reached from " + InterfaceText(key.interfaceName) + " (" + why +
                       "); it stays off");
            continue;
          }
        }
      }
      streams.push_back(stream);
    }
    output->Configure(settings, streams);
    outputs[key] = std::move(output);
  }
  // Outputs no entry uses any more end cleanly.
  for (auto& [key, output] : m_udp) {
    output->Close();
    OutputCounters c = output->Counters();
    m_closedCounters.packetsSent += c.packetsSent;
    m_closedCounters.packetsDropped += c.packetsDropped;
  }
  m_udp = std::move(outputs);
}

void ChannelIOControl::ConfigureListener(const NetworkPreferences& prefs) {
  const DMXListenerPrefs& l = prefs.Listener();
  if (m_receiver && l == m_listenerPrefs && m_listener &&
      m_listener->GetSettings().ownCid == m_cid) {
    return;
  }
  m_receiver.reset();
  m_listener.reset();
  m_listenerPrefs = l;
  if (!l.Enabled()) return;
  DMXListener::Settings settings;
  settings.protocol =
      l.Transport() == DMXTransport::kArtNet ? DMXProtocol::kArtNet : DMXProtocol::kE131;
  settings.universe = l.Universe();
  settings.firstSlot = l.FirstSlot();
  settings.slotCount = l.SlotCount();
  settings.threshold = static_cast<uint8_t>(std::clamp(l.Threshold(), 1, 255));
  settings.ownCid = m_cid;
  std::string name = "The DMX listener (" + ProtocolName(settings.protocol) + " universe " +
                     std::to_string(l.Universe()) + ")";
  bool serial = l.Transport() == DMXTransport::kUSBPro || l.Transport() == DMXTransport::kOpenDMX;
  bool universeOk = settings.protocol == DMXProtocol::kE131
                        ? l.Universe() >= kE131MinUniverse && l.Universe() <= kE131MaxUniverse
                        : l.Universe() >= 0 && l.Universe() <= kArtNetMaxPortAddress;
  std::string problem;
  if (serial) {
    problem = "listens over E1.31 or Art-Net only";
  } else if (!universeOk) {
    problem = "has its universe out of range";
  } else if (l.FirstSlot() < 1 || l.FirstSlot() > kDMXSlots || l.SlotCount() < 1) {
    problem = "has its slots out of range";
  } else if (l.Port() < 0 || l.Port() > 65535) {
    problem = "has its port out of range";
  }
  if (!problem.empty()) {
    Log(2, name + " " + problem + "; inputs from it stay off");
    return;
  }
  uint16_t port = static_cast<uint16_t>(l.Port() != 0                             ? l.Port()
                                        : settings.protocol == DMXProtocol::kE131 ? kE131Port
                                                                                  : kArtNetPort);
  std::optional<IPv4Endpoint> group;
  if (settings.protocol == DMXProtocol::kE131) {
    uint32_t n = static_cast<uint32_t>(l.Universe());
    group = IPv4Endpoint{{239, 255, static_cast<uint8_t>(n >> 8), static_cast<uint8_t>(n)}, port};
  }
  m_listener = std::make_unique<DMXListener>(settings);
  try {
    m_receiver = m_ports.network->OpenReceiver(
        l.Interface(), port, group,
        [this](std::span<const ReceivedDatagram> datagrams) { OnDatagrams(datagrams); });
  } catch (const Error& e) {
    m_listener.reset();
    Log(2, name + " cannot listen: " + e.Description() + "; inputs from it stay off");
  }
}

// --- Inputs ---

void ChannelIOControl::RegisterInput(int32_t network, int32_t unitId, int32_t inputNumber,
                                     const std::string& name) {
  m_inputs[{network, unitId, inputNumber}] = name;
}

void ChannelIOControl::ClearInputs() {
  m_inputs.clear();
}

void ChannelIOControl::SetOnInput(std::function<void(const ChannelInputEvent&)> onInput) {
  m_onInput = std::move(onInput);
}

bool ChannelIOControl::InjectInput(int32_t network, int32_t unitId, int32_t inputNumber) {
  auto it = m_inputs.find({network, unitId, inputNumber});
  if (it == m_inputs.end()) return false;
  DispatchInputs({{network, unitId, inputNumber, it->second}});
  return true;
}

void ChannelIOControl::DispatchInputs(const std::vector<ChannelInputEvent>& events) {
  for (const ChannelInputEvent& event : events) {
    ++m_stats.inputsFired;
    if (m_onInput) m_onInput(event);
  }
}

void ChannelIOControl::OnDatagrams(std::span<const ReceivedDatagram> datagrams) {
  if (!m_listener) return;
  uint32_t now = m_ports.clock->TickCount();
  m_pressed.clear();
  for (const ReceivedDatagram& datagram : datagrams) m_listener->Receive(datagram, now, m_pressed);
  if (m_pressed.empty()) return;
  // Collected first: a handler may register, clear or even release.
  std::vector<ChannelInputEvent> events;
  for (int32_t slot : m_pressed) {
    auto it = m_inputs.find({m_listenerPrefs.Network(), m_listenerPrefs.Unit(), slot});
    if (it != m_inputs.end())
      events.push_back({m_listenerPrefs.Network(), m_listenerPrefs.Unit(), slot, it->second});
  }
  DispatchInputs(events);
}

// --- Light events ---

uint32_t ChannelIOControl::Due(uint32_t dueTick) const {
  uint32_t now = m_ports.clock->TickCount();
  if (TickDistance(now, dueTick) > kMaxLeadMs) dueTick = now;
  // A write never lands in a frame before one already accumulated, so a
  // later write always wins: lights-off events of a stopped sequence come
  // due "now" while its next frame may already wait a few milliseconds on.
  std::optional<uint32_t> last = m_queue.LastDue();
  if (last && TickBefore(dueTick, *last)) dueTick = *last;
  return dueTick;
}

void ChannelIOControl::OutputEffect(int32_t devType, int32_t lNetwork, uint8_t byteUnit,
                                    int32_t lCircuit, const std::string&, int32_t effectType,
                                    int32_t lDuration, int32_t lStartIntensity,
                                    int32_t lEndIntensity, int32_t, uint32_t dueTick) {
  EffectCommand command;
  command.channel = {devType, lNetwork, devType == kFamilyTAV ? byteUnit : 0, lCircuit};
  command.effectType = effectType;
  command.durationMs = lDuration;
  command.startPercent = lStartIntensity;
  command.endPercent = lEndIntensity;
  m_queue.AddEffect(Due(dueTick), command);
}

void ChannelIOControl::OutputDMXLevels(int32_t lUniverse, int32_t nStartSlot, int32_t nCount,
                                       const uint8_t* levels, uint32_t dueTick) {
  m_queue.AddLevels(FrameWrite::Kind::kDMXLevels, Due(dueTick), lUniverse, 0, nStartSlot, levels,
                    nCount);
}

void ChannelIOControl::OutputTAVLevels(int32_t lNetwork, uint8_t byteUnit, int32_t nStartCircuit,
                                       int32_t nCount, const uint8_t* levels, uint32_t dueTick) {
  m_queue.AddLevels(FrameWrite::Kind::kTAVLevels, Due(dueTick), lNetwork, byteUnit, nStartCircuit,
                    levels, nCount);
}

void ChannelIOControl::SendAccumulated(uint32_t) {
  // Each write already sits in the frame of its own due tick; sealing makes
  // them sendable. A frame whose tick has passed goes out now.
  m_queue.SealAll();
  auto next = m_queue.NextSealedDue();
  if (next && !TickBefore(m_ports.clock->TickCount(), *next)) {
    Service();
  } else {
    Arm();
  }
}

// --- Frames ---

void ChannelIOControl::ApplyFrame(const Frame& frame) {
  for (const FrameWrite& write : frame.writes) {
    switch (write.kind) {
      case FrameWrite::Kind::kDMXLevels:
        m_levels.WriteDMX(write.network, write.first, frame.bytes.data() + write.offset,
                          write.count);
        m_effects.Cancel(kFamilyDMX, write.network, 0, write.first, write.count);
        break;
      case FrameWrite::Kind::kTAVLevels:
        m_levels.WriteTAV(write.network, write.unit, write.first, frame.bytes.data() + write.offset,
                          write.count);
        m_effects.Cancel(kFamilyTAV, write.network, write.unit, write.first, write.count);
        break;
      case FrameWrite::Kind::kEffect:
        m_effects.Start(write.effect, write.dueTick);
        break;
    }
  }
}

void ChannelIOControl::MapTAVOntoDMX() {
  if (m_tavMappings.empty()) return;
  for (const auto& [key, unit] : m_levels.TAVUnits()) {
    auto mapping = m_tavMappings.find(key.first);
    if (mapping == m_tavMappings.end() || key.second < 1) continue;
    uint64_t& mapped = m_tavMapped[key];
    if (mapped == unit.version) continue;
    mapped = unit.version;
    const TAVMapping& m = mapping->second;
    int64_t first = m.startSlot + int64_t{key.second - 1} * m.circuitsPerUnit;
    if (first > kDMXSlots) continue;
    int32_t count = std::min<int32_t>(static_cast<int32_t>(unit.levels.size()), m.circuitsPerUnit);
    m_levels.WriteDMX(m.universe, static_cast<int32_t>(first), unit.levels.data(), count);
  }
}

void ChannelIOControl::Service() {
  // A handler called from here (a frame observer, an output) may call back
  // in (seal more frames, keep alive): that asks for one more round after
  // this one rather than running inside it.
  if (m_inService) {
    m_serviceAgain = true;
    return;
  }
  m_inService = true;
  do {
    m_serviceAgain = false;
    ServiceOnce();
  } while (m_serviceAgain);
  m_inService = false;
  Arm();
}

void ChannelIOControl::ServiceOnce() {
  uint32_t now = m_ports.clock->TickCount();
  std::vector<Frame> due;
  due.swap(m_due);  // after any frames a release put there
  m_queue.TakeDue(now, due);
  if (!due.empty()) {
    // Frames that fell due together leave one after the other, in order,
    // so a late frame is never lost nor held behind a newer one.
    for (const Frame& frame : due) {
      ApplyFrame(frame);
      SendFrame(frame.dueTick, now);
    }
    m_queue.Recycle(due);
  } else if (m_refreshDue && !TickBefore(now, *m_refreshDue)) {
    SendFrame(*m_refreshDue, now);
  } else {
    SendToOutputs(now, false);
  }
  due.swap(m_due);  // keeps the vector's capacity
}

void ChannelIOControl::SendFrame(uint32_t frameTick, uint32_t now) {
  m_effects.Render(frameTick, m_levels);
  MapTAVOntoDMX();
  m_refreshDue.reset();
  if (m_effects.Active()) m_refreshDue = frameTick + m_refreshMs;
  ++m_stats.frames;
  uint32_t lateness = static_cast<uint32_t>(std::max(TickDistance(frameTick, now), 0));
  if (lateness >= kLateMs) ++m_stats.framesLate;
  m_stats.maxLatenessMs = std::max(m_stats.maxLatenessMs, lateness);
  SendToOutputs(now, true);
  if (m_onFrameSent) m_onFrameSent(frameTick);
}

void ChannelIOControl::SendToOutputs(uint32_t now, bool newFrame) {
  if (!m_setUp) return;
  OutputFrame frame{m_levels, now, newFrame, !m_lightsActive};
  for (auto& [key, output] : m_udp) output->Send(frame);
  for (auto& [index, output] : m_widgets) output->Send(frame);
  for (auto& [index, output] : m_tavSerial) output->Send(frame);
  if (m_x10) m_x10->Send(frame);
  if (m_fennick) m_fennick->Send(frame);
}

void ChannelIOControl::Arm() {
  std::optional<uint32_t> next = m_queue.NextSealedDue();
  auto consider = [&next](std::optional<uint32_t> tick) {
    if (tick) next = next ? TickMin(*next, *tick) : *tick;
  };
  consider(m_refreshDue);
  if (m_setUp) {
    for (auto& [key, output] : m_udp) consider(output->NextRefresh());
    for (auto& [index, output] : m_widgets) consider(output->NextRefresh());
    for (auto& [index, output] : m_tavSerial) consider(output->NextRefresh());
    if (m_x10) consider(m_x10->NextRefresh());
    if (m_fennick) consider(m_fennick->NextRefresh());
  }
  if (next) {
    m_ports.timer->SetDeadline(*next);
  } else {
    m_ports.timer->Cancel();
  }
}

// --- Observation ---

ChannelIOStatistics ChannelIOControl::Statistics() const {
  ChannelIOStatistics stats = m_stats;
  stats.packetsSent = m_closedCounters.packetsSent;
  stats.packetsDropped = m_closedCounters.packetsDropped;
  auto add = [&stats](const NetworkOutput* output) {
    if (!output) return;
    OutputCounters c = output->Counters();
    stats.packetsSent += c.packetsSent;
    stats.packetsDropped += c.packetsDropped;
  };
  for (const auto& [key, output] : m_udp) add(output.get());
  for (const auto& [index, output] : m_widgets) add(output.get());
  for (const auto& [index, output] : m_tavSerial) add(output.get());
  add(m_x10.get());
  add(m_fennick.get());
  if (m_listener) stats.listener = m_listener->GetCounters();
  return stats;
}

void ChannelIOControl::SetOnFrameSent(std::function<void(uint32_t tick)> onFrameSent) {
  m_onFrameSent = std::move(onFrameSent);
}

size_t ChannelIOControl::OutputCount() const {
  return m_udp.size() + m_widgets.size() + m_tavSerial.size() + (m_x10 ? 1 : 0) +
         (m_fennick ? 1 : 0);
}

}  // namespace tav
