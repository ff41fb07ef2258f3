#include "SettingsStore.h"

#include <iostream>
#include <set>

#include "platform/PlatformPaths.h"

namespace tav::showctl {

FileRegistryStore OpenSettingsStore(const std::string& file) {
  // Several commands open the file more than once (the user data folder is
  // read from it too); a damaged line is worth one warning.
  return FileRegistryStore(file.empty() ? RegistryFilePath() : file,
                           [](const std::string& problem) {
                             static std::set<std::string> reported;
                             if (reported.insert(problem).second)
                               std::cerr << "showctl: warning: " << problem << "\n";
                           });
}

}  // namespace tav::showctl
