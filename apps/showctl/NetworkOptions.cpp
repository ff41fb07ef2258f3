#include "NetworkOptions.h"

#include <iostream>
#include <utility>

#include "SettingsStore.h"

namespace tav::showctl {

const char* const kNetworkFooter =
    "Without options the command shows the values; with options it changes only those, saves "
    "and tells a running player (through the \"Ver\" value) to reopen the networks. A value "
    "out of range changes nothing. \"\" clears a text value.";
void Warn(const std::string& text) {
  std::cerr << "showctl: warning: " << text << "\n";
}

NetworkPreferences ReadAndWarn(FileRegistryStore& store) {
  NetworkPreferences prefs;
  prefs.InitFromRegistry(store);
  for (const auto& problem : prefs.Problems()) Warn(problem);
  for (const auto& line : OutOfRange(prefs)) Warn(line);
  return prefs;
}

void ShowOrChange(const NetworkCommon& common, bool change,
                  const std::function<void(NetworkPreferences&)>& apply, const View& view,
                  RangeCheck check) {
  FileRegistryStore store = OpenSettingsStore(common.file);
  if (!change) {
    std::cout << view(ReadAndWarn(store));
    return;
  }
  NetworkEditResult result = EditNetworkPreferences(store, apply, check);
  for (const auto& problem : result.problems) {
    Warn(result.changed ? problem + " (now saved)" : problem);
  }
  for (const auto& line : OutOfRange(result.prefs)) Warn(line);
  std::cout << view(result.prefs);
  if (!result.changed) std::cout << "(no change: nothing was saved)\n";
}

// Value names for --help, by option: what each option takes.
void NameValues(CLI::App* command) {
  static const std::vector<std::pair<std::string, const char*>> kNames = {
      {"port", "DEVICE"},
      {"speed", "BAUD"},
      {"old-mcp", "on|off"},
      {"enhanced", "on|off"},
      {"enabled", "on|off"},
      {"header-per-bank", "on|off"},
      {"clamp-special-values", "on|off"},
      {"transport", "NAME"},
      {"destination", "ADDRESS"},
      {"interface", "INTERFACE"},
      {"source-name", "TEXT"},
      {"source-cid", "UUID"},
      {"house-codes", "LETTERS"},
      {"file", "FILE"},
      {"UNIVERSES", "U|U1-U2"},
  };
  for (CLI::Option* option : command->get_options()) {
    if (option->get_type_name().empty()) continue;  // a flag
    std::string key = option->get_lnames().empty() ? option->get_name() : option->get_lnames()[0];
    const char* name = "N";
    for (const auto& [known, value] : kNames) {
      if (key == known) name = value;
    }
    option->type_name(name);
  }
  for (CLI::App* sub : command->get_subcommands({})) NameValues(sub);
}

}  // namespace tav::showctl
