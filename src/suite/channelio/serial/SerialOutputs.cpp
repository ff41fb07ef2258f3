#include "suite/channelio/serial/SerialOutputs.h"

#include <algorithm>
#include <string>
#include <vector>

#include "suite/channelio/serial/DimmerTransmitter.h"
#include "suite/channelio/serial/SerialNetworkSettings.h"
#include "suite/channelio/serial/UsbDmxTransmitter.h"
#include "suite/channelio/serial/X10Transmitter.h"

namespace tav {
namespace {

// Fills `out` with the network's levels; zeros where nothing was written.
using Gather = std::function<void(const LevelBuffers&, std::vector<uint8_t>& out)>;

// Levels that resend their whole state (dimmer chains, DMX widgets): the
// transmitter gets them when they differ from what it got last.
template <typename Transmitter>
class FrameOutput : public NetworkOutput {
 public:
  FrameOutput(std::string name, std::unique_ptr<Transmitter> transmitter, size_t count,
              Gather gather)
      : m_name(std::move(name)),
        m_transmitter(std::move(transmitter)),
        m_levels(count, 0),
        m_gather(std::move(gather)) {}

  std::string Name() const override { return m_name; }
  void Send(const OutputFrame& frame) override {
    if (frame.dark) {
      std::fill(m_levels.begin(), m_levels.end(), 0);
    } else {
      m_gather(frame.levels, m_levels);
    }
    if (m_started && m_levels == m_sent) return;
    m_started = true;
    m_sent = m_levels;
    m_transmitter->SendLevels(m_levels);
  }
  std::optional<uint32_t> NextRefresh() const override { return std::nullopt; }
  void Close() override {}
  OutputCounters Counters() const override {
    const FrameSenderCounters& c = m_transmitter->Sender().Counters();
    return {c.framesSent, c.refused};
  }

 private:
  std::string m_name;
  std::unique_ptr<Transmitter> m_transmitter;
  std::vector<uint8_t> m_levels;
  std::vector<uint8_t> m_sent;
  bool m_started = false;
  Gather m_gather;
};

class X10Output : public NetworkOutput {
 public:
  X10Output(std::string name, std::unique_ptr<X10Transmitter> x10)
      : m_name(std::move(name)), m_x10(std::move(x10)) {}

  std::string Name() const override { return m_name; }
  void Send(const OutputFrame& frame) override {
    if (frame.dark) {
      m_x10->SetLevels(std::vector<uint8_t>(kX10Houses * kX10Units, 0));
    } else {
      m_x10->SetLevels(frame.levels.X10().levels);
    }
  }
  std::optional<uint32_t> NextRefresh() const override { return std::nullopt; }
  void Close() override {}
  OutputCounters Counters() const override { return {m_x10->Counters().transmissions, 0}; }

 private:
  std::string m_name;
  std::unique_ptr<X10Transmitter> m_x10;
};

void CopyLevels(const std::vector<uint8_t>& from, std::vector<uint8_t>& to, size_t at,
                size_t count) {
  const size_t n = std::min(count, from.size());
  std::copy_n(from.begin(), n, to.begin() + static_cast<ptrdiff_t>(at));
  std::fill_n(to.begin() + static_cast<ptrdiff_t>(at + n), count - n, 0);
}

}  // namespace

SerialOutputs::SerialOutputs(const SerialOutputPorts& ports, InputSink onInput)
    : m_ports(ports), m_onInput(std::move(onInput)) {}

std::unique_ptr<NetworkOutput> SerialOutputs::OpenTAVNetwork(int32_t network,
                                                             const TAVNetworkPreferences& prefs,
                                                             LevelBuffers&) {
  DimmerNetworkSettings settings = TAVSerialNetworkSettings(network - 1, prefs);
  auto link = m_ports.opener->Open(settings.serial);
  const std::string name = settings.name + " on " + settings.serial.path;
  const size_t units = static_cast<size_t>(settings.layout.boards);
  const size_t circuits = static_cast<size_t>(settings.layout.channelsPerBoard);
  auto transmitter = std::make_unique<DimmerTransmitter>(
      std::move(settings), std::move(link), *m_ports.timers, *m_ports.clock, *m_ports.log);
  return std::make_unique<FrameOutput<DimmerTransmitter>>(
      name, std::move(transmitter), units * circuits,
      [network, units, circuits](const LevelBuffers& levels, std::vector<uint8_t>& out) {
        const auto& all = levels.TAVUnits();
        for (size_t u = 0; u < units; ++u) {
          auto it = all.find({network, static_cast<int32_t>(u + 1)});
          static const std::vector<uint8_t> kNone;
          CopyLevels(it == all.end() ? kNone : it->second.levels, out, u * circuits, circuits);
        }
      });
}

std::unique_ptr<NetworkOutput> SerialOutputs::OpenFennick(const std::string& port,
                                                          const FennickPreferences& prefs,
                                                          LevelBuffers&) {
  DimmerNetworkSettings settings = FennickNetworkSettings(port, prefs);
  auto link = m_ports.opener->Open(settings.serial);
  const std::string name = settings.name + " on " + port;
  const size_t count = static_cast<size_t>(settings.layout.boards) *
                       static_cast<size_t>(settings.layout.channelsPerBoard);
  auto transmitter = std::make_unique<DimmerTransmitter>(
      std::move(settings), std::move(link), *m_ports.timers, *m_ports.clock, *m_ports.log);
  return std::make_unique<FrameOutput<DimmerTransmitter>>(
      name, std::move(transmitter), count,
      [count](const LevelBuffers& levels, std::vector<uint8_t>& out) {
        const auto& networks = levels.FennickNetworks();
        auto it = networks.find(1);
        static const std::vector<uint8_t> kNone;
        CopyLevels(it == networks.end() ? kNone : it->second.levels, out, 0, count);
      });
}

std::unique_ptr<NetworkOutput> SerialOutputs::OpenX10(const std::string& port,
                                                      const NetworkPreferences& prefs,
                                                      LevelBuffers&) {
  X10NetworkSettings settings = X10SettingsFor(prefs);
  settings.path = port;
  auto link = m_ports.opener->Open(X10Transmitter::PortSettings(settings));
  auto x10 = std::make_unique<X10Transmitter>(settings, std::move(link), *m_ports.timers,
                                              *m_ports.clock, *m_ports.log);
  if (m_onInput) {
    x10->SetOnReceived([onInput = m_onInput](const X10Received& received) {
      if (received.function == X10Function::kOn && received.unit != 0)
        onInput(kX10InputNetwork, received.house, received.unit);
    });
  }
  return std::make_unique<X10Output>("X10 network on " + port, std::move(x10));
}

std::unique_ptr<NetworkOutput> SerialOutputs::OpenDMXWidget(const DMXUniversePrefs& prefs,
                                                            LevelBuffers&) {
  UsbDmxSettings settings;
  settings.name = "DMX universe " + std::to_string(prefs.Universe());
  settings.path = prefs.Port();
  settings.widget =
      prefs.Transport() == DMXTransport::kOpenDMX ? UsbDmxWidget::kOpenDMX : UsbDmxWidget::kPro;
  settings.slots = prefs.Size();
  auto link = m_ports.opener->Open(UsbDmxTransmitter::PortSettings(settings));
  const std::string name = DMXTransportName(prefs.Transport()) + " on " + prefs.Port();
  const int32_t universe = prefs.Universe();
  const size_t slots = static_cast<size_t>(std::clamp(prefs.Size(), 1, kDMXSlots));
  auto transmitter = std::make_unique<UsbDmxTransmitter>(settings, std::move(link), *m_ports.timers,
                                                         *m_ports.clock, *m_ports.log);
  return std::make_unique<FrameOutput<UsbDmxTransmitter>>(
      name, std::move(transmitter), slots,
      [universe, slots](const LevelBuffers& levels, std::vector<uint8_t>& out) {
        const DMXLevels* buffer = levels.FindUniverse(universe);
        if (!buffer) {
          std::fill(out.begin(), out.end(), 0);
          return;
        }
        std::copy_n(buffer->slots.begin(), slots, out.begin());
      });
}

}  // namespace tav
