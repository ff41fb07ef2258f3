// showplayer: the unattended show player. Everything but --help and
// --version is the host form's business (Player.h); the command line is
// handed to it as it stands.

#include <cstdio>
#include <string>
#include <vector>

#include "CommandLine.h"
#include "Player.h"

#ifndef TAV_VERSION
#define TAV_VERSION "0.0.0"
#endif

int main(int argc, char** argv) {
  using namespace tav::player;
  std::vector<std::string> args(argv + 1, argv + argc);
  PlayerCommandLine parsed = ParsePlayerCommandLine(args);
  if (parsed.help) {
    std::fputs(PlayerHelpText().c_str(), stdout);
    return 0;
  }
  if (parsed.version) {
    std::printf("showplayer %s\n", TAV_VERSION);
    return 0;
  }
  if (!parsed.error.empty()) {
    std::fprintf(stderr, "showplayer: %s\n", parsed.error.c_str());
    return kExitUsage;
  }
  return RunPlayer({parsed.commandLine, parsed.view, parsed.viewSpec, parsed.realtimePriority});
}
