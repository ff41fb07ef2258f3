#include "platform/media/MediaClock.h"

#include <gtest/gtest.h>

namespace tav {
namespace {

using namespace std::chrono_literals;

class MediaClockTest : public ::testing::Test {
 protected:
  MediaClock::TimePoint At(std::chrono::milliseconds ms) const { return t0 + ms; }
  double PositionAt(std::chrono::milliseconds ms) const { return clock.Position(At(ms)); }

  MediaClock clock;
  MediaClock::TimePoint t0 = MediaClock::TimePoint() + 1000h;
};

TEST_F(MediaClockTest, HoldsTheReportUntilPlaybackRunsThenRunsOnFromTheStart) {
  clock.Report(0.0, At(0ms));  // mpv reports 0 when the file opens
  EXPECT_DOUBLE_EQ(PositionAt(40ms), 0.0);
  clock.Run(At(50ms));  // the sound begins later
  EXPECT_DOUBLE_EQ(PositionAt(50ms), 0.0);
  EXPECT_NEAR(PositionAt(300ms), 0.250, 1e-9);
}

TEST_F(MediaClockTest, AReportAfterTheStartKeepsItsOwnTime) {
  clock.Report(0.020, At(70ms));
  clock.Run(At(50ms));  // started before the report was read
  EXPECT_NEAR(PositionAt(100ms), 0.050, 1e-9);
}

TEST_F(MediaClockTest, EachReportResetsTheBaseButTimeNeverGoesBack) {
  clock.Run(At(0ms));
  clock.Report(0.100, At(100ms));
  EXPECT_NEAR(PositionAt(250ms), 0.250, 1e-9);
  clock.Report(0.245, At(250ms));  // 5 ms behind what was given
  EXPECT_NEAR(PositionAt(251ms), 0.250, 1e-9);
  EXPECT_NEAR(PositionAt(260ms), 0.255, 1e-9);
  clock.Report(0.400, At(380ms));  // ahead: jumps forward
  EXPECT_NEAR(PositionAt(380ms), 0.400, 1e-9);
}

TEST_F(MediaClockTest, StopsAtTheEndAndAtMostOneSecondPastTheLatestReport) {
  clock.Run(At(0ms));
  clock.Report(1.0, At(0ms));
  EXPECT_NEAR(PositionAt(5000ms), 2.0, 1e-9);  // stalled player: no run-away
  MediaClock fresh;
  fresh.Run(At(0ms));
  fresh.SetEnd(1.5);
  fresh.Report(1.2, At(0ms));
  EXPECT_NEAR(fresh.Remaining(At(100ms)), 0.2, 1e-9);
  EXPECT_NEAR(fresh.Position(At(900ms)), 1.5, 1e-9);
  EXPECT_DOUBLE_EQ(fresh.Remaining(At(900ms)), 0.0);
}

TEST_F(MediaClockTest, ResetForgetsEverything) {
  clock.Run(At(0ms));
  clock.SetEnd(3.0);
  clock.Report(2.0, At(0ms));
  EXPECT_GT(PositionAt(10ms), 2.0);
  clock.Reset();
  EXPECT_FALSE(clock.Running());
  EXPECT_DOUBLE_EQ(PositionAt(20ms), 0.0);
  EXPECT_DOUBLE_EQ(clock.Remaining(At(20ms)), 0.0);
  clock.Run(At(20ms));
  EXPECT_NEAR(PositionAt(30ms), 0.010, 1e-9);  // nothing held over from before
}

TEST_F(MediaClockTest, AFollowerRunsAsTheClockItFollowsAndNeverGoesBack) {
  clock.SetEnd(10.0);
  clock.Report(2.0, At(100ms));
  clock.Run(At(100ms));
  MediaClock follower;
  follower.Follow(clock.Take());
  for (auto ms : {100ms, 350ms, 900ms}) EXPECT_DOUBLE_EQ(follower.Position(At(ms)), PositionAt(ms));

  clock.Report(2.7, At(1000ms));  // the original fell back by 0.1 s
  follower.Follow(clock.Take());
  EXPECT_NEAR(follower.Position(At(1000ms)), 2.8, 1e-9);
  EXPECT_NEAR(follower.Position(At(1200ms)), 2.9, 1e-9);

  clock.Report(9.9, At(2000ms));
  follower.Follow(clock.Take());
  EXPECT_DOUBLE_EQ(follower.Position(At(2500ms)), 10.0) << "beyond the end";
}

}  // namespace
}  // namespace tav
