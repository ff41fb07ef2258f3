#pragma once
// Port: whole-text reads and writes of the schedule files. The schedules never
// open files themselves; the host and showctl hand them a store, and tests
// hand them one that fails on purpose.
//
// Contract of WriteText: the file ends up holding either its previous content
// or the whole new text, never a part of it (a real store writes a temporary
// file and renames it). Failures are reported as tav::Error.

#include <optional>
#include <string>
#include <string_view>

namespace tav {

class TextFileStore {
 public:
  virtual ~TextFileStore() = default;
  // The whole content, or nothing when the file does not exist. Any other
  // failure (no permission, a folder, a read error) throws tav::Error.
  virtual std::optional<std::string> ReadText(const std::string& path) = 0;
  // Creates or replaces the file with exactly `text`, all at once.
  virtual void WriteText(const std::string& path, std::string_view text) = 0;
};

}  // namespace tav
