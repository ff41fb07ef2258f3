#pragma once
// A shell command as it is handed from the manager (which prepares it) to
// the sequence (which completes it with what it knows: its folder, its
// file names) and back to the manager (which runs it). A plain value.

#include <string>
#include <utility>
#include <vector>

namespace tav {

struct ShellCommand {
  // Run by the system shell (`/bin/sh -c`).
  std::string commandLine;
  // Empty: the player's own working directory.
  std::string workingDirectory;
  // Added to (or replacing in) the player's environment.
  std::vector<std::pair<std::string, std::string>> environment;

  friend bool operator==(const ShellCommand&, const ShellCommand&) = default;
};

}  // namespace tav
