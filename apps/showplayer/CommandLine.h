#pragma once
// What the player's command line asks for. The player's own options
// (--help, --version, --view, --realtime) are taken out wherever they stand; everything
// else, joined with single blanks, is the command line the host compares
// exactly with "/noschedule" (so "/noschedule " in quotes, "/NOSCHEDULE" or
// "/noschedule x" leave the schedules on). Paths never come from here: they
// come from the environment.

#include <string>
#include <vector>

namespace tav::player {

// The priority --realtime asks for without a value: above ordinary real-time
// audio helpers' defaults, far below the kernel's own threads.
inline constexpr int kDefaultRealtimePriority = 20;

struct PlayerCommandLine {
  bool help = false;
  bool version = false;
  // --view or --view=SPEC: draw the levels in the terminal.
  bool view = false;
  std::string viewSpec;
  // --realtime or --realtime=PRIORITY: the loop at SCHED_FIFO (0: not asked).
  int realtimePriority = 0;
  // Not empty when one of our own options has a value it cannot take.
  std::string error;
  // What is left for the host.
  std::string commandLine;
};

// `args` without the program name.
PlayerCommandLine ParsePlayerCommandLine(const std::vector<std::string>& args);

// The text of --help.
std::string PlayerHelpText();

}  // namespace tav::player
