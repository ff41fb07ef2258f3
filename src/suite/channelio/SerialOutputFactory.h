#pragma once
// Port: the serial transmitters (TAV controller networks, an X10 interface,
// the Fennick boards, DMX USB widgets). They are NetworkOutputs like the
// UDP universes and receive the same frames; this factory makes them when
// a network is opened. Without a factory the control keeps the levels of
// these networks (the terminal view shows them) and logs that nothing
// transmits them.
//
// Each call opens the port and returns the output, or throws tav::Error:
// kErrorPortAlreadyOpen (8005) when another program holds the port.

#include <cstdint>
#include <memory>
#include <string>

#include "config/NetworkPreferences.h"
#include "suite/channelio/LevelBuffers.h"
#include "suite/channelio/NetworkOutput.h"

namespace tav {

class SerialOutputFactory {
 public:
  virtual ~SerialOutputFactory() = default;
  // `network` counts from 1 as the light events do (preferences index + 1).
  virtual std::unique_ptr<NetworkOutput> OpenTAVNetwork(int32_t network,
                                                        const TAVNetworkPreferences& prefs,
                                                        LevelBuffers& levels) = 0;
  virtual std::unique_ptr<NetworkOutput> OpenX10(const std::string& port,
                                                 const NetworkPreferences& prefs,
                                                 LevelBuffers& levels) = 0;
  virtual std::unique_ptr<NetworkOutput> OpenFennick(const std::string& port,
                                                     const FennickPreferences& prefs,
                                                     LevelBuffers& levels) = 0;
  virtual std::unique_ptr<NetworkOutput> OpenDMXWidget(const DMXUniversePrefs& prefs,
                                                       LevelBuffers& levels) = 0;
};

}  // namespace tav
