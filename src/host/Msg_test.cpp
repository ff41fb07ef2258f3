#include "host/Msg.h"

#include <gtest/gtest.h>

#include "host/testing/TrayLinkPair.h"
#include "support/Error.h"
#include "support/testing/Failure.h"

namespace tav {
namespace {

using namespace std::string_literals;

TEST(Msg, TypePrefixIsTwoDigitsAndZeroOutsideOneToNinetyNine) {
  const struct {
    int32_t type;
    std::string text;
  } cases[] = {{1, "01body"},  {7, "07body"}, {9, "09body"},   {10, "10body"}, {13, "13body"},
               {99, "99body"}, {0, "00body"}, {100, "00body"}, {-1, "00body"}, {123456, "00body"}};
  for (const auto& c : cases) EXPECT_EQ(TypedMessageText(c.type, "body"), c.text) << c.type;
  EXPECT_EQ(TypedMessageText(10, ""), "10");
}

TEST(Msg, FrameCarriesSenderTagThreeAndTheTextWithItsZeroByte) {
  TrayFrame frame = CopyDataFrame(0x01020304, "07hi");
  EXPECT_EQ(frame.senderHwnd, 0x01020304u);
  EXPECT_EQ(frame.dwData, 3u);
  EXPECT_EQ(frame.data, "07hi\0"s);
  EXPECT_EQ(frame.data.size(), 5u);  // cbData: text bytes plus one
  EXPECT_EQ(CopyDataFrame(7, "").data, "\0"s);
}

struct Decoded {
  int32_t type;
  std::string text;
};

Decoded Decode(const std::string& block) {
  TAVMessage m = DecodeReceivedMessage(TrayFrame{77, 3, block});
  EXPECT_EQ(m.SenderHwnd(), 77u);
  return {m.MessageType(), m.Text()};
}

TEST(Msg, DecodingTakesTheTextBeforeTheFirstZeroAndReadsTheTypeFromTwoCharacters) {
  const struct {
    std::string block;
    int32_t type;
    std::string text;
  } cases[] = {
      {"02\0"s, 2, ""},
      {"09(Xmas,(F,,F,), 0,F)\0"s, 9, "(Xmas,(F,,F,), 0,F)"},
      {"07abc\0def\0"s, 7, "abc"},  // bytes after the zero are not part of the text
      {""s, 0, ""},                 // cbData 0 reads as an empty text
      {"\0"s, 0, ""},
      {"00\0"s, 0, ""},
      {"99xyz\0"s, 99, "xyz"},
      {"5\0"s, 5, ""},  // one digit is still a number
      {"ab\0"s, 0, ""},
      {"abc\0"s, 0, "c"},  // not a number: type 0, the body still follows
      {"x5rest\0"s, 0, "rest"},
      {" 7hello\0"s, 7, "hello"},  // the number read skips a leading blank
      {"-1x\0"s, -1, "x"},
      {"1a\0"s, 1, ""},
      {"1.\0"s, 1, ""},
  };
  for (const auto& c : cases) {
    Decoded d = Decode(c.block);
    EXPECT_EQ(d.type, c.type) << c.block;
    EXPECT_EQ(d.text, c.text) << c.block;
  }
}

TEST(Msg, ABlockWithoutAZeroByteIsRefusedAsAnInvalidArgument) {
  for (const std::string& block : {"07abc"s, "a"s, "\x01\x02\x03"s}) {
    try {
      DecodeReceivedMessage(TrayFrame{1, 3, block});
      ADD_FAILURE() << "accepted " << block;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), 5);
      EXPECT_EQ(e.Description(), "Invalid procedure call or argument");
    }
  }
}

TEST(Msg, WhatIsSentDecodesToTheSameTypeAndBody) {
  for (int32_t type : {1, 2, 9, 10, 11, 14, 99}) {
    for (const std::string& body : {""s, "x"s, "(a*Sb, 1,2024-12-24 18:00:00)"s, "line\r\nline"s}) {
      TAVMessage m = DecodeReceivedMessage(CopyDataFrame(5, TypedMessageText(type, body)));
      EXPECT_EQ(m.MessageType(), type);
      EXPECT_EQ(m.Text(), body);
    }
  }
}

struct FakeSequence : SequenceIdentity {
  int32_t PlayType() const override { return 4; }
  std::string Filename() const override { return "C:\\Shows\\a,b (1).seq"; }
  int32_t Section() const override { return 3; }
};

TEST(Msg, SequenceNoticeIsTheEscapedFileTheSectionAndTheDate) {
  FakeSequence seq;
  EXPECT_EQ(SequenceNoticeText(seq, DateTime::FromParts(2024, 12, 24, 18, 0, 5)),
            "(C:\\Shows\\a*Sb *O1*C.seq, 3,2024-12-24 18:00:05)");
}

TEST(Msg, SimulatedInputIsAListOfThreeNumbers) {
  EXPECT_EQ(SimulatedInputText({0, 3, 12}), "( 0, 3, 12)");
  for (SimulatedInput input : {SimulatedInput{0, 0, 0}, SimulatedInput{15, 127, 512},
                               SimulatedInput{-1, 2147483647, -2147483647 - 1}}) {
    EXPECT_EQ(SimulatedInputFromText(SimulatedInputText(input)), input);
  }
  // Written by hand: no blanks, text around the list.
  EXPECT_EQ(SimulatedInputFromText("x(2,5,7)"), (SimulatedInput{2, 5, 7}));
}

TEST(Msg, AMalformedSimulatedInputFailsWithTheRecordOrNumberError) {
  const struct {
    std::string body;
    int32_t number;
    std::string description;
  } cases[] = {
      {"", 37, "Unexpected number of fields in simulated input: 0"},
      {"( 1, 2)", 37, "Unexpected number of fields in simulated input: 2"},
      {"( 1, 2, 3, 4)", 37, "Unexpected number of fields in simulated input: 4"},
      {"( 1,two, 3)", 13, "Type mismatch"},
      {"( 1, 2, 99999999999)", 6, "Overflow"},
      {"( 1, 2, 3", 1, "Badly formatted list, enclosing parens"},
  };
  for (const auto& c : cases) {
    testing::Failure f = testing::FailureOf([&] { SimulatedInputFromText(c.body); });
    EXPECT_EQ(f.number, c.number) << c.body;
    EXPECT_EQ(f.description, c.description) << c.body;
  }
}

}  // namespace
}  // namespace tav
