#include "platform/PosixFiles.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>

namespace tav {

FileDescriptor::~FileDescriptor() {
  if (m_fd >= 0) ::close(m_fd);
}

std::string FolderOf(const std::string& path) {
  size_t slash = path.find_last_of('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

int ReplaceFileContents(const std::string& path, std::string_view bytes, struct stat* written) {
  struct stat existing {};
  bool exists = ::stat(path.c_str(), &existing) == 0;
  if (exists && S_ISDIR(existing.st_mode)) return EISDIR;

  std::string temporary = path + ".XXXXXX";
  FileDescriptor fd(::mkstemp(temporary.data()));
  if (fd.Get() < 0) return errno;
  bool renamed = false;
  struct RemoveUnlessRenamed {
    const std::string& name;
    const bool& renamed;
    ~RemoveUnlessRenamed() {
      if (!renamed) ::unlink(name.c_str());
    }
  } cleanup{temporary, renamed};

  // mkstemp makes the file private; give it the target's mode, or the usual
  // mode of a new file under the process's umask.
  mode_t mode = exists ? (existing.st_mode & 07777) : 0666;
  if (!exists) {
    mode_t mask = ::umask(0);
    ::umask(mask);
    mode &= ~mask;
  }
  if (::fchmod(fd.Get(), mode) != 0) return errno;

  size_t done = 0;
  while (done < bytes.size()) {
    ssize_t n = ::write(fd.Get(), bytes.data() + done, bytes.size() - done);
    if (n < 0) {
      if (errno == EINTR) continue;
      return errno;
    }
    done += static_cast<size_t>(n);
  }
  if (::fsync(fd.Get()) != 0) return errno;
  if (written != nullptr && ::fstat(fd.Get(), written) != 0) return errno;
  if (::close(fd.Release()) != 0) return errno;
  if (::rename(temporary.c_str(), path.c_str()) != 0) return errno;
  renamed = true;

  // Make the rename itself durable; failing to is not worth failing the write.
  FileDescriptor folder(::open(FolderOf(path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (folder.Get() >= 0) ::fsync(folder.Get());
  return 0;
}

}  // namespace tav
