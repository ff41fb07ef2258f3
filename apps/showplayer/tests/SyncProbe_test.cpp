#include "../SyncProbe.h"

#include <gtest/gtest.h>

namespace tav::player {
namespace {

// A media player that reports what the test sets.
class StillMedia : public MediaPlayer {
 public:
  double position = 0;
  int32_t state = kMediaPlaying;
  void OpenMedia(const std::string&) override {}
  void Stop() override {}
  std::string CurrentMediaItemInfo(const std::string&) const override { return "audio"; }
  double CurrentPosition() const override { return position; }
  int32_t PlayState() const override { return state; }
  void SetFullScreen(bool) override {}
  int32_t ErrorCount() const override { return 0; }
  std::string ErrorDescription(int32_t) const override { return ""; }
  void ClearErrorQueue() override {}
  void ShowVideoForm(int32_t, int32_t) override {}
  void HideVideoForm() override {}
  void SetOnPlayStateChange(std::function<void(int32_t)>) override {}
  void SetOnMediaError(std::function<void()>) override {}
};

TEST(SyncProbe, ReadsUniverseSlotAndPeriod) {
  auto where = SyncProbe::Parse("13:511:25");
  ASSERT_TRUE(where);
  EXPECT_EQ(where->universe, 13);
  EXPECT_EQ(where->slot, 511);
  EXPECT_EQ(where->periodMs, 25);
  for (const char* bad : {"", "13:511", "13:512:25", "13:511:0", "x:1:2", "1:2:3:4", "1:0:25"}) {
    EXPECT_FALSE(SyncProbe::Parse(bad)) << bad;
  }
}

TEST(SyncProbe, ComparesEachNewFrameWithTheMusicPosition) {
  LevelBuffers levels;
  StillMedia media;
  SyncProbe probe(levels, media, {13, 511, 25});
  auto frame = [&](int32_t n, double positionSeconds) {
    levels.SetDMX(13, 511, static_cast<uint8_t>(n >> 8));
    levels.SetDMX(13, 512, static_cast<uint8_t>(n & 0xFF));
    media.position = positionSeconds;
    probe.OnFrame();
  };
  frame(300, 7.5005);  // 0.5 ms after the music reached frame 300 (7.5 s)
  frame(300, 7.510);   // the same frame again: not counted twice
  frame(301, 7.5240);  // 1 ms early
  media.state = kMediaStopped;
  frame(302, 9.0);  // the music has stopped: no comparison
  ASSERT_EQ(probe.OffsetsMs().size(), 2u);
  EXPECT_NEAR(probe.OffsetsMs()[0], 0.5, 1e-6);
  EXPECT_NEAR(probe.OffsetsMs()[1], -1.0, 1e-6);
  EXPECT_NE(probe.Report().find("2 frames"), std::string::npos) << probe.Report();
  EXPECT_NE(probe.Report().find("max 1.00 ms"), std::string::npos) << probe.Report();
}

}  // namespace
}  // namespace tav::player
