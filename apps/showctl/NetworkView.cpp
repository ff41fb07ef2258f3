#include "NetworkView.h"

#include <fmt/format.h>

#include <algorithm>
#include <vector>

namespace tav::showctl {
namespace {

std::string OrDash(const std::string& text) {
  return text.empty() ? "-" : text;
}

std::string OnOff(bool value) {
  return value ? "on" : "off";
}

std::string Line(const char* label, const std::string& value) {
  return fmt::format("  {:<22}{}\n", label, value);
}

// Columns as wide as their widest cell, two blanks apart, no trailing blanks.
std::string Table(const std::vector<std::vector<std::string>>& rows) {
  std::vector<size_t> widths;
  for (const auto& row : rows) {
    widths.resize(std::max(widths.size(), row.size()));
    for (size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], row[i].size());
  }
  std::string text;
  for (const auto& row : rows) {
    std::string line = " ";
    for (size_t i = 0; i < row.size(); ++i) {
      line += " " + row[i];
      if (i + 1 < row.size()) line += std::string(widths[i] - row[i].size() + 1, ' ');
    }
    text += line + "\n";
  }
  return text;
}

std::string Channels(int32_t start, int32_t size) {
  return fmt::format("{}-{}", start, static_cast<int64_t>(start) + size - 1);
}

std::string DestinationText(const DMXUniversePrefs& u) {
  switch (u.Transport()) {
    case DMXTransport::kE131:
      return u.Destination().empty() ? "multicast" : u.Destination();
    case DMXTransport::kArtNet:
      return u.Destination().empty() ? "broadcast" : u.Destination();
    case DMXTransport::kUSBPro:
    case DMXTransport::kOpenDMX:
      return OrDash(u.Port());
  }
  return "-";
}

}  // namespace

std::string TAVNetworksTable(const NetworkPreferences& prefs) {
  std::vector<std::vector<std::string>> rows = {
      {"NET", "PORT", "SPEED", "OLD-MCP", "ENHANCED", "UNITS", "CIRCUITS", "STOP-BITS", "DMX"}};
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const TAVNetworkPreferences& t = prefs.TAVNetwork(i);
    std::string dmx = t.DMXUniverse() == 0 ? "-"
                                           : fmt::format("universe {} from slot {}",
                                                         t.DMXUniverse(), t.DMXStartSlot());
    rows.push_back({std::to_string(i), OrDash(t.Port()), std::to_string(t.Speed()),
                    OnOff(t.OldMCP()), OnOff(t.Enhanced()), std::to_string(t.UnitCount()),
                    std::to_string(t.CircuitsPerUnit()), std::to_string(t.StopBits()), dmx});
  }
  return Table(rows);
}

std::string TAVNetworkText(const NetworkPreferences& prefs, int32_t network) {
  const TAVNetworkPreferences& t = prefs.TAVNetwork(network);
  std::string text = fmt::format("TAV network {}\n", network);
  text += Line("port", OrDash(t.Port()));
  text += Line("speed", fmt::format("{} baud", t.Speed()));
  text += Line("old MCP", OnOff(t.OldMCP()));
  text += Line("enhanced", OnOff(t.Enhanced()));
  text += Line("units", std::to_string(t.UnitCount()));
  text += Line("circuits per unit", std::to_string(t.CircuitsPerUnit()));
  text += Line("stop bits", std::to_string(t.StopBits()));
  text += Line("DMX universe", t.DMXUniverse() == 0 ? "none" : std::to_string(t.DMXUniverse()));
  text += Line("DMX start slot", std::to_string(t.DMXStartSlot()));
  return text;
}

std::string DMXUniversesTable(const NetworkPreferences& prefs) {
  if (prefs.DMXUniverseCount() == 0) return "  (none)\n";
  std::vector<std::vector<std::string>> rows = {
      {"UNIVERSE", "TRANSPORT", "TO", "INTERFACE", "PRIORITY", "CHANNELS", "ENABLED"}};
  for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
    const DMXUniversePrefs& u = prefs.DMXUniverse(i);
    rows.push_back({std::to_string(u.Universe()), DMXTransportName(u.Transport()),
                    DestinationText(u), OrDash(u.Interface()),
                    u.Transport() == DMXTransport::kE131 ? std::to_string(u.Priority()) : "-",
                    Channels(u.StartChannel(), u.Size()), u.Enabled() ? "yes" : "no"});
  }
  return Table(rows);
}

std::string X10Text(const NetworkPreferences& prefs) {
  std::string text = "X10\n";
  text += Line("port", OrDash(prefs.X10Port()));
  text +=
      Line("house codes", prefs.X10HouseCodes().empty() ? "A (none given)" : prefs.X10HouseCodes());
  return text;
}

std::string FennickText(const NetworkPreferences& prefs) {
  const FennickPreferences& f = prefs.Fennick();
  std::string text = "Fennick\n";
  text += Line("port", OrDash(prefs.FennickPort()));
  text += Line("speed", fmt::format("{} baud", f.Speed()));
  text += Line("stop bits", std::to_string(f.StopBits()));
  text += Line("boards", std::to_string(f.Boards()));
  text += Line("channels per board", std::to_string(f.ChannelsPerBoard()));
  text += Line("header per bank", OnOff(f.HeaderPerBank()));
  text += Line("clamp special values", OnOff(f.ClampSpecialValues()));
  return text;
}

std::string ListenerText(const NetworkPreferences& prefs) {
  const DMXListenerPrefs& l = prefs.Listener();
  std::string text = "DMX listener\n";
  text += Line("enabled", OnOff(l.Enabled()));
  text += Line("transport", DMXTransportName(l.Transport()));
  text += Line("universe", std::to_string(l.Universe()));
  text += Line("interface", OrDash(l.Interface()));
  text += Line("slots", Channels(l.FirstSlot(), l.SlotCount()));
  text += Line("threshold", std::to_string(l.Threshold()));
  text += Line("inputs of", fmt::format("network {}, unit {}", l.Network(), l.Unit()));
  return text;
}

std::string OutputText(const NetworkPreferences& prefs) {
  std::string text = "Output\n";
  text += Line("source name", prefs.SourceName());
  text += Line("multicast TTL", std::to_string(prefs.MulticastTTL()));
  text += Line("sync universe",
               prefs.SyncUniverse() == 0 ? "none" : std::to_string(prefs.SyncUniverse()));
  text += Line("refresh rate", fmt::format("{} frames a second", prefs.RefreshRate()));
  text += Line("source CID",
               prefs.SourceCID().empty() ? "- (made when first needed)" : prefs.SourceCID());
  return text;
}

std::string NetworkPreferencesText(const NetworkPreferences& prefs) {
  return "TAV networks\n" + TAVNetworksTable(prefs) + "\nDMX universes\n" +
         DMXUniversesTable(prefs) + "\n" + X10Text(prefs) + "\n" + FennickText(prefs) + "\n" +
         ListenerText(prefs) + "\n" + OutputText(prefs);
}

}  // namespace tav::showctl
