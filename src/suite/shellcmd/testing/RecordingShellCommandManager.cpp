#include "suite/shellcmd/testing/RecordingShellCommandManager.h"

#include "support/Error.h"

namespace tav {

std::shared_ptr<ShellCommand> RecordingShellCommandManager::PrepareCommand(
    const std::string& commandLine) {
  m_prepared.push_back(commandLine);
  if (commandLine.find_first_not_of(" \t\r\n") == std::string::npos) {
    throw errors::InvalidProcedureCall("ShellCommandManager.PrepareCommand");
  }
  auto command = std::make_shared<ShellCommand>();
  command->commandLine = commandLine;
  return command;
}

void RecordingShellCommandManager::RunCommand(const ShellCommand& command) {
  if (m_failNext) {
    m_failNext = false;
    throw Error(errors::kInvalidProcedureCall, "ShellCommandManager.Spawn",
                "Cannot start shell command");
  }
  m_ran.push_back(command);
  m_running.push_back(command);
}

void RecordingShellCommandManager::Finish(int32_t exitStatus) {
  if (m_running.empty()) return;
  ShellCommand done = m_running.front();
  m_running.erase(m_running.begin());
  if (m_onFinished) m_onFinished(done, exitStatus);
}

}  // namespace tav
