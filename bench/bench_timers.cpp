// What the timer service costs while the player idles with its standing
// timers enabled: two 1 s timers (tmNextAction, tmrLightsActive), the
// registry watcher's 1 s tmrCheckRegistry and two 1 ms timers (tmrShowPlayer
// and tmrTAVMsgQueue), with empty tick handlers, on the real event loop for a
// few seconds of wall time. Prints CPU milliseconds per wall second (user +
// system, from getrusage), wakeups per second (voluntary context switches:
// each is the loop going to sleep until its next deadline) and the ticks each
// timer got, with the 1 ms timer's interval spread.
//
//   bench_timers [seconds=3] [max CPU ms per second: exit 1 above it]

#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "platform/AsioTimerService.h"
#include "platform/EventLoop.h"

namespace {

using SteadyClock = std::chrono::steady_clock;

struct Usage {
  double cpuMs;
  long voluntarySwitches;
  long involuntarySwitches;
};

Usage Now() {
  rusage usage{};
  getrusage(RUSAGE_SELF, &usage);
  auto ms = [](const timeval& t) { return t.tv_sec * 1000.0 + t.tv_usec / 1000.0; };
  return {ms(usage.ru_utime) + ms(usage.ru_stime), usage.ru_nvcsw, usage.ru_nivcsw};
}

double Percentile(std::vector<double> values, double fraction) {
  if (values.empty()) return 0;
  std::sort(values.begin(), values.end());
  size_t index = static_cast<size_t>(fraction * static_cast<double>(values.size() - 1));
  return values[index];
}

}  // namespace

int main(int argc, char** argv) {
  const double seconds = argc > 1 ? std::atof(argv[1]) : 3.0;
  const double maxCpuMs = argc > 2 ? std::atof(argv[2]) : 0.0;

  tav::EventLoop loop;
  tav::AsioTimerService timers(loop);

  struct Standing {
    const char* name;
    uint32_t interval;
    long ticks = 0;
  };
  std::vector<Standing> standing = {{"tmNextAction", 1000},
                                    {"tmrLightsActive", 1000},
                                    {"tmrCheckRegistry", 1000},
                                    {"tmrShowPlayer", 1},
                                    {"tmrTAVMsgQueue", 1}};
  std::vector<double> showPlayerGapsMs;
  showPlayerGapsMs.reserve(static_cast<size_t>(seconds * 1100));
  SteadyClock::time_point lastShowPlayerTick{};

  std::vector<std::unique_ptr<tav::Timer>> made;
  for (auto& timer : standing) {
    Standing* t = &timer;
    bool isShowPlayer = std::string(timer.name) == "tmrShowPlayer";
    made.push_back(timers.CreateTimer(timer.name, timer.interval, true, [&, t, isShowPlayer] {
      ++t->ticks;
      if (!isShowPlayer) return;
      auto now = SteadyClock::now();
      if (lastShowPlayerTick != SteadyClock::time_point{}) {
        showPlayerGapsMs.push_back(
            std::chrono::duration<double, std::milli>(now - lastShowPlayerTick).count());
      }
      lastShowPlayerTick = now;
    }));
  }

  Usage before = Now();
  auto start = SteadyClock::now();
  loop.RunFor(std::chrono::milliseconds(static_cast<int64_t>(seconds * 1000)));
  double wall = std::chrono::duration<double>(SteadyClock::now() - start).count();
  Usage after = Now();

  double cpuPerSecond = (after.cpuMs - before.cpuMs) / wall;
  double wakeups = static_cast<double>(after.voluntarySwitches - before.voluntarySwitches) / wall;
  double preempted =
      static_cast<double>(after.involuntarySwitches - before.involuntarySwitches) / wall;

  std::printf("idle with standing timers for %.2f s of wall time\n", wall);
  std::printf("CPU per wall second:   %8.2f ms  (%.2f%% of one core)\n", cpuPerSecond,
              cpuPerSecond / 10.0);
  std::printf("wakeups per second:    %8.0f  (voluntary context switches)\n", wakeups);
  std::printf("preemptions per second:%8.0f  (involuntary context switches)\n", preempted);
  for (const auto& t : standing) {
    std::printf("  %-18s %5u ms  %8.1f ticks/s\n", t.name, t.interval,
                static_cast<double>(t.ticks) / wall);
  }
  std::printf("tmrShowPlayer interval: p50 %.3f ms, p99 %.3f ms, max %.3f ms\n",
              Percentile(showPlayerGapsMs, 0.50), Percentile(showPlayerGapsMs, 0.99),
              Percentile(showPlayerGapsMs, 1.0));
  if (maxCpuMs > 0 && cpuPerSecond > maxCpuMs) {
    std::printf("FAILED: %.2f ms CPU per second is above the limit of %.2f ms\n", cpuPerSecond,
                maxCpuMs);
    return 1;
  }
  return 0;
}
