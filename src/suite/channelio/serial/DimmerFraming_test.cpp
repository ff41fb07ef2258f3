#include "suite/channelio/serial/DimmerFraming.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <random>

#include "suite/channelio/serial/testing/DimmerBoardModel.h"
#include "support/Error.h"

namespace tav {
namespace {

using ::testing::ElementsAreArray;

std::vector<uint8_t> Frame(DimmerFrameLayout layout, std::vector<uint8_t> levels) {
  std::vector<uint8_t> out;
  DimmerFrameEncoder(layout).Encode(levels, out);
  return out;
}

DimmerFrameLayout Layout(int32_t boards, int32_t perBoard, DimmerAddressing addressing,
                         DimmerSpecialValues specials, int32_t pad = 0) {
  DimmerFrameLayout layout;
  layout.boards = boards;
  layout.channelsPerBoard = perBoard;
  layout.addressing = addressing;
  layout.specials = specials;
  layout.padInterval = pad;
  return layout;
}

constexpr auto kOne = DimmerAddressing::kOneHeader;
constexpr auto kPerBoard = DimmerAddressing::kHeaderPerBoard;
constexpr auto kEscape = DimmerSpecialValues::kEscape;
constexpr auto kClamp = DimmerSpecialValues::kClamp;

TEST(DimmerFraming, GoldenFrames) {
  const std::vector<uint8_t> levels = {0x00, 0x01, 0x7D, 0x7E, 0x7F, 0x80, 0xFF, 0x7C};
  EXPECT_THAT(Frame(Layout(1, 8, kOne, kEscape), levels),
              ElementsAreArray(
                  {0x7E, 0x80, 0x00, 0x01, 0x7F, 0x2F, 0x7F, 0x30, 0x7F, 0x31, 0x80, 0xFF, 0x7C}));
  EXPECT_THAT(Frame(Layout(1, 8, kOne, kClamp), levels),
              ElementsAreArray({0x7E, 0x80, 0x00, 0x01, 0x7C, 0x7C, 0x80, 0x80, 0xFF, 0x7C}));
  EXPECT_THAT(Frame(Layout(3, 2, kPerBoard, kEscape), {1, 2, 3, 4, 5, 6}),
              ElementsAreArray({0x7E, 0x80, 1, 2, 0x7E, 0x81, 3, 4, 0x7E, 0x82, 5, 6}));
  EXPECT_THAT(Frame(Layout(3, 2, kOne, kEscape), {1, 2, 3, 4, 5, 6}),
              ElementsAreArray({0x7E, 0x80, 1, 2, 3, 4, 5, 6}));
  // Missing levels are dark; extra ones are not sent.
  EXPECT_THAT(Frame(Layout(1, 4, kOne, kEscape), {9}), ElementsAreArray({0x7E, 0x80, 9, 0, 0, 0}));
  EXPECT_THAT(Frame(Layout(1, 2, kOne, kEscape), {9, 8, 7}), ElementsAreArray({0x7E, 0x80, 9, 8}));
}

TEST(DimmerFraming, LastBoardOfAFullChainGetsTheTopAddress) {
  std::vector<uint8_t> frame = Frame(Layout(128, 1, kPerBoard, kEscape), {});
  ASSERT_EQ(frame.size(), 128u * 3);
  EXPECT_EQ(frame[127 * 3 + 1], 0xFF);
}

// Every layout, through a chain of board models: each board must find its
// own channels, nothing may be left over, and nothing may confuse a board.
TEST(DimmerFraming, ChainOfBoardsReceivesEveryChannel) {
  std::mt19937 random(7);
  for (auto addressing : {kOne, kPerBoard}) {
    for (auto specials : {kEscape, kClamp}) {
      for (auto [boards, perBoard] : {std::pair{1, 8}, {3, 8}, {3, 16}, {5, 5}, {40, 24}}) {
        for (int32_t pad : {0, 3, 100}) {
          SCOPED_TRACE(testing::Message() << boards << "x" << perBoard << " pad " << pad
                                          << (addressing == kOne ? " one" : " per-board")
                                          << (specials == kEscape ? " escape" : " clamp"));
          std::vector<uint8_t> levels(static_cast<size_t>(boards * perBoard));
          // Specials often, so escapes meet pads and headers.
          for (auto& level : levels) {
            level = random() % 3 == 0 ? static_cast<uint8_t>(0x7D + random() % 3)
                                      : static_cast<uint8_t>(random());
          }
          DimmerChainModel chain(static_cast<size_t>(boards), static_cast<size_t>(perBoard));
          chain.Feed(Frame(Layout(boards, perBoard, addressing, specials, pad), levels));
          std::vector<uint8_t> expected = levels;
          if (specials == kClamp) {
            for (auto& level : expected) level = DimmerClamp(level);
          }
          EXPECT_EQ(chain.AllChannels(), expected);
          EXPECT_EQ(chain.Errors(), 0u);
          EXPECT_TRUE(chain.LeftOver().empty());
          for (size_t b = 0; b < chain.Boards(); ++b) EXPECT_EQ(chain.Board(b).FramesTaken(), 1u);
        }
      }
    }
  }
}

TEST(DimmerFraming, PadsComeEveryHundredBytesAndNeverSplitAnItem) {
  for (uint8_t value : {uint8_t{0x10}, uint8_t{0x7E}}) {
    for (auto addressing : {kOne, kPerBoard}) {
      const auto frame =
          Frame(Layout(60, 8, addressing, kEscape, 100), std::vector<uint8_t>(480, value));
      DimmerBoardModel first(8);
      std::vector<uint8_t> ignored;
      first.Feed(frame, ignored);
      EXPECT_LE(first.LongestRunWithoutPad(), 100u);
      // No more pads than one per 100 bytes (within one of the ideal count).
      EXPECT_LE(first.PadsSeen(), frame.size() / 100 + 1);
      EXPECT_GE(first.PadsSeen(), frame.size() / 101);
      for (size_t i = 0; i + 1 < frame.size(); ++i) {
        if (frame[i] == kDimmerSync || frame[i] == kDimmerEscape) {
          EXPECT_NE(frame[i + 1], kDimmerPad) << "at " << i;
        }
      }
    }
  }
}

TEST(DimmerFraming, FrameLengthBoundsMatchWhatIsSent) {
  for (auto addressing : {kOne, kPerBoard}) {
    for (auto specials : {kEscape, kClamp}) {
      DimmerFrameEncoder encoder(Layout(7, 9, addressing, specials, 100));
      std::vector<uint8_t> out;
      encoder.Encode(std::vector<uint8_t>(63, 0x20), out);
      EXPECT_EQ(out.size(), encoder.ShortestFrameBytes());
      encoder.Encode(std::vector<uint8_t>(63, 0x7F), out);
      EXPECT_EQ(out.size(), encoder.LongestFrameBytes());
      if (specials == kClamp) {
        EXPECT_EQ(encoder.ShortestFrameBytes(), encoder.LongestFrameBytes());
      }
    }
  }
  // 574 channels behind one header: 576 bytes and five pads.
  DimmerFrameLayout fpp;
  fpp.channelsPerBoard = 574;
  EXPECT_EQ(DimmerFrameEncoder(fpp).ShortestFrameBytes(), 581u);
}

TEST(DimmerFraming, RefusesLayoutsItCannotFrame) {
  for (const auto& layout : {Layout(0, 8, kOne, kEscape), Layout(1, 0, kOne, kEscape),
                             Layout(129, 1, kPerBoard, kEscape), Layout(512, 9, kOne, kEscape),
                             Layout(1, 8, kOne, kEscape, -1)}) {
    try {
      DimmerFrameEncoder encoder(layout);
      ADD_FAILURE() << "accepted " << layout.boards << "x" << layout.channelsPerBoard;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), errors::kInvalidProcedureCall);
    }
  }
  EXPECT_NO_THROW(DimmerFrameEncoder(Layout(512, 8, kOne, kEscape)));
}

}  // namespace
}  // namespace tav
