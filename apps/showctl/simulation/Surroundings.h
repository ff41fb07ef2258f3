#pragma once
// What a simulation puts around the player where the real program has the
// outside world, each doing nothing that reaches beyond the process:
//  - NoTrayLink: no tray program ever connects (log lines are kept back as
//    they are while no tray runs, and the simulation reads them from the
//    form's observer);
//  - SkippedShellCommands: a sequence's shell command is prepared as usual
//    but not run; the simulation is told so, and the command never ends;
//  - SteadyMemory: the process memory the watchdog sees stays small, so a
//    simulated day is never cut short by a restart that depends on how much
//    memory showctl itself happens to use.
// Owned by the simulation; single-threaded.

#include <functional>
#include <memory>
#include <string>

#include "host/TrayLink.h"
#include "ports/ProcessMemory.h"
#include "suite/shellcmd/ShellCommandManager.h"

namespace tav::simulation {

class NoTrayLink : public TrayLink {
 public:
  uint32_t OwnHandle() const override { return 1; }
  bool Send(uint32_t, const TrayFrame&) override { return false; }
  void SetOnFrame(std::function<void(const TrayFrame&)>) override {}
  void SetOnConnect(std::function<void(uint32_t)>) override {}
  void SetOnDisconnect(std::function<void(uint32_t, const std::string&)>) override {}
};

class SkippedShellCommands : public ShellCommandManager {
 public:
  using OnSkipped = std::function<void(const std::string& commandLine)>;
  explicit SkippedShellCommands(OnSkipped onSkipped) : m_onSkipped(std::move(onSkipped)) {}

  // Fails as the real manager does for an empty command line.
  std::shared_ptr<ShellCommand> PrepareCommand(const std::string& commandLine) override;
  void RunCommand(const ShellCommand& command) override;
  size_t RunningCount() const override { return 0; }
  void SetOnFinished(FinishedHandler) override {}

 private:
  OnSkipped m_onSkipped;
};

class SteadyMemory : public ProcessMemory {
 public:
  static constexpr int32_t kBytes = 32 * 1024 * 1024;
  int32_t PrivateBytes() const override { return kBytes; }
};

}  // namespace tav::simulation
