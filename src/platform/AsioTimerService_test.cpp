#include "platform/AsioTimerService.h"

#include <gtest/gtest.h>

#include <csignal>
#include <stdexcept>

#include "platform/EventLoop.h"

// These run the real loop for short spans. They check what happens and in
// which order, never how long it took, so a loaded machine cannot fail them.

namespace tav {
namespace {

TEST(AsioTimerService, TicksUntilTheHandlerStopsItsOwnTimerAndTheLoop) {
  EventLoop loop;
  AsioTimerService timers(loop);
  int fastTicks = 0;
  std::unique_ptr<Timer> fast;
  fast = timers.CreateTimer("fast", 1, true, [&] {
    if (++fastTicks == 20) {
      fast->SetEnabled(false);
      loop.Stop();
    }
  });
  loop.Run();
  EXPECT_EQ(fastTicks, 20);
  EXPECT_FALSE(fast->Enabled());
}

TEST(AsioTimerService, DisabledZeroIntervalAndDestroyedTimersNeverTick) {
  EventLoop loop;
  AsioTimerService timers(loop);
  int wrong = 0;
  auto disabled = timers.CreateTimer("disabled", 1, false, [&] { ++wrong; });
  auto zero = timers.CreateTimer("zero", 0, true, [&] { ++wrong; });
  auto destroyed = timers.CreateTimer("destroyed", 1, true, [&] { ++wrong; });
  destroyed.reset();
  auto toggled = timers.CreateTimer("toggled", 1, true, [&] { ++wrong; });
  toggled->SetEnabled(false);
  int stopTicks = 0;
  auto stopper = timers.CreateTimer("stopper", 5, true, [&] {
    if (++stopTicks == 3) loop.Stop();
  });
  loop.Run();
  EXPECT_EQ(wrong, 0);
  EXPECT_EQ(stopTicks, 3);
}

TEST(AsioTimerService, HandlerMayDestroyItselfAndOthersAndChangeIntervals) {
  EventLoop loop;
  AsioTimerService timers(loop);
  int victimTicks = 0, slowTicks = 0;
  std::unique_ptr<Timer> victim = timers.CreateTimer("victim", 1, true, [&] { ++victimTicks; });
  std::unique_ptr<Timer> slow;
  slow = timers.CreateTimer("slow", 1000, true, [&] {
    ++slowTicks;
    loop.Stop();
  });
  std::unique_ptr<Timer> killer;
  killer = timers.CreateTimer("killer", 3, true, [&] {
    victim.reset();
    slow->SetInterval(2);
    killer.reset();
  });
  loop.Run();
  EXPECT_EQ(killer, nullptr);
  EXPECT_EQ(victim, nullptr);
  EXPECT_EQ(slowTicks, 1);
}

TEST(AsioTimerService, TimersEnabledOrMadeInsideATickAreScheduled) {
  EventLoop loop;
  AsioTimerService timers(loop);
  std::vector<std::string> order;
  std::unique_ptr<Timer> later = timers.CreateTimer("later", 2, false, [&] {
    order.push_back("later");
    loop.Stop();
  });
  std::unique_ptr<Timer> made;
  std::unique_ptr<Timer> once;
  once = timers.CreateTimer("once", 1, true, [&] {
    order.push_back("once");
    once->SetEnabled(false);
    // Both count from this tick; the one-shot made here is due first.
    later->SetEnabled(true);
    made = timers.CreateTimer("made", 1, true, [&] {
      order.push_back("made");
      made->SetEnabled(false);
    });
  });
  loop.Run();
  EXPECT_EQ(order, (std::vector<std::string>{"once", "made", "later"}));
}

TEST(AsioTimerService, EscapingFailureIsReportedAndTheTimerGoesOn) {
  EventLoop loop;
  AsioTimerService timers(loop);
  std::vector<std::string> reports;
  timers.SetFailureReporter([&](const std::string& name, const std::string& what) {
    reports.push_back(name + ": " + what);
  });
  int ticks = 0;
  auto t = timers.CreateTimer("tmrCheckRegistry", 1, true, [&] {
    if (++ticks == 3) loop.Stop();
    if (ticks < 3) throw std::runtime_error("callback failed");
  });
  loop.Run();
  EXPECT_EQ(ticks, 3);
  EXPECT_EQ(reports, (std::vector<std::string>{"tmrCheckRegistry: callback failed",
                                               "tmrCheckRegistry: callback failed"}));
}

TEST(AsioTimerService, NextTickInWakesASleepingTimerOnTheNextTurnOfTheLoop) {
  EventLoop loop;
  AsioTimerService timers(loop);
  std::vector<std::string> order;
  // A timer asleep for an hour, and a zero-interval timer that ticks only
  // when asked.
  std::unique_ptr<Timer> sleeper;
  sleeper = timers.CreateTimer("sleeper", 3'600'000, true, [&] {
    order.push_back("sleeper");
    if (order.size() >= 4) loop.Stop();
  });
  std::unique_ptr<Timer> oneShot = timers.CreateTimer("once", 0, true, [&] {
    order.push_back("once");
    sleeper->SetNextTickIn(0);
  });
  std::unique_ptr<Timer> starter;
  starter = timers.CreateTimer("starter", 1, true, [&] {
    order.push_back("starter");
    starter->SetEnabled(false);
    oneShot->SetNextTickIn(2);
    sleeper->SetNextTickIn(0);
    // Not run inside this batch: the tick comes after this handler.
    order.push_back("starter done");
  });
  loop.Run();
  EXPECT_EQ(order,
            (std::vector<std::string>{"starter", "starter done", "sleeper", "once", "sleeper"}));
}

TEST(EventLoop, PostedWorkAndSignalsRunOnTheLoop) {
  EventLoop loop;
  std::vector<std::string> seen;
  loop.OnSignal(SIGUSR1, [&](int signalNumber) {
    seen.push_back("signal " + std::to_string(signalNumber));
    loop.Stop();
  });
  loop.Post([&] {
    seen.push_back("posted");
    std::raise(SIGUSR1);
  });
  loop.Run();
  EXPECT_EQ(seen, (std::vector<std::string>{"posted", "signal " + std::to_string(SIGUSR1)}));
  EXPECT_TRUE(loop.Stopped());
  // The loop can run again after a stop.
  loop.Post([&] { seen.push_back("again"); });
  loop.RunFor(std::chrono::milliseconds(20));
  EXPECT_EQ(seen.back(), "again");
}

}  // namespace
}  // namespace tav
