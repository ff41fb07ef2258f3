#pragma once
// Test double for the ShellCommandManager port: records what was prepared
// and run, starts nothing. Finish() plays a command ending; FailNextRun
// makes the next RunCommand throw as a failed start would.

#include <vector>

#include "suite/shellcmd/ShellCommandManager.h"

namespace tav {

class RecordingShellCommandManager : public ShellCommandManager {
 public:
  std::shared_ptr<ShellCommand> PrepareCommand(const std::string& commandLine) override;
  void RunCommand(const ShellCommand& command) override;
  size_t RunningCount() const override { return m_running.size(); }
  void SetOnFinished(FinishedHandler handler) override { m_onFinished = std::move(handler); }

  void FailNextRun() { m_failNext = true; }
  // Ends the oldest running command with the status given.
  void Finish(int32_t exitStatus);

  const std::vector<std::string>& Prepared() const { return m_prepared; }
  const std::vector<ShellCommand>& Ran() const { return m_ran; }

 private:
  std::vector<std::string> m_prepared;
  std::vector<ShellCommand> m_ran;
  std::vector<ShellCommand> m_running;
  FinishedHandler m_onFinished;
  bool m_failNext = false;
};

}  // namespace tav
