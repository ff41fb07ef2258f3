#pragma once
// The serial transmitters as outputs of the hardware-I/O control: the
// factory the control asks for a TAV network on a serial port, the X10
// interface, the Fennick boards or a DMX USB widget, and the outputs it
// makes. Each output reads its network's levels from the control's level
// buffers whenever the control sends (a frame, or a refresh), hands them to
// its transmitter when they changed, and leaves pacing, refreshing and
// reopening to the transmitter, which keeps its own timers.
//
// What each output reads:
//  - Fennick: Fennick network 1, channels 1 to Boards x ChannelsPerBoard.
//  - TAV network n: units 1 to UnitCount, circuits 1 to CircuitsPerUnit of
//    each; unit u is board u on the line.
//  - X10: the house and unit grid. Commands the interface hears come back
//    as inputs: network kX10InputNetwork, unit = house (1-16 for A-P),
//    input = unit (1-16), when the unit is switched On.
//  - DMX widget: the universe's slots, 1 to Size.
// When the control asks for dark, zeros go out and the levels come back
// when it clears.
//
// Owned by the composition root beside the control; the ports must outlive
// it and every output it made.

#include <cstdint>
#include <functional>
#include <memory>

#include "ports/Clock.h"
#include "ports/MessageLog.h"
#include "ports/TimerService.h"
#include "suite/channelio/SerialOutputFactory.h"
#include "suite/channelio/serial/SerialLink.h"

namespace tav {

// The trigger network of X10 inputs: one past the sixteen TAV networks.
inline constexpr int32_t kX10InputNetwork = 17;

struct SerialOutputPorts {
  SerialPortOpener* opener = nullptr;
  TimerService* timers = nullptr;
  const Clock* clock = nullptr;
  MessageLog* log = nullptr;
};

class SerialOutputs : public SerialOutputFactory {
 public:
  // Called with each input an X10 interface reports (the control's
  // InjectInput).
  using InputSink = std::function<void(int32_t network, int32_t unit, int32_t input)>;

  explicit SerialOutputs(const SerialOutputPorts& ports, InputSink onInput = nullptr);

  std::unique_ptr<NetworkOutput> OpenTAVNetwork(int32_t network, const TAVNetworkPreferences& prefs,
                                                LevelBuffers& levels) override;
  std::unique_ptr<NetworkOutput> OpenX10(const std::string& port, const NetworkPreferences& prefs,
                                         LevelBuffers& levels) override;
  std::unique_ptr<NetworkOutput> OpenFennick(const std::string& port,
                                             const FennickPreferences& prefs,
                                             LevelBuffers& levels) override;
  std::unique_ptr<NetworkOutput> OpenDMXWidget(const DMXUniversePrefs& prefs,
                                               LevelBuffers& levels) override;

 private:
  SerialOutputPorts m_ports;
  InputSink m_onInput;
};

}  // namespace tav
