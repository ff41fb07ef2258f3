#include "suite/shellcmd/SpawningShellCommandManager.h"

#include "support/Error.h"

namespace tav {

SpawningShellCommandManager::SpawningShellCommandManager(std::shared_ptr<ProcessSpawner> spawner,
                                                         TimerService& timers)
    : m_spawner(std::move(spawner)) {
  if (!m_spawner) throw errors::ObjectNotSet("ShellCommandManager");
  m_reapTimer = timers.CreateTimer("tmShellCmdReap", kReapIntervalMs, false, [this] { Reap(); });
}

std::shared_ptr<ShellCommand> SpawningShellCommandManager::PrepareCommand(
    const std::string& commandLine) {
  size_t first = commandLine.find_first_not_of(" \t\r\n");
  if (first == std::string::npos)
    throw errors::InvalidProcedureCall("ShellCommandManager.PrepareCommand");
  size_t last = commandLine.find_last_not_of(" \t\r\n");
  auto command = std::make_shared<ShellCommand>();
  command->commandLine = commandLine.substr(first, last - first + 1);
  return command;
}

void SpawningShellCommandManager::RunCommand(const ShellCommand& command) {
  if (command.commandLine.empty())
    throw errors::InvalidProcedureCall("ShellCommandManager.RunCommand");
  int64_t pid = m_spawner->Spawn(command);
  m_running.push_back({pid, command});
  if (!m_reapTimer->Enabled()) m_reapTimer->SetEnabled(true);
}

void SpawningShellCommandManager::Reap() {
  for (size_t i = 0; i < m_running.size();) {
    auto status = m_spawner->TryReap(m_running[i].processId);
    if (!status) {
      ++i;
      continue;
    }
    Running done = std::move(m_running[i]);
    m_running.erase(m_running.begin() + static_cast<std::ptrdiff_t>(i));
    if (m_onFinished) m_onFinished(done.command, *status);
  }
  if (m_running.empty()) m_reapTimer->SetEnabled(false);
}

}  // namespace tav
