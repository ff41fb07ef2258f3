#include "SettingsStore.h"

#include <iostream>

#include "platform/PlatformPaths.h"

namespace tav::showctl {

FileRegistryStore OpenSettingsStore(const std::string& file) {
  return FileRegistryStore(
      file.empty() ? RegistryFilePath() : file,
      [](const std::string& problem) { std::cerr << "showctl: warning: " << problem << "\n"; });
}

}  // namespace tav::showctl
