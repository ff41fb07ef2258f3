#pragma once
// Where the program's files live on Unix, from the environment: the settings
// file and the folders the settings fall back to. Read at each call; the
// entry point asks once and hands the answers on.

#include <string>

#include "config/Settings.h"

namespace tav {

// $TAV_REGISTRY_FILE, else $XDG_CONFIG_HOME/tessavar/registry.reg, else
// ~/.config/tessavar/registry.reg. XDG variables that are empty or not
// absolute are ignored, as the XDG rules say.
std::string RegistryFilePath();

// The user data folder ($XDG_DATA_HOME/tessavar/, else
// ~/.local/share/tessavar/), the folder of the running program, and '/'.
PathDefaults SystemPathDefaults();

}  // namespace tav
