#pragma once
// File helpers shared by the adapters that write the player's files: the
// settings file, the schedule files and the compressed sequence exports.
// Each of those must survive a crash or a full disk with either its old or
// its new content, so there is one way of replacing a file, here.

#include <sys/stat.h>

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
// and the folder is flushed so the rename lasts. The file keeps its mode (a
// new one gets the usual mode under the umask). Returns 0, or the errno of
// the step that failed, leaving the old file and no temporary behind.
// `written`, when given, receives the status of the new file.
int ReplaceFileContents(const std::string& path, std::string_view bytes,
                        struct stat* written = nullptr);

// The folder part of a path: "." for a bare name, "/" for the root.
std::string FolderOf(const std::string& path);

}  // namespace tav
