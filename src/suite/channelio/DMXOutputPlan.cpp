#include "suite/channelio/DMXOutputPlan.h"

#include <set>
#include <tuple>

#include "suite/channelio/ArtNetPacket.h"
#include "suite/channelio/E131Packet.h"

namespace tav {

std::string DescribeUniverse(const PlannedUniverse& u) {
  return "DMX universe " + std::to_string(u.universe) + " (" +
         (u.protocol == DMXProtocol::kE131 ? "E1.31" : "Art-Net") + ", entry " +
         std::to_string(u.entry) + ")";
}

DMXOutputPlan PlanDMXOutputs(const NetworkPreferences& prefs) {
  DMXOutputPlan plan;
  std::set<std::tuple<DMXProtocol, int32_t, std::string, std::string>> seen;
  for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
    const DMXUniversePrefs& entry = prefs.DMXUniverse(i);
    if (!entry.Enabled()) continue;
    if (entry.Transport() == DMXTransport::kUSBPro || entry.Transport() == DMXTransport::kOpenDMX) {
      plan.serialEntries.push_back(i);
      continue;
    }
    PlannedUniverse u;
    u.entry = i + 1;
    u.protocol =
        entry.Transport() == DMXTransport::kArtNet ? DMXProtocol::kArtNet : DMXProtocol::kE131;
    u.interfaceName = entry.Interface();
    u.universe = entry.Universe();
    u.destination = entry.Destination();
    std::string name = DescribeUniverse(u);
    std::string problem;
    if (u.protocol == DMXProtocol::kE131 &&
        (u.universe < kE131MinUniverse || u.universe > kE131MaxUniverse)) {
      problem = "the universe is outside 1-63999";
    } else if (u.protocol == DMXProtocol::kArtNet &&
               (u.universe < 0 || u.universe > kArtNetMaxPortAddress)) {
      problem = "the universe is outside Art-Net's 0-32767";
    } else if (entry.Size() < 1 || entry.Size() > 512) {
      problem = "its size " + std::to_string(entry.Size()) + " is outside 1-512";
    } else if (u.protocol == DMXProtocol::kE131 &&
               (entry.Priority() < 0 || entry.Priority() > kE131MaxPriority)) {
      problem = "its priority " + std::to_string(entry.Priority()) + " is outside 0-200";
    } else if (!seen.insert({u.protocol, u.universe, u.interfaceName, u.destination}).second) {
      problem = "an earlier entry already sends it to the same place";
    }
    if (!problem.empty()) {
      plan.problems.push_back(name + ": " + problem + "; it stays off");
      continue;
    }
    u.priority = static_cast<uint8_t>(entry.Priority());
    u.slots = static_cast<uint16_t>(entry.Size());
    plan.udp.push_back(std::move(u));
  }
  return plan;
}

}  // namespace tav
