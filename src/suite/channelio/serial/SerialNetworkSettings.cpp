#include "suite/channelio/serial/SerialNetworkSettings.h"

namespace tav {

DimmerNetworkSettings FennickNetworkSettings(const std::string& port,
                                             const FennickPreferences& prefs) {
  DimmerNetworkSettings settings;
  settings.name = "Fennick network";
  settings.serial.path = port;
  settings.serial.baud = prefs.Speed();
  settings.serial.stopBits = prefs.StopBits();
  settings.layout.boards = prefs.Boards();
  settings.layout.channelsPerBoard = prefs.ChannelsPerBoard();
  settings.layout.addressing =
      prefs.HeaderPerBank() ? DimmerAddressing::kHeaderPerBoard : DimmerAddressing::kOneHeader;
  settings.layout.specials =
      prefs.ClampSpecialValues() ? DimmerSpecialValues::kClamp : DimmerSpecialValues::kEscape;
  return settings;
}

DimmerNetworkSettings TAVSerialNetworkSettings(int32_t network,
                                               const TAVNetworkPreferences& prefs) {
  DimmerNetworkSettings settings;
  settings.name = "TAV network " + std::to_string(network + 1);
  settings.serial.path = prefs.Port();
  settings.serial.baud = prefs.Speed();
  settings.serial.stopBits = prefs.StopBits();
  settings.layout.boards = prefs.UnitCount();
  settings.layout.channelsPerBoard = prefs.CircuitsPerUnit();
  settings.layout.addressing =
      prefs.Enhanced() ? DimmerAddressing::kHeaderPerBoard : DimmerAddressing::kOneHeader;
  settings.layout.specials =
      prefs.OldMCP() ? DimmerSpecialValues::kClamp : DimmerSpecialValues::kEscape;
  return settings;
}

X10NetworkSettings X10SettingsFor(const NetworkPreferences& prefs) {
  X10NetworkSettings settings;
  settings.path = prefs.X10Port();
  settings.houseCodes = prefs.X10HouseCodes().empty() ? "A" : prefs.X10HouseCodes();
  return settings;
}

}  // namespace tav
