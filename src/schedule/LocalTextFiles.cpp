#include "schedule/LocalTextFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <string>

#include "support/Error.h"

namespace tav {
namespace {

// The platform's file errors keep their numbers and words.
Error FileError(int error, const char* source) {
  switch (error) {
    case EACCES:
    case EPERM:
    case EROFS:
      return Error(70, source, "Permission denied");
    case ENOSPC:
    case EDQUOT:
      return Error(61, source, "Disk full");
    case EIO:
      return Error(57, source, "Device I/O error");
    case ENOENT:
    case ENOTDIR:
      return Error(76, source, "Path not found");
    default:
      return Error(75, source, "Path/File access error");
  }
}

// Closes the descriptor on every path out.
class Descriptor {
 public:
  explicit Descriptor(int fd) : m_fd(fd) {}
  ~Descriptor() {
    if (m_fd >= 0) ::close(m_fd);
  }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  int Get() const { return m_fd; }
  int Release() {
    int fd = m_fd;
    m_fd = -1;
    return fd;
  }

 private:
  int m_fd;
};

std::string FolderOf(const std::string& path) {
  size_t slash = path.find_last_of('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

}  // namespace

TextFileStore& DefaultTextFileStore() {
  static LocalTextFiles files;
  return files;
}

std::optional<std::string> LocalTextFiles::ReadText(const std::string& path) {
  constexpr const char* kSource = "LocalTextFiles.ReadText";
  Descriptor fd(::open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (fd.Get() < 0) {
    if (errno == ENOENT) return std::nullopt;
    throw FileError(errno, kSource);
  }
  struct stat info {};
  if (::fstat(fd.Get(), &info) != 0) throw FileError(errno, kSource);
  if (S_ISDIR(info.st_mode)) throw FileError(EISDIR, kSource);
  std::string text;
  char buffer[65536];
  for (;;) {
    ssize_t n = ::read(fd.Get(), buffer, sizeof buffer);
    if (n < 0) {
      if (errno == EINTR) continue;
      throw FileError(errno, kSource);
    }
    if (n == 0) break;
    text.append(buffer, static_cast<size_t>(n));
  }
  return text;
}

void LocalTextFiles::WriteText(const std::string& path, std::string_view text) {
  constexpr const char* kSource = "LocalTextFiles.WriteText";
  struct stat existing {};
  bool exists = ::stat(path.c_str(), &existing) == 0;
  if (exists && S_ISDIR(existing.st_mode)) throw FileError(EISDIR, kSource);

  std::string temporary = path + ".XXXXXX";
  Descriptor fd(::mkstemp(temporary.data()));
  if (fd.Get() < 0) throw FileError(errno, kSource);
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
  if (::fchmod(fd.Get(), mode) != 0) throw FileError(errno, kSource);

  size_t written = 0;
  while (written < text.size()) {
    ssize_t n = ::write(fd.Get(), text.data() + written, text.size() - written);
    if (n < 0) {
      if (errno == EINTR) continue;
      throw FileError(errno, kSource);
    }
    written += static_cast<size_t>(n);
  }
  if (::fsync(fd.Get()) != 0) throw FileError(errno, kSource);
  if (::close(fd.Release()) != 0) throw FileError(errno, kSource);
  if (::rename(temporary.c_str(), path.c_str()) != 0) throw FileError(errno, kSource);
  renamed = true;

  // Make the rename itself durable; failing to is not worth failing the save.
  Descriptor folder(::open(FolderOf(path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (folder.Get() >= 0) ::fsync(folder.Get());
}

}  // namespace tav
