#pragma once
// The sequence library's one seam to the file system: status with
// modification times, random-access reads, whole-file reads, atomic writes
// (whole or piece by piece), and directory listings. The library and its users take a
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

// A file written from the front that replaces the file at its path only when
// committed, all at once: until then readers see the old file (or none), and
// a writer that gives up (destroys it uncommitted) changes nothing. Lets a
// converter write a file of any length while holding a few blocks of it.
class WritableFile {
 public:
  virtual ~WritableFile() = default;
  // Throw the access error (75) when the bytes cannot be written.
  virtual void Append(std::string_view bytes) = 0;
  // Overwrites bytes appended before: a header whose sizes are known last.
  virtual void WriteAt(uint64_t offset, std::string_view bytes) = 0;
  virtual uint64_t Size() const = 0;
  virtual void Commit() = 0;
};

// Holds the bytes in memory; Commit hands them to `commit` (if any).
class MemoryWritableFile : public WritableFile {
 public:
  explicit MemoryWritableFile(std::function<void(std::string_view)> commit = {})
      : m_commit(std::move(commit)) {}
  void Append(std::string_view bytes) override { m_bytes.append(bytes); }
  void WriteAt(uint64_t offset, std::string_view bytes) override;
  uint64_t Size() const override { return m_bytes.size(); }
  void Commit() override {
    if (m_commit) m_commit(m_bytes);
  }
  std::string& Bytes() { return m_bytes; }

 private:
  std::function<void(std::string_view)> m_commit;
  std::string m_bytes;
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
  // The same replacement, written piece by piece. Unless a file system has
  // a better way, the pieces are gathered in memory and written by WriteAll.
  virtual std::unique_ptr<WritableFile> OpenForWrite(const std::string& path);
  // Names (not paths) of the entries of a directory; empty when it cannot be
  // read.
  virtual std::vector<std::string> ListDirectory(const std::string& path) const = 0;
};

}  // namespace tav
