#include "Surroundings.h"

#include "support/Error.h"

namespace tav::simulation {

std::shared_ptr<ShellCommand> SkippedShellCommands::PrepareCommand(const std::string& commandLine) {
  if (commandLine.find_first_not_of(" \t\r\n") == std::string::npos) {
    throw errors::InvalidProcedureCall("ShellCommandManager.PrepareCommand");
  }
  auto command = std::make_shared<ShellCommand>();
  command->commandLine = commandLine;
  return command;
}

void SkippedShellCommands::RunCommand(const ShellCommand& command) {
  if (m_onSkipped) m_onSkipped(command.commandLine);
}

}  // namespace tav::simulation
