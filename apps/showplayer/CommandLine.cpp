#include "CommandLine.h"

#include <stdexcept>

namespace tav::player {

PlayerCommandLine ParsePlayerCommandLine(const std::vector<std::string>& args) {
  PlayerCommandLine parsed;
  std::vector<std::string> rest;
  for (const std::string& arg : args) {
    if (arg == "--help" || arg == "-h") {
      parsed.help = true;
    } else if (arg == "--version") {
      parsed.version = true;
    } else if (arg == "--view") {
      parsed.view = true;
    } else if (arg.rfind("--view=", 0) == 0) {
      parsed.view = true;
      parsed.viewSpec = arg.substr(7);
    } else if (arg == "--realtime") {
      parsed.realtimePriority = kDefaultRealtimePriority;
    } else if (arg.rfind("--realtime=", 0) == 0) {
      std::string value = arg.substr(11);
      int priority = 0;
      size_t used = 0;
      try {
        priority = std::stoi(value, &used);
      } catch (const std::exception&) {
        used = 0;
      }
      if (used != value.size() || value.empty() || priority < 1 || priority > 99) {
        parsed.error = "--realtime=" + value + ": the priority is a whole number from 1 to 99";
      } else {
        parsed.realtimePriority = priority;
      }
    } else {
      rest.push_back(arg);
    }
  }
  for (size_t i = 0; i < rest.size(); ++i) {
    if (i > 0) parsed.commandLine += ' ';
    parsed.commandLine += rest[i];
  }
  return parsed;
}

std::string PlayerHelpText() {
  return R"(showplayer - the unattended show player of the Tessavar suite

Usage: showplayer [--view[=UNIVERSES]] [--realtime[=PRIORITY]] [/noschedule]

Plays the show that the week schedule, the year schedule or a show on demand
makes current, drives the lighting networks, plays the music and reports to
the tray program (or to `showctl monitor`).

  /noschedule        play shows on demand only; the schedules are ignored until
                     `showctl schedules-on` (exactly this text, nothing else)
  --view[=LIST]      draw the levels in the terminal a few times a second, with
                     the log below them; LIST chooses universes (e.g. 1-4,13)
  --realtime[=N]     keep the lights' deadlines at real-time priority N (1-99,
                     default 20) on a busy machine; needs CAP_SYS_NICE or an
                     RLIMIT_RTPRIO allowance (docs/running.md); refused: one
                     warning, and the player plays at normal priority
  --help             print this help and end
  --version          print the version and end

Files (from the environment, never from the command line):
  settings           $TAV_REGISTRY_FILE, else $XDG_CONFIG_HOME/tessavar/registry.reg,
                     else ~/.config/tessavar/registry.reg
  user data folder   the UserDataPath setting, else $XDG_DATA_HOME/tessavar/,
                     else ~/.local/share/tessavar/ (schedules, shows, Sequences/, Media/)
  tray socket        $TAV_TRAY_SOCKET, else $XDG_RUNTIME_DIR/tessavar/showplayer.sock,
                     else /tmp/tessavar-<uid>/showplayer.sock; the instance lock
                     showplayer.lock lies beside it

Signals: SIGTERM or SIGINT lets the current show play its shutdown section and
then ends the player (as `showctl shutdown`); a second one ends it at once.

Exit status:
  0   ended as asked (shutdown from the tray, showctl or a signal)
  1   shows could not be enabled (the reason is on standard error and in the log)
  2   --view or --realtime had a value they cannot take
  3   another show player is already running on this tray socket
  75  ended for a restart because its memory grew too large (the memory
      watchdog); the service manager is expected to start it again
)";
}

}  // namespace tav::player
