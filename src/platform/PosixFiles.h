#pragma once
// File helpers shared by the adapters that write the player's files: the
// settings file, the schedule files and the compressed sequence exports.
// Each of those must survive a crash or a full disk with either its old or
// its new content, so there is one way of replacing a file, here, and one
// way of clearing away what a crash in the middle of it left behind.

#include <sys/stat.h>

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace tav {

// Closes a descriptor on every path out of a function.
class FileDescriptor {
 public:
  explicit FileDescriptor(int fd = -1) : m_fd(fd) {}
  ~FileDescriptor();
  FileDescriptor(const FileDescriptor&) = delete;
  FileDescriptor& operator=(const FileDescriptor&) = delete;
  int Get() const { return m_fd; }
  int Release() {
    int fd = m_fd;
    m_fd = -1;
    return fd;
  }

 private:
  int m_fd;
};

// Replaces the file at `path` with exactly `bytes`, so that a reader or a
// crash finds either the old content or the new, never a part of it: a
// temporary file beside it is written, flushed to disk and renamed over it,
// and the folder is flushed so the rename lasts. When `path` is a symbolic
// link (a settings file kept in a synced folder, say) the file it leads to
// is replaced and the link stays. The file keeps its mode (a new one gets
// the usual mode under the umask). Returns 0, or the errno of the step that
// failed, leaving the old file and no temporary behind. `written`, when
// given, receives the status of the new file; `progress`, when given, is
// called after every mebibyte written and after each sync and the rename.
int ReplaceFileContents(const std::string& path, std::string_view bytes,
                        struct stat* written = nullptr, const std::function<void()>& progress = {});

// The temporaries of ReplaceFileContents are named, beside the file they
// replace, this prefix, the writer's process id, '-' and six characters:
// "/data/.show.tseq.tcs.tav-tmp-4242-a1B2c3".
std::string TemporaryPrefixFor(const std::string& path);

// Removes from `folder` the temporaries whose writer is no longer running
// (left by a crash or a power cut), and nothing else: not a temporary that
// a live process is still writing, not a file of anybody else's. Returns how
// many it removed. Called at start for the settings folder and the sequence
// folder.
int RemoveStaleTemporaries(const std::string& folder);

// The same replacement for a file written piece by piece: a temporary file
// beside the file (the end of its chain of links) that takes the bytes, and
// Commit flushes it and renames it over the file. Given up (destroyed
// without a successful Commit), the temporary is removed and the file is as
// it was. Each call returns 0 or the errno of the step that failed.
// `progress`, when given, is called after every mebibyte appended and after
// each step of the commit.
class ReplacementFile {
 public:
  ReplacementFile() = default;
  ~ReplacementFile();
  ReplacementFile(const ReplacementFile&) = delete;
  ReplacementFile& operator=(const ReplacementFile&) = delete;

  int Open(const std::string& path, std::function<void()> progress = {});
  int Append(std::string_view bytes);
  // Over bytes appended before (a header whose sizes are known at the end).
  int WriteAt(uint64_t offset, std::string_view bytes);
  int Commit(struct stat* written = nullptr);

 private:
  void Tell();

  std::string m_path;
  std::string m_temporary;
  int m_fd = -1;
  bool m_committed = false;
  std::function<void()> m_progress;
  size_t m_unreported = 0;
};

// The folder part of a path: "." for a bare name, "/" for the root.
std::string FolderOf(const std::string& path);

}  // namespace tav
