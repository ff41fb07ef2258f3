#pragma once
// Port: the suite's shell-command manager, which runs the shell command a
// sequence carries. Prepare turns the text into a command; the sequence
// completes it; Run starts it and returns at once: the player's one thread
// never waits for a command. What became of finished commands is reported
// to the handler set with SetOnFinished.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "suite/shellcmd/ShellCommand.h"

namespace tav {

class ShellCommandManager {
 public:
  // exitStatus: the exit code, or 128 + signal number when a signal ended it.
  using FinishedHandler = std::function<void(const ShellCommand& command, int32_t exitStatus)>;

  virtual ~ShellCommandManager() = default;
  // Throws tav::Error (5) for an empty command line.
  virtual std::shared_ptr<ShellCommand> PrepareCommand(const std::string& commandLine) = 0;
  // Throws tav::Error when the command cannot be started.
  virtual void RunCommand(const ShellCommand& command) = 0;
  // Commands started and not yet reaped.
  virtual size_t RunningCount() const = 0;
  virtual void SetOnFinished(FinishedHandler handler) = 0;
};

}  // namespace tav
