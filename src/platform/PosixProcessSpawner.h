#pragma once
// Starts shell commands with posix_spawn and reaps them with
// waitpid(WNOHANG): neither call waits for the child, so the loop never
// blocks on a command.

#include "suite/shellcmd/ProcessSpawner.h"

namespace tav {

class PosixProcessSpawner : public ProcessSpawner {
 public:
  int64_t Spawn(const ShellCommand& command) override;
  std::optional<int32_t> TryReap(int64_t processId) override;
};

}  // namespace tav
