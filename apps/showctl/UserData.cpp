#include "UserData.h"

#include "config/Settings.h"
#include "platform/FileRegistryStore.h"
#include "platform/PlatformPaths.h"

namespace tav::showctl {

std::string UserDataFolder() {
  FileRegistryStore store(RegistryFilePath());
  Settings settings(store, SystemPathDefaults());
  return settings.UserDataPath();
}

}  // namespace tav::showctl
