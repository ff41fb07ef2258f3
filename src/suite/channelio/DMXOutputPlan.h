#pragma once
// Which DMX universes of the network preferences go out over UDP, and how:
// the entries that are enabled, in range and not repeated, with the problem
// of every other entry as one log line. Pure; the control opens the senders
// and resolves the destinations afterwards.
//
// An entry is left out (and named in `problems`) when its universe is out of
// the transport's range (E1.31 1-63999, Art-Net 0-32767), its size is not
// 1-512, its priority is above 200, or an earlier entry already sends the
// same universe the same way to the same destination. Serial transports are
// listed apart for the serial transmitters.

#include <cstdint>
#include <string>
#include <vector>

#include "config/NetworkPreferences.h"
#include "suite/channelio/DMXProtocol.h"

namespace tav {

struct PlannedUniverse {
  int32_t entry = 0;  // 1-based place in the preferences' list
  DMXProtocol protocol = DMXProtocol::kE131;
  std::string interfaceName;
  int32_t universe = 1;
  std::string destination;  // as written; "": multicast (E1.31) or broadcast (Art-Net)
  uint8_t priority = 100;
  uint16_t slots = 512;
};

struct DMXOutputPlan {
  std::vector<PlannedUniverse> udp;
  std::vector<int32_t> serialEntries;  // 0-based indexes of USB widget entries
  std::vector<std::string> problems;
};

DMXOutputPlan PlanDMXOutputs(const NetworkPreferences& prefs);
// "DMX universe 5 (E1.31, entry 2)", for log lines.
std::string DescribeUniverse(const PlannedUniverse& universe);

}  // namespace tav
