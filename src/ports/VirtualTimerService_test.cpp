#include "ports/VirtualTimerService.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "ports/ManualClock.h"
#include "ports/testing/FixedProcessMemory.h"

namespace tav {
namespace {

// Records "name@ms" for every tick, so a case reads as the expected trace.
class VirtualTimersTest : public ::testing::Test {
 protected:
  std::unique_ptr<Timer> Make(const std::string& name, uint32_t interval, bool enabled = true,
                              std::function<void()> extra = nullptr) {
    return timers.CreateTimer(name, interval, enabled, [this, name, extra] {
      trace += name + "@" + std::to_string(timers.NowMs()) + " ";
      if (extra) extra();
    });
  }

  VirtualTimerService timers;
  std::string trace;
};

TEST_F(VirtualTimersTest, TicksFireInTimeOrderAndTiesInArmingOrder) {
  auto slow = Make("slow", 300);
  auto fast = Make("fast", 200);
  auto idle = Make("idle", 100, false);
  timers.Advance(700);
  EXPECT_EQ(trace, "fast@200 slow@300 fast@400 slow@600 fast@600 ");
  EXPECT_EQ(timers.NowMs(), 700u);
  EXPECT_EQ(timers.TicksFired("fast"), 3u);
  EXPECT_EQ(timers.TicksFired("idle"), 0u);
}

TEST_F(VirtualTimersTest, OneMillisecondTimerTicksEveryMillisecond) {
  auto fast = Make("t", 1);
  timers.Advance(5);
  EXPECT_EQ(trace, "t@1 t@2 t@3 t@4 t@5 ");
  trace.clear();
  timers.Advance(1000);
  EXPECT_EQ(timers.TicksFired("t"), 1005u);
}

TEST_F(VirtualTimersTest, ZeroIntervalNeverTicksButStaysEnabled) {
  auto t = Make("t", 0);
  timers.Advance(10'000);
  EXPECT_EQ(trace, "");
  EXPECT_TRUE(t->Enabled());
  EXPECT_FALSE(timers.NextTickIn());
  t->SetInterval(50);
  timers.Advance(100);
  EXPECT_EQ(trace, "t@10050 t@10100 ");
}

TEST_F(VirtualTimersTest, HandlerMayDisableItsOwnTimer) {
  std::unique_ptr<Timer> once;
  once = Make("once", 4000, true, [&] { once->SetEnabled(false); });
  timers.Advance(20'000);
  EXPECT_EQ(trace, "once@4000 ");
  EXPECT_FALSE(once->Enabled());
}

TEST_F(VirtualTimersTest, IntervalChangedInsideTickCountsFromThatTick) {
  std::unique_ptr<Timer> t;
  t = Make("t", 100, true, [&] { t->SetInterval(t->Interval() * 2); });
  timers.Advance(1000);
  EXPECT_EQ(trace, "t@100 t@300 t@700 ");
}

TEST_F(VirtualTimersTest, EnablingRestartsTheIntervalAndReEnablingWhileOnDoesNot) {
  auto t = Make("t", 1000);
  timers.Advance(600);
  t->SetEnabled(true);  // already on: keeps its phase
  timers.Advance(500);
  EXPECT_EQ(trace, "t@1000 ");
  t->SetEnabled(false);
  timers.Advance(300);
  t->SetEnabled(true);  // at 1400: next tick at 2400, not 2000
  timers.Advance(1100);
  EXPECT_EQ(trace, "t@1000 t@2400 ");
}

TEST_F(VirtualTimersTest, HandlerMayDestroyOtherTimersAndItself) {
  std::unique_ptr<Timer> victim = Make("victim", 100);
  std::unique_ptr<Timer> killer;
  killer = Make("killer", 100, true, [&] {
    victim.reset();
    killer.reset();
  });
  // Both fall due at 100; the victim was armed first so it still ticks once.
  timers.Advance(1000);
  EXPECT_EQ(trace, "victim@100 killer@100 ");
  EXPECT_EQ(timers.Find("killer"), nullptr);
}

TEST_F(VirtualTimersTest, HandlerMayEnableAnotherTimerWhichCountsFromNow) {
  auto second = Make("second", 1000, false);
  auto first = Make("first", 4000, true, [&] { second->SetEnabled(true); });
  timers.Advance(6000);
  EXPECT_EQ(trace, "first@4000 second@5000 second@6000 ");
}

TEST_F(VirtualTimersTest, ThrowingHandlerStopsAdvanceAtItsTickAndKeepsTicking) {
  int calls = 0;
  auto t = timers.CreateTimer("t", 100, true, [&] {
    if (++calls == 2) throw std::runtime_error("boom");
  });
  EXPECT_THROW(timers.Advance(1000), std::runtime_error);
  EXPECT_EQ(timers.NowMs(), 200u);
  timers.Advance(100);
  EXPECT_EQ(calls, 3);
}

TEST_F(VirtualTimersTest, AdvancingFromAHandlerIsRefused) {
  auto t = timers.CreateTimer("t", 10, true, [&] { timers.Advance(5); });
  EXPECT_THROW(timers.Advance(10), std::logic_error);
  // The service is usable afterwards.
  t->SetEnabled(false);
  timers.Advance(10);
}

TEST_F(VirtualTimersTest, FireNextTickJumpsToTheNextDueTick) {
  EXPECT_FALSE(timers.FireNextTick());
  auto t = Make("t", 250);
  EXPECT_EQ(timers.NextTickIn(), 250u);
  EXPECT_TRUE(timers.FireNextTick());
  EXPECT_EQ(trace, "t@250 ");
  EXPECT_EQ(timers.ArmedTimerNames(), std::vector<std::string>{"t"});
}

TEST_F(VirtualTimersTest, NextTickCanBeMovedAndLaterTicksFollowByTheInterval) {
  std::unique_ptr<Timer> t;
  bool moved = false;
  t = Make("t", 100, true, [&] {
    if (!moved) t->SetNextTickIn(250);
    moved = true;
  });
  timers.Advance(700);
  // The first tick asked for the next one 250 ms later; then every 100 ms.
  EXPECT_EQ(trace, "t@100 t@350 t@450 t@550 t@650 ");
}

TEST_F(VirtualTimersTest, NextTickInZeroFiresAtTheSameMomentAfterTheRunningHandler) {
  std::unique_ptr<Timer> sleeper = Make("sleeper", 1000);
  sleeper->SetNextTickIn(5000);
  std::unique_ptr<Timer> waker = Make("waker", 300, true, [&] { sleeper->SetNextTickIn(0); });
  timers.Advance(300);
  EXPECT_EQ(trace, "waker@300 sleeper@300 ");
  // Asked from outside a handler, the tick comes at the present moment.
  trace.clear();
  timers.Advance(10);
  sleeper->SetNextTickIn(0);
  EXPECT_EQ(timers.NextTickIn(), 0u);
  timers.Advance(0);
  EXPECT_EQ(trace, "sleeper@310 ");
}

TEST_F(VirtualTimersTest, ZeroIntervalTimerTicksOncePerRequestAndDisabledIgnoresRequests) {
  std::unique_ptr<Timer> oneShot = Make("once", 0);
  oneShot->SetNextTickIn(40);
  auto off = Make("off", 0, false);
  off->SetNextTickIn(10);
  timers.Advance(1000);
  EXPECT_EQ(trace, "once@40 ");
  oneShot->SetNextTickIn(0);
  timers.Advance(1);
  EXPECT_EQ(trace, "once@40 once@1000 ");
  EXPECT_FALSE(timers.NextTickIn());
}

TEST_F(VirtualTimersTest, TimersMayOutliveTheService) {
  std::unique_ptr<Timer> t;
  {
    VirtualTimerService shortLived;
    t = shortLived.CreateTimer("t", 10, true, nullptr);
  }
  t->SetInterval(20);
  t.reset();
}

TEST(ManualClock, FollowsVirtualTimeInWholeSecondsAndTicksInMilliseconds) {
  VirtualTimerService timers;
  ManualClock clock(DateTime::FromParts(2024, 12, 24, 17, 59, 58), 4'294'967'000u);
  clock.Follow(timers);
  std::string seen;
  auto t = timers.CreateTimer("t", 1500, true, [&] { seen += clock.Now().TimeText() + " "; });
  timers.Advance(3000);
  EXPECT_EQ(seen, "17:59:59 18:00:01 ");
  EXPECT_EQ(clock.TickCount(), 4'294'967'000u + 3000u);  // wrapped past 2^32
  EXPECT_EQ(clock.TickCount(), 2704u);
}

TEST(ManualClock, SecondsSinceMidnightCarriesTheMilliseconds) {
  VirtualTimerService timers;
  ManualClock clock(DateTime::FromParts(2024, 12, 24, 23, 59, 58));
  clock.Follow(timers);
  timers.Advance(1250);
  EXPECT_DOUBLE_EQ(clock.SecondsSinceMidnight(), 86399.25);
  EXPECT_EQ(clock.Now().SecondOfDay(), 86399);
  timers.Advance(750);  // midnight: the clock starts again from 0
  EXPECT_DOUBLE_EQ(clock.SecondsSinceMidnight(), 0.0);
  timers.Advance(1);
  EXPECT_DOUBLE_EQ(clock.SecondsSinceMidnight(), 0.001);
}

TEST(ManualClock, ReBasingOneClockLeavesTheOtherAlone) {
  VirtualTimerService timers;
  ManualClock clock(DateTime::FromParts(2024, 3, 31, 1, 0, 0), 100);
  clock.AdvanceMilliseconds(500);
  clock.Follow(timers);
  timers.Advance(1500);
  EXPECT_EQ(clock.TickCount(), 2100u);
  EXPECT_EQ(clock.Now().TimeText(), "01:00:02");
  clock.SetNow(DateTime::FromParts(2024, 3, 31, 3, 0, 0));
  EXPECT_EQ(clock.TickCount(), 2100u);
  clock.SetTickCount(7);
  timers.Advance(1000);
  EXPECT_EQ(clock.Now().TimeText(), "03:00:01");
  EXPECT_EQ(clock.TickCount(), 1007u);
}

TEST(FixedProcessMemory, QueuedValuesThenTheSetValueThenFailure) {
  FixedProcessMemory memory(100);
  memory.QueueValues({300, 200});
  EXPECT_EQ(memory.PrivateBytes(), 300);
  EXPECT_EQ(memory.PrivateBytes(), 200);
  EXPECT_EQ(memory.PrivateBytes(), 100);
  memory.Fail(5);
  try {
    memory.PrivateBytes();
    FAIL() << "expected a failure";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 5);
    EXPECT_EQ(e.Description(), "Cannot get process memory info; error: 5");
  }
  memory.Set(42);
  EXPECT_EQ(memory.PrivateBytes(), 42);
  EXPECT_EQ(memory.QueryCount(), 5);
}

}  // namespace
}  // namespace tav
