#include "UserData.h"

#include <iostream>
#include <optional>
#include <set>

#include "config/Settings.h"
#include "platform/FileRegistryStore.h"
#include "platform/PlatformPaths.h"

namespace tav::showctl {

std::string UserDataFolder() {
  static std::optional<std::string> folder;
  if (!folder) {
    FileRegistryStore store(RegistryFilePath(), ReportSettingsProblem);
    Settings settings(store, SystemPathDefaults());
    folder = settings.UserDataPath();
  }
  return *folder;
}

void ReportSettingsProblem(const std::string& problem) {
  static std::set<std::string> reported;
  if (reported.insert(problem).second) std::cerr << "showctl: warning: " << problem << "\n";
}

}  // namespace tav::showctl
