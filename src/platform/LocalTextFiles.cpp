#include "platform/LocalTextFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <string>

#include "platform/PosixFiles.h"
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

}  // namespace

std::optional<std::string> LocalTextFiles::ReadText(const std::string& path) {
  constexpr const char* kSource = "LocalTextFiles.ReadText";
  FileDescriptor fd(::open(path.c_str(), O_RDONLY | O_CLOEXEC));
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
  int error = ReplaceFileContents(path, text);
  if (error != 0) throw FileError(error, "LocalTextFiles.WriteText");
}

}  // namespace tav
