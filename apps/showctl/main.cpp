// showctl: the command-line companion of the show player. It makes and reads
// schedules, inspects sequences, edits settings and, while the player runs,
// speaks to it as the tray program does.

#include <algorithm>
#include <cstdio>
#include <iostream>

#include "CommandRegistry.h"
#include "support/Error.h"

namespace tav::showctl {

CommandGroup::CommandGroup(std::string name, RegisterFn registerFn) {
  CommandGroups().push_back({std::move(name), std::move(registerFn)});
}

std::vector<RegisteredGroup>& CommandGroups() {
  static std::vector<RegisteredGroup> groups;
  return groups;
}

}  // namespace tav::showctl

int main(int argc, char** argv) {
  using namespace tav::showctl;
  CLI::App app{
      "showctl - make schedules, inspect sequences, edit settings and control the show player"};
  app.require_subcommand(1);
  app.set_version_flag("--version", "showctl 0.1.0");
  auto& groups = CommandGroups();
  std::sort(groups.begin(), groups.end(),
            [](const RegisteredGroup& a, const RegisteredGroup& b) { return a.name < b.name; });
  for (auto& group : groups) group.registerFn(app);
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& e) {
    return app.exit(e);
  } catch (const CommandFailed& e) {
    std::cerr << "showctl: " << e.what() << "\n";
    return e.exitCode;
  } catch (const tav::Error& e) {
    std::cerr << "showctl: " << e.Description() << " (" << e.Source() << ", error " << e.Number()
              << ")\n";
    return 1;
  } catch (const std::exception& e) {
    std::cerr << "showctl: " << e.what() << "\n";
    return 1;
  }
  return 0;
}
