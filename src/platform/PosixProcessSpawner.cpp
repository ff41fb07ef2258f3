#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <map>
#include <string>
#include <vector>

#include "platform/PosixProcessSpawner.h"
#include "support/Error.h"

extern char** environ;

namespace tav {

namespace {

constexpr const char* kSource = "ShellCommandManager.Spawn";

// The player's environment with the command's additions laid over it.
std::vector<std::string> Environment(const ShellCommand& command) {
  std::map<std::string, std::string> merged;
  std::vector<std::string> order;
  for (char** e = environ; e && *e; ++e) {
    std::string entry = *e;
    auto eq = entry.find('=');
    std::string key = entry.substr(0, eq);
    if (merged.emplace(key, entry).second) order.push_back(key);
  }
  for (const auto& [key, value] : command.environment) {
    if (merged.find(key) == merged.end()) order.push_back(key);
    merged[key] = key + "=" + value;
  }
  std::vector<std::string> result;
  for (const auto& key : order) result.push_back(merged[key]);
  return result;
}

}  // namespace

int64_t PosixProcessSpawner::Spawn(const ShellCommand& command) {
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  struct Cleanup {
    posix_spawn_file_actions_t* actions;
    ~Cleanup() { posix_spawn_file_actions_destroy(actions); }
  } cleanup{&actions};
  // The command reads nothing from the player; its output goes where the
  // player's goes.
  posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
  if (!command.workingDirectory.empty()) {
    posix_spawn_file_actions_addchdir_np(&actions, command.workingDirectory.c_str());
  }
  std::vector<std::string> env = Environment(command);
  std::vector<char*> envp;
  for (auto& entry : env) envp.push_back(entry.data());
  envp.push_back(nullptr);
  std::string shell = "/bin/sh", flag = "-c", line = command.commandLine;
  char* argv[] = {shell.data(), flag.data(), line.data(), nullptr};
  pid_t pid = 0;
  int rc = posix_spawn(&pid, shell.c_str(), &actions, nullptr, argv, envp.data());
  if (rc != 0) {
    throw Error(errors::kInvalidProcedureCall, kSource,
                "Cannot start shell command \"" + command.commandLine + "\": " + std::strerror(rc));
  }
  return pid;
}

std::optional<int32_t> PosixProcessSpawner::TryReap(int64_t processId) {
  int status = 0;
  pid_t rc = ::waitpid(static_cast<pid_t>(processId), &status, WNOHANG);
  if (rc == 0) return std::nullopt;
  if (rc < 0) return errno == ECHILD ? std::optional<int32_t>(-1) : std::nullopt;
  if (WIFEXITED(status)) return WEXITSTATUS(status);
  if (WIFSIGNALED(status)) return 128 + WTERMSIG(status);
  return std::nullopt;
}

}  // namespace tav
