#pragma once
// What the network preferences mean for the serial networks: the frame
// layout and line settings of a Fennick chain and of a TAV network on a
// serial port, and the X10 interface's settings.
//
// TAV networks: each unit is one board address, its circuits the board's
// channels, at the network's speed and stop bits. The two variants:
//  - Enhanced controllers take a header before every unit ("7E 80+u"), so a
//    unit that missed a byte finds its place again within the same frame.
//  - Old-MCP controllers predate the escape codes: values 0x7D-0x7F are
//    clamped to a neighbour instead of escaped.
//
// Pure: reads preferences, builds settings.

#include <string>

#include "config/NetworkPreferences.h"
#include "suite/channelio/serial/DimmerTransmitter.h"
#include "suite/channelio/serial/X10Transmitter.h"

namespace tav {

DimmerNetworkSettings FennickNetworkSettings(const std::string& port,
                                             const FennickPreferences& prefs);
// `network` is 0-15, named "TAV network <network + 1>" in log lines.
DimmerNetworkSettings TAVSerialNetworkSettings(int32_t network, const TAVNetworkPreferences& prefs);
X10NetworkSettings X10SettingsFor(const NetworkPreferences& prefs);

}  // namespace tav
