#include "suite/channelio/EffectEngine.h"

#include <gtest/gtest.h>

#include <set>

#include "suite/seqlib/PlayEvent.h"

namespace tav {
namespace {

const ChannelKey kSlot{kFamilyDMX, 1, 0, 10};

class Effects : public ::testing::Test {
 protected:
  void Start(int32_t type, int32_t duration, int32_t from, int32_t to, uint32_t tick,
             ChannelKey channel = kSlot) {
    engine.Start({channel, type, duration, from, to}, tick);
  }
  int At(uint32_t tick) {
    engine.Render(tick, levels);
    return levels.DMXLevel(kSlot.network, kSlot.circuit);
  }
  EffectEngine engine;
  LevelBuffers levels;
};

TEST_F(Effects, PercentBecomesTheNearestLevel) {
  EXPECT_EQ(PercentToLevel(0), 0);
  EXPECT_EQ(PercentToLevel(50), 128);
  EXPECT_EQ(PercentToLevel(100), 255);
  EXPECT_EQ(PercentToLevel(-5), 0);
  EXPECT_EQ(PercentToLevel(250), 255);
}

TEST_F(Effects, FadeRunsLinearlyAndHoldsItsEnd) {
  Start(kEffectFade, 1000, 0, 100, 5000);
  EXPECT_EQ(At(5000), 0);
  EXPECT_EQ(At(5250), 64);
  EXPECT_EQ(At(5500), 128);
  EXPECT_TRUE(engine.Active());
  EXPECT_EQ(At(6000), 255);
  EXPECT_FALSE(engine.Active());
  EXPECT_EQ(At(9000), 255);
}

TEST_F(Effects, FadeDownAndAFadeOfNoTimeJumpsToItsEnd) {
  Start(kEffectFade, 400, 100, 20, 0);
  EXPECT_EQ(At(200), 153);  // halfway between 255 and 51
  Start(kEffectFade, 0, 100, 20, 300);
  EXPECT_EQ(At(300), 51);
  EXPECT_FALSE(engine.Active());
}

TEST_F(Effects, SetAndOffActAtOnceAndNeedNoFrames) {
  Start(kEffectSet, 0, 40, 90, 100);
  EXPECT_EQ(At(100), 102);
  EXPECT_FALSE(engine.Active());
  Start(kEffectOff, 0, 0, 0, 200);
  EXPECT_EQ(At(200), 0);
}

TEST_F(Effects, ALaterCommandReplacesTheRunningOne) {
  Start(kEffectFade, 1000, 0, 100, 0);
  EXPECT_EQ(At(500), 128);
  Start(kEffectSet, 0, 10, 10, 500);
  EXPECT_EQ(At(600), 26);
  EXPECT_EQ(At(1000), 26);
}

TEST_F(Effects, CancelEndsEffectsInTheRangeOnly) {
  Start(kEffectShimmer, 0, 0, 100, 0, {kFamilyDMX, 1, 0, 9});
  Start(kEffectShimmer, 0, 0, 100, 0, {kFamilyDMX, 1, 0, 10});
  Start(kEffectShimmer, 0, 0, 100, 0, {kFamilyDMX, 1, 0, 12});
  Start(kEffectShimmer, 0, 0, 100, 0, {kFamilyDMX, 2, 0, 10});
  engine.Cancel(kFamilyDMX, 1, 0, 10, 2);
  EXPECT_EQ(engine.RunningCount(), 3u);
  engine.Cancel(kFamilyDMX, 1, 0, 1, 512);
  EXPECT_EQ(engine.RunningCount(), 1u);
}

TEST_F(Effects, ShimmerAlternatesEvery40msAndEndsOff) {
  Start(kEffectShimmer, 200, 20, 80, 1000);
  EXPECT_EQ(At(1000), 51);
  EXPECT_EQ(At(1039), 51);
  EXPECT_EQ(At(1040), 204);
  EXPECT_EQ(At(1080), 51);
  EXPECT_EQ(At(1159), 204);
  EXPECT_EQ(At(1199), 51);
  EXPECT_EQ(At(1200), 0);
  EXPECT_FALSE(engine.Active());
}

TEST_F(Effects, TwinkleStaysInItsRangeChangesAndRepeatsItself) {
  Start(kEffectTwinkle, 0, 30, 70, 0);
  std::vector<int> first;
  std::set<int> seen;
  for (uint32_t t = 0; t < 10000; t += 25) {
    int level = At(t);
    EXPECT_GE(level, PercentToLevel(30));
    EXPECT_LE(level, PercentToLevel(70));
    first.push_back(level);
    seen.insert(level);
  }
  EXPECT_GT(seen.size(), 10u);
  EffectEngine again;
  LevelBuffers other;
  again.Start({kSlot, kEffectTwinkle, 0, 30, 70}, 0);
  for (size_t i = 0; i < first.size(); ++i) {
    again.Render(static_cast<uint32_t>(i * 25), other);
    ASSERT_EQ(other.DMXLevel(1, 10), first[i]) << "frame " << i;
  }
}

TEST_F(Effects, TwinkleHoldsEachLevelAtLeast80ms) {
  Start(kEffectTwinkle, 0, 0, 100, 0);
  int last = At(0);
  uint32_t lastChange = 0;
  for (uint32_t t = 1; t < 20000; ++t) {
    int level = At(t);
    if (level == last) continue;
    EXPECT_GE(t - lastChange, 80u) << "at " << t;
    last = level;
    lastChange = t;
  }
}

TEST_F(Effects, TwinkleWithADurationEndsOff) {
  Start(kEffectTwinkle, 500, 50, 50, 0);
  EXPECT_EQ(At(499), 128);
  EXPECT_EQ(At(500), 0);
  EXPECT_FALSE(engine.Active());
}

TEST_F(Effects, EveryFamilyLandsInItsBuffer) {
  engine.Start({{kFamilyTAV, 2, 3, 4}, kEffectSet, 0, 100, 100}, 0);
  engine.Start({{kFamilyX10, 1, 0, 16}, kEffectSet, 0, 100, 100}, 0);
  engine.Start({{kFamilyFennick, 1, 0, 12}, kEffectSet, 0, 100, 100}, 0);
  engine.Start({{99, 1, 0, 1}, kEffectSet, 0, 100, 100}, 0);
  engine.Start({kSlot, 17, 0, 100, 100}, 0);
  EXPECT_EQ(engine.RunningCount(), 3u);
  engine.Render(0, levels);
  EXPECT_EQ(levels.TAVLevel(2, 3, 4), 255);
  EXPECT_EQ(levels.X10Level(1, 16), 255);
  EXPECT_EQ(levels.FennickLevel(1, 12), 255);
}

}  // namespace
}  // namespace tav
