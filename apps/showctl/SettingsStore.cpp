#include "SettingsStore.h"

#include <fmt/format.h>

#include <chrono>
#include <iostream>
#include <set>

#include "CommandRegistry.h"

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

void FinishWriting(FileRegistryStore& store) {
  if (store.WritePendingChanges(std::chrono::seconds(5))) return;
  store.DropPendingChanges();
  throw CommandFailed(fmt::format(
      "could not write {}: another program kept it locked; it was left unchanged", store.Path()));
}

}  // namespace tav::showctl
