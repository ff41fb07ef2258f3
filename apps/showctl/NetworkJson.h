#pragma once
// The network preferences as JSON for scripts: one member per registry value,
// named as in the settings file (docs/network-preferences.md), the TAV
// networks and DMX universes as arrays in their order, and the warnings
// showctl would print. Pure; the members keep a fixed order.

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "config/NetworkPreferences.h"

namespace tav::showctl {

nlohmann::ordered_json NetworkPreferencesJson(const NetworkPreferences& prefs,
                                              const std::vector<std::string>& warnings);

}  // namespace tav::showctl
