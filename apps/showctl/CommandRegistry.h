#pragma once
// showctl's command groups register themselves at start-up, each from its own
// file, so that schedule, tray, settings and sequence commands live apart:
//
//   static tav::showctl::CommandGroup reg{"schedule", [](CLI::App& app) { ... }};
//
// A group adds its subcommands to the application and sets their callbacks.
// Callbacks report failures by throwing tav::showctl::CommandFailed (message
// to standard error, exit code) or tav::Error; main turns both into a message
// on standard error and a non-zero exit.

#include <CLI/CLI.hpp>
#include <functional>
#include <stdexcept>
#include <string>
#include <vector>

namespace tav::showctl {

struct CommandFailed : std::runtime_error {
  CommandFailed(const std::string& message, int exitCode = 1)
      : std::runtime_error(message), exitCode(exitCode) {}
  int exitCode;
};

using RegisterFn = std::function<void(CLI::App&)>;

struct CommandGroup {
  CommandGroup(std::string name, RegisterFn registerFn);
};

struct RegisteredGroup {
  std::string name;
  RegisterFn registerFn;
};

// Groups in name order, so --help lists them the same way on every build.
std::vector<RegisteredGroup>& CommandGroups();

}  // namespace tav::showctl
