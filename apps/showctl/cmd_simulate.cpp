// showctl simulate: runs the player over the user's schedules, shows,
// sequences and media on virtual time and prints what would happen, so that
// an unattended show can be checked before the evening it runs. The
// simulation itself is in simulation/; this file reads the options, prints
// the timeline and turns failures into the exit status: 0 when nothing
// failed, 1 when the player reported an error, 2 when the simulation could
// not run at all (a bad time, an unreadable settings file).

#include <fmt/format.h>

#include <iostream>
#include <memory>
#include <string>

#include "CommandRegistry.h"
#include "SettingsStore.h"
#include "TimeArguments.h"
#include "platform/PlatformPaths.h"
#include "simulation/Simulation.h"
#include "simulation/TimelineText.h"

namespace tav::showctl {
namespace {

constexpr int kExitFailed = 1;
constexpr int kExitCannotRun = 2;
constexpr int64_t kDefaultHours = 24;

struct SimulateOptions {
  std::string from;
  std::string to;
  std::string speed = "max";
  std::string onDemand;
  std::string file;
  bool onDemandOnly = false;
  bool information = false;
};

// Bad arguments are told apart from a simulation that found problems.
template <typename Read>
auto Argument(Read read) {
  try {
    return read();
  } catch (const CommandFailed& e) {
    throw CommandFailed(e.what(), kExitCannotRun);
  }
}

void Simulate(const SimulateOptions& o) {
  simulation::SimulationSetup setup;
  const DateTime now = LocalNow();
  setup.from = o.from.empty() ? now : Argument([&] { return MomentArgument(o.from, "from", now); });
  setup.to = o.to.empty() ? setup.from.AddSeconds(kDefaultHours * 3600)
                          : Argument([&] { return MomentArgument(o.to, "to", setup.from, true); });
  if (setup.to <= setup.from) {
    throw CommandFailed(fmt::format("the to time {} is not after the from time {}",
                                    setup.to.ToText(), setup.from.ToText()),
                        kExitCannotRun);
  }
  setup.speed = Argument([&] { return SpeedArgument(o.speed); });

  FileRegistryStore store = OpenSettingsStore(o.file);
  const RegistryDocument* settings = store.Content();
  if (!settings) {
    throw CommandFailed(fmt::format("cannot read the settings file {}", store.Path()),
                        kExitCannotRun);
  }
  setup.settings = *settings;
  setup.pathDefaults = SystemPathDefaults();
  setup.onDemandOnly = o.onDemandOnly;
  setup.onDemandShow = o.onDemand;
  setup.withInformation = o.information;

  std::cout << simulation::HeadingText(setup.from, setup.to) << "\n";
  const bool live = setup.speed > 0;
  if (live) {
    setup.onEvent = [](const simulation::TimelineEvent& event) {
      std::cout << simulation::EventLine(event) << std::endl;
    };
  }
  simulation::SimulationReport report = simulation::Simulate(setup);
  if (!live) {
    for (const auto& event : report.timeline.Events()) {
      std::cout << simulation::EventLine(event) << "\n";
    }
  }
  std::cout << simulation::SummaryText(report) << std::flush;
  if (report.Failed()) {
    const auto& timeline = report.timeline;
    const int64_t lines = timeline.Lines(simulation::EventKind::kError);
    const int64_t all = timeline.Count(simulation::EventKind::kError);
    if (lines == 0) throw CommandFailed("the player ended before the simulation did", kExitFailed);
    throw CommandFailed(
        fmt::format("the simulation found {} error{}{}", lines, lines == 1 ? "" : "s",
                    all == lines ? "" : fmt::format(" ({} times in all)", all)),
        kExitFailed);
  }
}

void Register(CLI::App& app) {
  auto o = std::make_shared<SimulateOptions>();
  auto* simulate = app.add_subcommand(
      "simulate",
      "Run the player on virtual time over your schedules, shows, sequences and media, and "
      "print what would play, when and why, with every warning and error. Nothing is sent to "
      "the lights, nothing is played aloud, no file is written. Exit status: 0 nothing failed, "
      "1 the player reported errors, 2 the simulation could not run");
  simulate->add_option("--from", o->from,
                       "Start: \"2024-12-24 17:00\", \"Tue 17:00\" or \"17:00\" (the next such "
                       "moment); default: now");
  simulate->add_option("--to", o->to,
                       "End, in the same forms (the next such moment after the start); default: "
                       "24 hours after the start");
  simulate
      ->add_option("--speed", o->speed,
                   "\"max\" to run as fast as possible and print the timeline at the end, or "
                   "a factor over real time, such as 60 (a minute each second), to watch it "
                   "as it goes")
      ->default_str("max");
  simulate->add_option("--on-demand", o->onDemand,
                       "A show file to request on demand for the whole span, as the tray would");
  simulate->add_flag("--on-demand-only", o->onDemandOnly,
                     "As the player started with /noschedule: the schedules do not count");
  simulate->add_flag("--info", o->information,
                     "Also list the player's information lines (loading, triggers, ...)");
  simulate->add_option("--file", o->file, "Settings file to use instead of the usual one");
  simulate->callback([o] { Simulate(*o); });
}

}  // namespace

static CommandGroup reg{"simulate", Register};

}  // namespace tav::showctl
