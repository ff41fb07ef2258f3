#pragma once
// The TextFileStore of the local file system, for the schedule files. Writes
// replace the file whole (ReplaceFileContents), so a crash or a full disk
// leaves the previous file intact. An existing file keeps its permissions.

#include "schedule/TextFileStore.h"

namespace tav {

class LocalTextFiles : public TextFileStore {
 public:
  std::optional<std::string> ReadText(const std::string& path) override;
  void WriteText(const std::string& path, std::string_view text) override;
};

}  // namespace tav
