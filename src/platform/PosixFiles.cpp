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

ReplacementFile::~ReplacementFile() {
  if (m_fd >= 0) ::close(m_fd);
  if (!m_temporary.empty() && !m_committed) ::unlink(m_temporary.c_str());
}

int ReplacementFile::Open(const std::string& path) {
  struct stat existing {};
  bool exists = ::stat(path.c_str(), &existing) == 0;
  if (exists && S_ISDIR(existing.st_mode)) return EISDIR;

  std::string temporary = path + ".XXXXXX";
  int fd = ::mkstemp(temporary.data());
  if (fd < 0) return errno;
  m_path = path;
  m_temporary = temporary;
  m_fd = fd;
  // mkstemp makes the file private; give it the target's mode, or the usual
  // mode of a new file under the process's umask.
  mode_t mode = exists ? (existing.st_mode & 07777) : 0666;
  if (!exists) {
    mode_t mask = ::umask(0);
    ::umask(mask);
    mode &= ~mask;
  }
  if (::fchmod(m_fd, mode) != 0) return errno;
  return 0;
}

int ReplacementFile::Append(std::string_view bytes) {
  if (m_fd < 0) return EBADF;
  size_t done = 0;
  while (done < bytes.size()) {
    ssize_t n = ::write(m_fd, bytes.data() + done, bytes.size() - done);
    if (n < 0) {
      if (errno == EINTR) continue;
      return errno;
    }
    done += static_cast<size_t>(n);
  }
  return 0;
}

int ReplacementFile::WriteAt(uint64_t offset, std::string_view bytes) {
  if (m_fd < 0) return EBADF;
  size_t done = 0;
  while (done < bytes.size()) {
    ssize_t n =
        ::pwrite(m_fd, bytes.data() + done, bytes.size() - done, static_cast<off_t>(offset + done));
    if (n < 0) {
      if (errno == EINTR) continue;
      return errno;
    }
    done += static_cast<size_t>(n);
  }
  return 0;
}

int ReplacementFile::Commit(struct stat* written) {
  if (m_fd < 0 || m_committed) return EBADF;
  if (::fsync(m_fd) != 0) return errno;
  if (written != nullptr && ::fstat(m_fd, written) != 0) return errno;
  int fd = m_fd;
  m_fd = -1;
  if (::close(fd) != 0) return errno;
  if (::rename(m_temporary.c_str(), m_path.c_str()) != 0) return errno;
  m_committed = true;

  // Make the rename itself durable; failing to is not worth failing the write.
  FileDescriptor folder(::open(FolderOf(m_path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (folder.Get() >= 0) ::fsync(folder.Get());
  return 0;
}

int ReplaceFileContents(const std::string& path, std::string_view bytes, struct stat* written) {
  ReplacementFile file;
  if (int error = file.Open(path)) return error;
  if (int error = file.Append(bytes)) return error;
  return file.Commit(written);
}

}  // namespace tav
