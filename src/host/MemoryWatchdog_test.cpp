// The restart check against the real schedule lookups, a settable memory
// probe and the settings over an in-memory registry.

#include "host/MemoryWatchdog.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "config/MemoryRegistryStore.h"
#include "ports/testing/FixedProcessMemory.h"
#include "ports/testing/ManualClock.h"
#include "schedule/ScheduleLookup.h"
#include "schedule/WeekTime.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr int32_t kMiB = 1024 * 1024;

// The host as the watchdog sees it: schedules answered by the lookups, the
// running show, and the shutdowns asked for.
class ScheduleHost : public TrayHost {
 public:
  void ImmediateShutdown(const std::string& szReason) override { shutdowns.push_back(szReason); }
  void GracefulShutdown() override {}
  void LoadSchedules() override {}
  void ShowOnDemand(const std::string&) override {}
  void SetOnDemandOnly(bool) override {}
  void SimulateInput(int32_t, int32_t, int32_t) override {}
  bool Initialized() const override { return true; }
  std::shared_ptr<MonitoredShowEvent> CurrentShowEvent(DateTime t) override {
    return tav::CurrentShowEvent(state, t).Event;
  }
  std::shared_ptr<MonitoredShowEvent> RunningShowEvent() override { return running; }
  std::shared_ptr<MonitoredShowEvent> NextShowEvent(
      const std::shared_ptr<MonitoredShowEvent>& current, DateTime t) override {
    if (nextOverride) return nextOverride;
    return tav::NextShowEvent(state, current, t).Event;
  }

  ScheduleState state;
  std::shared_ptr<MonitoredShowEvent> running;
  std::shared_ptr<MonitoredShowEvent> nextOverride;
  std::vector<std::string> shutdowns;
};

// Tuesday 24 December 2024; the week schedule has Xmas on Tuesdays from
// 18:00 to 22:00. The program started an hour before "now".
class WatchdogBench {
 public:
  WatchdogBench() {
    auto week = std::make_shared<Schedule>();
    week->AddShowEventByFile("Xmas", NewWeekTime(2, 18, 0, 0), NewWeekTime(2, 22, 0, 0));
    host.state.Week = week;
    At(17, 0, 0);
    state.startTime = clock.Now().AddSeconds(-3600);
    memory.Set(100 * kMiB);
  }
  void At(int hour, int minute, int second) {
    clock.SetNow(DateTime::FromParts(2024, 12, 24, hour, minute, second));
  }
  bool Restarts() {
    host.shutdowns.clear();
    watchdog.ShutdownForRestartIfNecessary(state, host);
    return !host.shutdowns.empty();
  }

  MemoryRegistryStore registry;
  Settings settings{registry, PathDefaults{}};
  FixedProcessMemory memory;
  ManualClock clock;
  ScheduleHost host;
  WatchdogHostState state;
  MemoryWatchdog watchdog{settings, memory, clock};
};

class WatchdogTest : public ::testing::Test, public WatchdogBench {};

TEST_F(WatchdogTest, RestartsWhenIdleWithMemoryHighAndNoShowSoon) {
  EXPECT_TRUE(Restarts());
  EXPECT_THAT(host.shutdowns, ElementsAre("Show Player shutting down for restart"));
}

TEST_F(WatchdogTest, TheNextShowMustBeMoreThanTheThresholdAway) {
  At(17, 58, 59);  // Xmas in 61 s
  EXPECT_TRUE(Restarts());
  At(17, 59, 0);  // in 60 s
  EXPECT_FALSE(Restarts());
  settings.Set(settings::kMonitorRestartSecondsThreshold, 59);
  EXPECT_TRUE(Restarts());
}

TEST_F(WatchdogTest, NothingScheduledAtAllRestarts) {
  host.state.Week = std::make_shared<Schedule>();
  At(17, 59, 59);
  EXPECT_TRUE(Restarts());
}

TEST_F(WatchdogTest, EachStopConditionPreventsTheRestart) {
  struct Case {
    std::string name;
    std::function<void(WatchdogBench&)> arrange;
  };
  const Case cases[] = {
      {"graceful shutdown pending",
       [](WatchdogBench& t) { t.state.gracefulShutdownPending = true; }},
      {"immediate shutdown asked", [](WatchdogBench& t) { t.state.shutdownRequested = true; }},
      {"restart switched off",
       [](WatchdogBench& t) { t.settings.Set(settings::kMonitorRestart, false); }},
      {"memory below the threshold", [](WatchdogBench& t) { t.memory.Set(100 * kMiB - 1); }},
      {"memory cannot be measured", [](WatchdogBench& t) { t.memory.Fail(5); }},
      {"a show runs",
       [](WatchdogBench& t) { t.host.running = std::make_shared<MonitoredShowEvent>(); }},
      {"a show is due now", [](WatchdogBench& t) { t.At(18, 30, 0); }},
      {"a next show without a start",
       [](WatchdogBench& t) {
         t.host.nextOverride = std::make_shared<MonitoredShowEvent>();
         t.host.nextOverride->SetFilename("Open");
       }},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    WatchdogBench t;
    ASSERT_TRUE(t.Restarts());
    c.arrange(t);
    EXPECT_FALSE(t.Restarts());
  }
}

TEST_F(WatchdogTest, NoRestartSoonAfterStartUnlessAScheduledShowWasLoaded) {
  state.startTime = clock.Now().AddSeconds(-299);
  EXPECT_FALSE(Restarts());
  state.showLoadedSinceStart = true;
  EXPECT_TRUE(Restarts());
  state.showLoadedSinceStart = false;
  state.startTime = clock.Now().AddSeconds(-300);
  EXPECT_TRUE(Restarts());
  // The window is a setting, read at every check.
  settings.Set(settings::kMonitorRestartSuppressSeconds, 600);
  EXPECT_FALSE(Restarts());
}

}  // namespace
}  // namespace tav
