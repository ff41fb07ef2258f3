#pragma once
// The TextFileStore of the local file system: the one place in the schedule
// code that touches files. A write goes to a temporary file beside the target
// (same folder, so the rename cannot cross file systems), is flushed to disk,
// and then renamed over the target, so a crash or a full disk leaves the
// previous file intact. An existing file keeps its permissions.
//
// It lives here rather than in src/platform so the schedule library and
// showctl can be built and tested on their own; it is self-contained and can
// move there unchanged.

#include "schedule/TextFileStore.h"

namespace tav {

class LocalTextFiles : public TextFileStore {
 public:
  std::optional<std::string> ReadText(const std::string& path) override;
  void WriteText(const std::string& path, std::string_view text) override;
};

// The local store used by the overloads that take no store. Stateless, so
// sharing one is harmless; code that needs another store passes it.
TextFileStore& DefaultTextFileStore();

}  // namespace tav
