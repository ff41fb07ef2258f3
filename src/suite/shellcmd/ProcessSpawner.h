#pragma once
// Starting and reaping child processes, the one place the shell-command
// manager touches the OS. The real spawner is an adapter
// (platform/PosixProcessSpawner.h); tests use a double.

#include <cstdint>
#include <optional>

#include "suite/shellcmd/ShellCommand.h"

namespace tav {

class ProcessSpawner {
 public:
  virtual ~ProcessSpawner() = default;
  // Starts the command; returns its process id. Throws tav::Error.
  virtual int64_t Spawn(const ShellCommand& command) = 0;
  // The exit status once the process has ended (reaping it), else nothing.
  virtual std::optional<int32_t> TryReap(int64_t processId) = 0;
};

}  // namespace tav
