#include "SettingsStore.h"

#include <fmt/format.h>

#include <chrono>
#include <iostream>

#include "CommandRegistry.h"

#include "platform/PlatformPaths.h"

namespace tav::showctl {

FileRegistryStore OpenSettingsStore(const std::string& file) {
  return FileRegistryStore(
      file.empty() ? RegistryFilePath() : file,
      [](const std::string& problem) { std::cerr << "showctl: warning: " << problem << "\n"; });
}

void FinishWriting(FileRegistryStore& store) {
  if (store.WritePendingChanges(std::chrono::seconds(5))) return;
  store.DropPendingChanges();
  throw CommandFailed(fmt::format(
      "could not write {}: another program kept it locked; it was left unchanged", store.Path()));
}

}  // namespace tav::showctl
