#include "platform/InstanceLock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <string>

#include "platform/PosixFiles.h"

namespace tav {

namespace {

// Makes every missing folder of `folder` with mode 0700.
void MakeFolders(const std::string& folder) {
  if (folder.empty() || folder == "/" || folder == ".") return;
  struct stat st {};
  if (::stat(folder.c_str(), &st) == 0) return;
  MakeFolders(FolderOf(folder));
  ::mkdir(folder.c_str(), 0700);
}

}  // namespace

std::string InstanceLock::PathForSocket(const std::string& socketPath) {
  constexpr std::string_view kSuffix = ".sock";
  if (socketPath.size() > kSuffix.size() &&
      socketPath.compare(socketPath.size() - kSuffix.size(), kSuffix.size(), kSuffix) == 0) {
    return socketPath.substr(0, socketPath.size() - kSuffix.size()) + ".lock";
  }
  return socketPath + ".lock";
}

InstanceLock::InstanceLock(std::string path) : m_path(std::move(path)) {
  MakeFolders(FolderOf(m_path));
  int fd = ::open(m_path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
  if (fd < 0) {
    m_problem = "cannot open the lock file " + m_path + ": " + std::strerror(errno);
    return;
  }
  if (::flock(fd, LOCK_EX | LOCK_NB) != 0) {
    int error = errno;
    ::close(fd);
    if (error == EWOULDBLOCK) {
      m_heldElsewhere = true;
      m_problem = "another show player is already running (it holds " + m_path + ")";
    } else {
      m_problem = "cannot lock " + m_path + ": " + std::strerror(error);
    }
    return;
  }
  m_fd = fd;
}

InstanceLock::~InstanceLock() {
  // Closing drops the lock. The file stays: removing it could let a third
  // process lock a new file while a second still waits on the old one.
  if (m_fd >= 0) ::close(m_fd);
}

}  // namespace tav
