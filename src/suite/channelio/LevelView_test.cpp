#include "suite/channelio/LevelView.h"

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
