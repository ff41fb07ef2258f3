#include "UserData.h"

#include <optional>

#include "SettingsStore.h"
#include "config/Settings.h"
#include "platform/PlatformPaths.h"

namespace tav::showctl {

std::string UserDataFolder() {
  static std::optional<std::string> folder;
  if (!folder) {
    FileRegistryStore store = OpenSettingsStore("");
    Settings settings(store, SystemPathDefaults());
    folder = settings.UserDataPath();
  }
  return *folder;
}

}  // namespace tav::showctl
