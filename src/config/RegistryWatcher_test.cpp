#include "config/RegistryWatcher.h"

#include <gtest/gtest.h>

#include "config/LibRegistry.h"
#include "config/MemoryRegistryStore.h"
#include "ports/testing/VirtualTimerService.h"
#include "support/Error.h"

namespace tav {
namespace {

class Recorder : public CallableByName {
 public:
  void CallByName(const std::string& name) override {
    calls.push_back(name);
    if (failuresLeft > 0) {
      --failuresLeft;
      throw Error(1, "Recorder", "callback failed");
    }
  }
  std::vector<std::string> calls;
  int failuresLeft = 0;
};

class RegistryWatcherTest : public ::testing::Test {
 protected:
  void Write(const std::string& text) { SetStringSetting(store, "Ver", "Network", text); }
  void Remove() { RegistryDeleteValue(store, SharedSettingsKey("Network"), "Ver"); }
  bool Arm() {
    watcher.SetWatchRegistryKey("Network");
    watcher.SetWatchRegistryValue("Ver");
    watcher.SetCallObject(target);
    watcher.SetCallSubroutine("DoUpdateNetworkPrefsFromRegistry");
    return watcher.EnableTheWatch();
  }
  size_t Calls() const { return target->calls.size(); }

  VirtualTimerService timers;
  MemoryRegistryStore store;
  RegistryWatcher watcher{timers, store};
  std::shared_ptr<Recorder> target = std::make_shared<Recorder>();
};

TEST_F(RegistryWatcherTest, CallsOncePerNewTextAndIgnoresRepeatsAndDeletion) {
  Write("A");
  ASSERT_TRUE(Arm());
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 0u);

  Write("B");
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 1u);
  Write("B");
  timers.Advance(3000);
  EXPECT_EQ(Calls(), 1u);
  Remove();
  timers.Advance(3000);
  EXPECT_EQ(Calls(), 1u);
  EXPECT_EQ(watcher.LastValue(), "B");
  Write("C");
  timers.Advance(1000);
  EXPECT_EQ(target->calls, (std::vector<std::string>{"DoUpdateNetworkPrefsFromRegistry",
                                                     "DoUpdateNetworkPrefsFromRegistry"}));
}

TEST_F(RegistryWatcherTest, ReappearingWithTheOldTextOrEmptyCallsNothing) {
  Write("A");
  ASSERT_TRUE(Arm());
  Remove();
  timers.Advance(2000);
  Write("");
  timers.Advance(2000);
  Write("A");
  timers.Advance(2000);
  EXPECT_EQ(Calls(), 0u);
  Write("a");  // exact comparison: letter case counts
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 1u);
}

TEST_F(RegistryWatcherTest, AValueOfAnotherTypeReadsAsEmpty) {
  auto writeBinary = [&] {
    RegistryCreateKey(store, SharedSettingsKey("Network"));
    RegistrySetValue(store, SharedSettingsKey("Network"), "Ver", RegistryValue::Binary("\x01\x02"));
  };
  writeBinary();
  EXPECT_FALSE(Arm());  // nothing to watch yet

  Write("A");
  ASSERT_TRUE(Arm());
  writeBinary();
  EXPECT_NO_THROW(timers.Advance(3000));
  EXPECT_EQ(Calls(), 0u);
  EXPECT_EQ(watcher.LastValue(), "A");
  Write("B");
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 1u);
}

TEST_F(RegistryWatcherTest, PollsOnlyOnTicks) {
  Write("A");
  ASSERT_TRUE(Arm());
  timers.Advance(10);
  Write("B");
  timers.Advance(989);
  EXPECT_EQ(Calls(), 0u);
  timers.Advance(1);
  EXPECT_EQ(Calls(), 1u);
}

TEST_F(RegistryWatcherTest, CheckIntervalZeroStopsNegativeIsIgnored) {
  Write("A");
  ASSERT_TRUE(Arm());
  watcher.SetCheckInterval(-5);
  EXPECT_EQ(watcher.CheckTimer().Interval(), 1000u);
  EXPECT_TRUE(watcher.CheckTimer().Enabled());

  watcher.SetCheckInterval(250);
  Write("B");
  timers.Advance(250);
  EXPECT_EQ(Calls(), 1u);

  watcher.SetCheckInterval(0);
  EXPECT_FALSE(watcher.CheckTimer().Enabled());
  Write("C");
  timers.Advance(60'000);
  EXPECT_EQ(Calls(), 1u);
  // An interval does not restart a stopped timer; Enabled does.
  watcher.SetCheckInterval(100);
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 1u);
  watcher.SetEnabled(true);
  timers.Advance(100);
  EXPECT_EQ(Calls(), 2u);
}

TEST_F(RegistryWatcherTest, ArmingAMissingValueFailsAndLeavesTheWatchUnarmed) {
  EXPECT_FALSE(Arm());
  EXPECT_FALSE(watcher.Armed());
  Write("A");
  timers.Advance(5000);
  EXPECT_EQ(Calls(), 0u);
  // Nothing armed, so arming again works once the value exists.
  EXPECT_TRUE(watcher.EnableTheWatch());
}

TEST_F(RegistryWatcherTest, ArmingNeedsObjectAndSubroutineAndOnlyOnce) {
  Write("A");
  watcher.SetWatchRegistryKey("Network");
  watcher.SetWatchRegistryValue("Ver");
  watcher.SetCallSubroutine("DoUpdateNetworkPrefsFromRegistry");
  EXPECT_FALSE(watcher.EnableTheWatch());  // no object
  watcher.SetCallObject(target);
  watcher.SetCallSubroutine("");
  EXPECT_FALSE(watcher.EnableTheWatch());  // no subroutine
  EXPECT_FALSE(watcher.Armed());

  EXPECT_TRUE(Arm());
  watcher.SetWatchRegistryValue("Other");
  EXPECT_FALSE(watcher.EnableTheWatch());  // already armed: still on "Ver"
  Write("B");
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 1u);

  watcher.DeleteWatch();
  EXPECT_FALSE(watcher.Armed());
  EXPECT_EQ(watcher.LastValue(), "");
  Write("C");
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 1u);
}

TEST_F(RegistryWatcherTest, FailingCallbackPropagatesAndIsRepeatedNextTick) {
  Write("A");
  ASSERT_TRUE(Arm());
  target->failuresLeft = 1;
  Write("B");
  EXPECT_THROW(timers.Advance(1000), Error);
  EXPECT_EQ(watcher.LastValue(), "A");
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 2u);
  EXPECT_EQ(watcher.LastValue(), "B");
  timers.Advance(5000);
  EXPECT_EQ(Calls(), 2u);
}

TEST_F(RegistryWatcherTest, RegistryFailureInATickPropagates) {
  Write("A");
  ASSERT_TRUE(Arm());
  store.FailOperation(RegistryOperation::QueryValue, kRegistryAccessDenied, 1);
  Write("B");
  try {
    timers.Advance(1000);
    FAIL() << "expected the registry failure";
  } catch (const Error& e) {
    EXPECT_EQ(e.Description(), "RegQueryValueEx failure");
  }
  timers.Advance(1000);
  EXPECT_EQ(Calls(), 1u);
}

}  // namespace
}  // namespace tav
