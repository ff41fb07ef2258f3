#include "suite/channelio/LevelView.h"
#include "suite/channelio/LevelViewDriver.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace tav {
namespace {

using ::testing::ElementsAre;

TEST(LevelView, GlyphsRiseWithTheLevel) {
  EXPECT_EQ(LevelGlyph(0, false), " ");
  EXPECT_EQ(LevelGlyph(1, false), ".");
  EXPECT_EQ(LevelGlyph(128, false), "+");
  EXPECT_EQ(LevelGlyph(255, false), "@");
  EXPECT_EQ(LevelGlyph(255, true), "\u2588");
  EXPECT_EQ(LevelGlyph(1, true), "\u2581");
}

TEST(LevelView, RowsWrapAtTheWidthWithTheirAddresses) {
  std::vector<uint8_t> levels(20, 255);
  levels[0] = 0;
  levels[19] = 100;
  std::vector<uint8_t> unit(3, 30);
  std::vector<LevelViewRow> rows = {{"U1", levels}, {"TAV 1.2", unit}};
  LevelViewOptions options;
  options.width = 29;  // label 8 + address 5 + 16 cells
  options.unicode = false;
  EXPECT_THAT(RenderLevelView(rows, options), ElementsAre("U1         1  @@@@@@@@@@@@@@@",
                                                          "          17 @@@=", "TAV 1.2    1 :::"));
}

TEST(LevelView, CompactRowsShowTheHighestLevelOfEachCell) {
  std::vector<uint8_t> levels(512, 0);
  levels[100] = 255;
  std::vector<LevelViewRow> rows = {{"U12", levels}};
  LevelViewOptions options;
  options.width = 68;  // 64 cells of 8 slots
  options.unicode = false;
  options.compact = true;
  auto lines = RenderLevelView(rows, options);
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(lines[0].size(), 4u + 64u);
  EXPECT_EQ(lines[0].substr(4 + 12, 1), "@");  // slot 101 is in cell 12
  EXPECT_EQ(lines[0].find('@'), lines[0].rfind('@'));
}

}  // namespace
}  // namespace tav

namespace tav {
namespace {

TEST(LevelViewSelection, ReadsUniversesRangesAndTAVUnits) {
  LevelViewSelection selection;
  std::string error;
  ASSERT_TRUE(ParseLevelViewSelection("1,5-7,t2.3", selection, error));
  EXPECT_THAT(selection.universes, ElementsAre(1, 5, 6, 7));
  EXPECT_THAT(selection.tavUnits, ElementsAre(std::make_pair(2, 3)));
  for (const char* bad : {"x", "7-5", "t1", "t0.1", "1-5000", "70000"}) {
    EXPECT_FALSE(ParseLevelViewSelection(bad, selection, error)) << bad;
    EXPECT_NE(error.find(bad), std::string::npos) << error;
  }
}

TEST(LevelViewDriver, DrawsAfterFramesAtMostOncePerInterval) {
  LevelBuffers levels;
  levels.SetDMX(2, 1, 255);
  std::vector<std::vector<std::string>> drawn;
  LevelViewSelection selection{{2, 3}, {{1, 1}}};
  LevelViewOptions options;
  options.unicode = false;
  options.compact = true;
  options.width = 20;
  LevelViewDriver driver(levels, selection, options, 250,
                         [&](const std::vector<std::string>& lines) { drawn.push_back(lines); });
  for (uint32_t tick = 1000; tick < 2000; tick += 25) driver.OnFrame(tick, "status");
  ASSERT_EQ(drawn.size(), 4u);  // at 1000, 1250, 1500, 1750
  ASSERT_EQ(drawn[0].size(), 4u);
  EXPECT_EQ(drawn[0][0], "status");
  EXPECT_EQ(drawn[0][1].substr(0, 6), "U2   @");
  EXPECT_EQ(drawn[0][2], "U3   " + std::string(15, ' '));  // never written: dark
  EXPECT_EQ(drawn[0][3], "T1.1 ");
}

}  // namespace
}  // namespace tav
