#pragma once
// One running player per tray socket: an exclusive lock on a file in the
// runtime directory, held for the life of the process. The kernel drops the
// lock when the process ends, however it ends, so a player that crashed
// never blocks the next one, and no stale file has to be cleaned up.
//
// The lock file sits beside the tray socket (showplayer.sock gives
// showplayer.lock), so two players on two sockets (tests, say) do not
// exclude each other, while two on the same socket always do. Folders that
// are missing are made with mode 0700, as the tray link makes them.
//
// Owned by the program's entry point, which takes it before it builds
// anything else.

#include <string>

namespace tav {

class InstanceLock {
 public:
  // The lock file for a tray socket path.
  static std::string PathForSocket(const std::string& socketPath);

  // Tries to take the lock. Never throws; see Held() and Problem().
  explicit InstanceLock(std::string path);
  ~InstanceLock();
  InstanceLock(const InstanceLock&) = delete;
  InstanceLock& operator=(const InstanceLock&) = delete;

  // True when this process holds the lock.
  bool Held() const { return m_fd >= 0; }
  // True when another process holds it (false when the file could not even
  // be opened: see Problem()).
  bool HeldElsewhere() const { return m_heldElsewhere; }
  // Why the lock is not held, in words; "" when it is.
  const std::string& Problem() const { return m_problem; }
  const std::string& Path() const { return m_path; }

 private:
  std::string m_path;
  int m_fd = -1;
  bool m_heldElsewhere = false;
  std::string m_problem;
};

}  // namespace tav
