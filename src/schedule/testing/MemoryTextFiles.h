#pragma once
// Test double of TextFileStore: files in memory, with switches that make
// reads or writes fail the way a full disk or a missing permission would.
// A failed write leaves the stored text as it was, as the real store does.

#include <map>
#include <string>

#include "schedule/TextFileStore.h"
#include "support/Error.h"

namespace tav::testing {

class MemoryTextFiles : public TextFileStore {
 public:
  std::optional<std::string> ReadText(const std::string& path) override {
    if (failReads) throw Error(70, "MemoryTextFiles.ReadText", "Permission denied");
    auto found = files.find(path);
    if (found == files.end()) return std::nullopt;
    return found->second;
  }
  void WriteText(const std::string& path, std::string_view text) override {
    ++writes;
    if (failWrites) throw Error(61, "MemoryTextFiles.WriteText", "Disk full");
    files[path] = std::string(text);
  }

  std::map<std::string, std::string> files;
  bool failReads = false;
  bool failWrites = false;
  int writes = 0;
};

}  // namespace tav::testing
