// How long `showctl simulate` takes for a simulated day. The demo display
// (examples/demo, assembled by make_demo.py) plays under three week
// schedules: a typical one, the demo show every evening from 17:00 to 22:00;
// a longer evening to 23:00; and the demo's own, the show around the clock
// (the heaviest day there is: 16 universes at 40 frames a second for 24
// hours). Each day is simulated from
// noon to noon, as fast as possible, exactly as the command does it, and
// the wall time is printed with what was simulated.
//
//   python3 examples/demo/make_demo.py build/demo/data
//   build/release/bench/bench_simulate build/demo/data examples/demo/settings.reg

#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include <unistd.h>

#include "config/MemoryRegistryStore.h"
#include "config/RegistryFileFormat.h"
#include "config/Settings.h"
#include "simulation/Simulation.h"
#include "support/DateTime.h"

namespace {

namespace fs = std::filesystem;
using tav::DateTime;
using namespace tav::simulation;

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::stringstream bytes;
  bytes << in.rdbuf();
  return bytes.str();
}

// The demo show every day from `fromHour` to `toHour`.
std::string DailyWeekSchedule(int fromHour, int toHour) {
  std::string text;
  for (int day = 0; day < 7; ++day) {
    int from = day * 86400 + fromHour * 3600, to = day * 86400 + toHour * 3600;
    text += (text.empty() ? "((" : ",(") + std::to_string(to % 604800) + ",2,(, 0,demo.show)," +
            std::to_string(from) + ")";
  }
  return text + ")\r\n";
}

void Day(const char* name, const fs::path& data, const std::string& weekSchedule,
         const tav::RegistryDocument& settings) {
  std::ofstream(data / "weeksched.tsc", std::ios::binary) << weekSchedule;
  SimulationSetup setup;
  setup.from = DateTime::FromParts(2024, 12, 24, 12, 0, 0);
  setup.to = setup.from.AddDays(1);
  setup.settings = settings;
  setup.pathDefaults = tav::PathDefaults{data.string() + "/", data.string() + "/", '/'};
  auto start = std::chrono::steady_clock::now();
  SimulationReport report = Simulate(setup);
  double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  std::printf(
      "%-34s %7.2f s wall  %8.0fx real time  %3lld shows  %6lld sequences  %9llu frames"
      "  %lld errors\n",
      name, seconds, 86400.0 / seconds,
      static_cast<long long>(report.timeline.Count(EventKind::kShowStart)),
      static_cast<long long>(report.timeline.Count(EventKind::kSequenceStart)),
      static_cast<unsigned long long>(report.outputs.frames),
      static_cast<long long>(report.timeline.Count(EventKind::kError)));
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::fprintf(stderr, "usage: bench_simulate DEMO_DATA_FOLDER DEMO_SETTINGS_REG\n");
    return 2;
  }
  // A copy of the demo, so that its own week schedule stays as it is.
  fs::path data = fs::temp_directory_path() / ("tav-bench-simulate-" + std::to_string(getpid()));
  fs::copy(argv[1], data, fs::copy_options::recursive);

  tav::MemoryRegistryStore registry;
  tav::ApplyRegistryFile(tav::ParseRegistryFile(ReadFile(argv[2])), registry.Document(), false);
  tav::Settings(registry, tav::PathDefaults{})
      .Set(tav::settings::kUserDataPath, data.string() + "/");

  std::printf("bench_simulate: one simulated day (noon to noon) of the demo display\n");
  Day("evenings 17:00-22:00 (typical)", data, DailyWeekSchedule(17, 22), registry.Document());
  Day("evenings 17:00-23:00", data, DailyWeekSchedule(17, 23), registry.Document());
  Day("around the clock (the demo's own)", data, ReadFile(fs::path(argv[1]) / "weeksched.tsc"),
      registry.Document());
  fs::remove_all(data);
  return 0;
}
