#include "platform/PosixFiles.h"

#include <dirent.h>
#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>

namespace tav {

namespace {

constexpr const char* kTemporaryMark = ".tav-tmp-";
constexpr size_t kProgressBytes = 1 << 20;
// Links followed before a chain counts as a loop, as the kernel counts.
constexpr int kMaxLinks = 40;

// The file a write to `path` must replace: `path` itself, or the file its
// chain of symbolic links ends at (which need not exist yet). 0 or an errno.
int FinalTarget(std::string path, std::string& target) {
  for (int hop = 0; hop < kMaxLinks; ++hop) {
    struct stat info {};
    if (::lstat(path.c_str(), &info) != 0 || !S_ISLNK(info.st_mode)) {
      target = path;
      return 0;  // a missing file is made where the chain ends
    }
    std::string link(static_cast<size_t>(std::max<off_t>(info.st_size, 0)) + 256, '\0');
    ssize_t length = ::readlink(path.c_str(), link.data(), link.size());
    if (length < 0) return errno;
    link.resize(static_cast<size_t>(length));
    path = !link.empty() && link[0] == '/' ? link : FolderOf(path) + "/" + link;
  }
  return ELOOP;
}

bool IsDigits(std::string_view text) {
  return !text.empty() &&
         std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; });
}

// The writer of a temporary of ours named `name`, or 0 when it is none.
pid_t WriterOf(const std::string& name) {
  size_t mark = name.rfind(kTemporaryMark);
  if (name.empty() || name[0] != '.' || mark == std::string::npos) return 0;
  std::string_view rest =
      std::string_view(name).substr(mark + std::string_view(kTemporaryMark).size());
  size_t dash = rest.find('-');
  if (dash == std::string_view::npos || rest.size() - dash - 1 != 6) return 0;
  std::string_view pid = rest.substr(0, dash);
  if (!IsDigits(pid) || pid.size() > 9) return 0;
  return static_cast<pid_t>(std::atol(std::string(pid).c_str()));
}

}  // namespace

FileDescriptor::~FileDescriptor() {
  if (m_fd >= 0) ::close(m_fd);
}

std::string FolderOf(const std::string& path) {
  size_t slash = path.find_last_of('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

std::string TemporaryPrefixFor(const std::string& path) {
  size_t slash = path.find_last_of('/');
  size_t base = slash == std::string::npos ? 0 : slash + 1;
  return path.substr(0, base) + "." + path.substr(base) + kTemporaryMark;
}

int RemoveStaleTemporaries(const std::string& folder) {
  DIR* dir = ::opendir(folder.c_str());
  if (dir == nullptr) return 0;
  std::string prefix = folder.empty() || folder.back() == '/' ? folder : folder + "/";
  int removed = 0;
  while (dirent* entry = ::readdir(dir)) {
    pid_t writer = WriterOf(entry->d_name);
    if (writer <= 0 || writer == ::getpid()) continue;
    // Only a writer that is gone: ESRCH. EPERM means it runs as another user.
    if (::kill(writer, 0) == 0 || errno != ESRCH) continue;
    if (::unlink((prefix + entry->d_name).c_str()) == 0) ++removed;
  }
  ::closedir(dir);
  return removed;
}

ReplacementFile::~ReplacementFile() {
  if (m_fd >= 0) ::close(m_fd);
  if (!m_temporary.empty() && !m_committed) ::unlink(m_temporary.c_str());
}

int ReplacementFile::Open(const std::string& linkOrPath, std::function<void()> progress) {
  m_progress = std::move(progress);
  std::string path;
  if (int error = FinalTarget(linkOrPath, path); error != 0) return error;
  struct stat existing {};
  bool exists = ::stat(path.c_str(), &existing) == 0;
  if (exists && S_ISDIR(existing.st_mode)) return EISDIR;

  std::string temporary = TemporaryPrefixFor(path) + std::to_string(::getpid()) + "-XXXXXX";
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

void ReplacementFile::Tell() {
  if (m_progress) m_progress();
}

int ReplacementFile::Append(std::string_view bytes) {
  if (m_fd < 0) return EBADF;
  size_t done = 0;
  while (done < bytes.size()) {
    ssize_t n = ::write(m_fd, bytes.data() + done, std::min(bytes.size() - done, kProgressBytes));
    if (n < 0) {
      if (errno == EINTR) continue;
      return errno;
    }
    done += static_cast<size_t>(n);
    m_unreported += static_cast<size_t>(n);
    if (m_unreported >= kProgressBytes) {
      m_unreported = 0;
      Tell();
    }
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
  Tell();
  if (::fsync(m_fd) != 0) return errno;
  Tell();
  if (written != nullptr && ::fstat(m_fd, written) != 0) return errno;
  int fd = m_fd;
  m_fd = -1;
  if (::close(fd) != 0) return errno;
  if (::rename(m_temporary.c_str(), m_path.c_str()) != 0) return errno;
  m_committed = true;
  Tell();

  // Make the rename itself durable; failing to is not worth failing the write.
  FileDescriptor folder(::open(FolderOf(m_path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (folder.Get() >= 0) ::fsync(folder.Get());
  Tell();
  return 0;
}

int ReplaceFileContents(const std::string& path, std::string_view bytes, struct stat* written,
                        const std::function<void()>& progress) {
  ReplacementFile file;
  if (int error = file.Open(path, progress)) return error;
  if (int error = file.Append(bytes)) return error;
  return file.Commit(written);
}

}  // namespace tav
