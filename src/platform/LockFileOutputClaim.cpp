#include "platform/LockFileOutputClaim.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "platform/UnixTrayLink.h"

namespace tav {

namespace {

std::string ParentOf(const std::string& path) {
  size_t slash = path.rfind('/');
  return slash == std::string::npos ? "." : slash == 0 ? "/" : path.substr(0, slash);
}

void MakeDirectories(const std::string& dir) {
  struct stat info {};
  if (dir.empty() || ::stat(dir.c_str(), &info) == 0) return;
  std::string parent = ParentOf(dir);
  if (parent != dir) MakeDirectories(parent);
  ::mkdir(dir.c_str(), 0700);
}

}  // namespace

std::string LockFileOutputClaim::DefaultPath() {
  return ParentOf(UnixTrayLink::DefaultSocketPath()) + "/outputs.lock";
}

LockFileOutputClaim::~LockFileOutputClaim() {
  Release();
}

bool LockFileOutputClaim::TryClaim(const std::string& clientName, std::string& holder) {
  if (m_fd >= 0) return true;
  MakeDirectories(ParentOf(m_path));
  int fd = ::open(m_path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
  if (fd < 0) {
    // Without a lock file there is nothing to coordinate with: go ahead.
    return true;
  }
  if (::flock(fd, LOCK_EX | LOCK_NB) != 0) {
    char text[256] = {};
    ssize_t n = ::pread(fd, text, sizeof text - 1, 0);
    holder = n > 0 ? std::string(text, static_cast<size_t>(n)) : std::string();
    while (!holder.empty() && (holder.back() == '\n' || holder.back() == '\0')) holder.pop_back();
    ::close(fd);
    return false;
  }
  std::string mine = clientName + ", process " + std::to_string(::getpid()) + "\n";
  if (::ftruncate(fd, 0) == 0) {
    ssize_t written = ::pwrite(fd, mine.data(), mine.size(), 0);
    (void)written;
  }
  m_fd = fd;
  return true;
}

void LockFileOutputClaim::Release() {
  if (m_fd < 0) return;
  if (::ftruncate(m_fd, 0) != 0) {
    // The lock goes with the descriptor; a stale name is only cosmetic.
  }
  ::close(m_fd);
  m_fd = -1;
}

}  // namespace tav
