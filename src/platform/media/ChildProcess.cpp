#include "platform/media/ChildProcess.h"

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <utility>

#include "support/Error.h"

extern char** environ;

namespace tav {
namespace {

constexpr const char* kSource = "ChildProcess";

Error SystemError(const std::string& what, int error) {
  return Error(errors::kInvalidProcedureCall, kSource, what + ": " + std::strerror(error));
}

// Closes a descriptor when it goes out of scope, unless released.
class OwnedFd {
 public:
  explicit OwnedFd(int fd) : m_fd(fd) {}
  ~OwnedFd() {
    if (m_fd >= 0) ::close(m_fd);
  }
  OwnedFd(const OwnedFd&) = delete;
  OwnedFd& operator=(const OwnedFd&) = delete;
  int Get() const { return m_fd; }
  int Release() { return std::exchange(m_fd, -1); }
  void Reset(int fd) {
    if (m_fd >= 0) ::close(m_fd);
    m_fd = fd;
  }

 private:
  int m_fd;
};

}  // namespace

SpawnedChild SpawnWithSocket(const std::string& program, const std::vector<std::string>& arguments,
                             int childSocket) {
  int pair[2];
  // Close-on-exec on both ends: other programs the player starts (shell
  // commands) must not hold the link open, or the end of the child would go
  // unseen. The spawn below hands the child its end explicitly.
  if (::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, pair) != 0) {
    throw SystemError("Cannot make a socket pair", errno);
  }
  OwnedFd ours(pair[0]);
  OwnedFd theirs(pair[1]);
  if (theirs.Get() == childSocket) {
    // dup2 onto itself would leave close-on-exec set.
    int moved = ::fcntl(theirs.Get(), F_DUPFD_CLOEXEC, childSocket + 1);
    if (moved < 0) throw SystemError("Cannot move a descriptor", errno);
    theirs.Reset(moved);
  }

  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawnattr_t attributes;
  posix_spawnattr_init(&attributes);
  struct Cleanup {
    posix_spawn_file_actions_t* actions;
    posix_spawnattr_t* attributes;
    ~Cleanup() {
      posix_spawn_file_actions_destroy(actions);
      posix_spawnattr_destroy(attributes);
    }
  } cleanup{&actions, &attributes};
  posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_adddup2(&actions, theirs.Get(), childSocket);
  posix_spawn_file_actions_addclosefrom_np(&actions, childSocket + 1);
  sigset_t none;
  sigemptyset(&none);
  posix_spawnattr_setsigmask(&attributes, &none);
  posix_spawnattr_setpgroup(&attributes, 0);
  posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETPGROUP);

  std::vector<std::string> words{program};
  words.insert(words.end(), arguments.begin(), arguments.end());
  std::vector<char*> argv;
  for (auto& word : words) argv.push_back(word.data());
  argv.push_back(nullptr);

  pid_t pid = 0;
  int rc = ::posix_spawn(&pid, program.c_str(), &actions, &attributes, argv.data(), environ);
  if (rc != 0) throw SystemError("Cannot start " + program, rc);
  return {pid, ours.Release()};
}

std::optional<std::string> TryReapChild(int64_t processId) {
  int status = 0;
  pid_t rc = ::waitpid(static_cast<pid_t>(processId), &status, WNOHANG);
  if (rc == 0) return std::nullopt;
  if (rc < 0) return errno == ECHILD ? std::optional<std::string>("") : std::nullopt;
  if (WIFEXITED(status)) return "exited with status " + std::to_string(WEXITSTATUS(status));
  if (WIFSIGNALED(status)) {
    int signal = WTERMSIG(status);
    return "killed by signal " + std::to_string(signal) + " (" + ::strsignal(signal) + ")";
  }
  return std::nullopt;  // stopped or continued: still there
}

void KillChild(int64_t processId) {
  ::kill(static_cast<pid_t>(processId), SIGKILL);
}

}  // namespace tav
