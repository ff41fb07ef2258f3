#pragma once
// The network preferences as showctl shows them to people: the sixteen TAV
// networks and the DMX universes as tables, the other parts as one value a
// line. Empty texts read "-", numbers that mean "none" say so. Pure
// functions of the preferences; each text ends with a newline.

#include <cstdint>
#include <string>

#include "config/NetworkPreferences.h"

namespace tav::showctl {

std::string TAVNetworksTable(const NetworkPreferences& prefs);
// One TAV network (0-15), a value a line.
std::string TAVNetworkText(const NetworkPreferences& prefs, int32_t network);
std::string DMXUniversesTable(const NetworkPreferences& prefs);
std::string X10Text(const NetworkPreferences& prefs);
std::string FennickText(const NetworkPreferences& prefs);
std::string ListenerText(const NetworkPreferences& prefs);
std::string OutputText(const NetworkPreferences& prefs);
// Everything above, each part under its heading.
std::string NetworkPreferencesText(const NetworkPreferences& prefs);

}  // namespace tav::showctl
