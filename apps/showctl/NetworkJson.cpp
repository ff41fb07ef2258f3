#include "NetworkJson.h"

namespace tav::showctl {

using nlohmann::ordered_json;

nlohmann::ordered_json NetworkPreferencesJson(const NetworkPreferences& prefs,
                                              const std::vector<std::string>& warnings) {
  ordered_json tav = ordered_json::array();
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const TAVNetworkPreferences& t = prefs.TAVNetwork(i);
    tav.push_back({{"Network", i},
                   {"Port", t.Port()},
                   {"Speed", t.Speed()},
                   {"OldMCP", t.OldMCP()},
                   {"Enhanced", t.Enhanced()},
                   {"UnitCount", t.UnitCount()},
                   {"CircuitsPerUnit", t.CircuitsPerUnit()},
                   {"StopBits", t.StopBits()},
                   {"DMXUniverse", t.DMXUniverse()},
                   {"DMXStartSlot", t.DMXStartSlot()}});
  }
  ordered_json dmx = ordered_json::array();
  for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
    const DMXUniversePrefs& u = prefs.DMXUniverse(i);
    dmx.push_back({{"Universe", u.Universe()},
                   {"Transport", DMXTransportName(u.Transport())},
                   {"Destination", u.Destination()},
                   {"Interface", u.Interface()},
                   {"Priority", u.Priority()},
                   {"StartChannel", u.StartChannel()},
                   {"Size", u.Size()},
                   {"Port", u.Port()},
                   {"Enabled", u.Enabled()}});
  }
  const FennickPreferences& f = prefs.Fennick();
  const DMXListenerPrefs& l = prefs.Listener();
  return {{"TAV", tav},
          {"DMX", dmx},
          {"X10Port", prefs.X10Port()},
          {"X10HouseCodes", prefs.X10HouseCodes()},
          {"FennickPort", prefs.FennickPort()},
          {"Fennick",
           {{"Speed", f.Speed()},
            {"StopBits", f.StopBits()},
            {"Boards", f.Boards()},
            {"ChannelsPerBoard", f.ChannelsPerBoard()},
            {"HeaderPerBank", f.HeaderPerBank()},
            {"ClampSpecialValues", f.ClampSpecialValues()}}},
          {"Listener",
           {{"Enabled", l.Enabled()},
            {"Transport", DMXTransportName(l.Transport())},
            {"Universe", l.Universe()},
            {"Interface", l.Interface()},
            {"FirstSlot", l.FirstSlot()},
            {"SlotCount", l.SlotCount()},
            {"Threshold", l.Threshold()},
            {"Network", l.Network()},
            {"Unit", l.Unit()}}},
          {"SourceName", prefs.SourceName()},
          {"MulticastTTL", prefs.MulticastTTL()},
          {"SyncUniverse", prefs.SyncUniverse()},
          {"RefreshRate", prefs.RefreshRate()},
          {"SourceCID", prefs.SourceCID()},
          {"Warnings", warnings}};
}

}  // namespace tav::showctl
