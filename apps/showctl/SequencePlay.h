#pragma once
// showctl sequence play: plays one sequence through the lighting outputs
// of the network preferences, with the real hardware-I/O control, until it
// ends (or for --seconds, looping with --loop), optionally drawing the
// levels in the terminal. Lives beside the other sequence commands; kept in
// a file of its own because it runs the event loop.

#include <CLI/CLI.hpp>
#include <string>

namespace tav::showctl {

// Adds "play" to the "sequence" command group. `folder` is the group's
// --folder option (subsequences), read when the command runs.
void AddSequencePlayCommand(CLI::App* group, const std::string* folder);

}  // namespace tav::showctl
