#pragma once
// The sequence library's one seam to the file system: status with
// modification times, random-access reads, whole-file reads and atomic
// writes, and directory listings. The library and its users take a
// FileSystem instead of calling the OS, so tests can inject failures or
// fake times; the real one is an adapter (platform/LocalFileSystem.h).

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "suite/seqlib/RandomAccessFile.h"

namespace tav {

struct FileStatus {
  bool exists = false;
  bool isDirectory = false;
  // Nanoseconds since the Unix epoch; only meaningful when exists.
  int64_t modifiedNs = 0;
  uint64_t size = 0;

  bool IsFile() const { return exists && !isDirectory; }
};

class FileSystem {
 public:
  virtual ~FileSystem() = default;
  // Never throws: a path that cannot be examined is reported as absent.
  virtual FileStatus Stat(const std::string& path) const = 0;
  // Throws the file-not-found error (53) or the access error (75).
  virtual std::unique_ptr<RandomAccessFile> OpenForRead(const std::string& path) const = 0;
  virtual std::string ReadAll(const std::string& path) const;
  // Replaces the file as a whole (a temporary beside it, then a rename), so
  // a reader never sees half a file. Throws the access error (75).
  virtual void WriteAll(const std::string& path, std::string_view bytes) = 0;
  // The same, calling `progress` now and then while a large file is written
  // and synced (a file system that cannot tell just writes).
  virtual void WriteAll(const std::string& path, std::string_view bytes,
                        const std::function<void()>& progress) {
    (void)progress;
    WriteAll(path, bytes);
  }
  // Names (not paths) of the entries of a directory; empty when it cannot be
  // read.
  virtual std::vector<std::string> ListDirectory(const std::string& path) const = 0;
};

}  // namespace tav
