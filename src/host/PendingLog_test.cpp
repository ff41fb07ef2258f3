#include "host/PendingLog.h"

#include <gtest/gtest.h>

#include <string>

namespace tav {
namespace {

// Lines "L0000xxxx...", each `width` characters, so every line says which it is.
std::string Line(int n, size_t width) {
  std::string line = "L" + std::to_string(10000 + n).substr(1);
  line.resize(width, 'x');
  return line;
}

TEST(PendingLog, LinesAreJoinedByCrLfWithNoneAfterTheLast) {
  PendingLog log;
  EXPECT_TRUE(log.IsEmpty());
  log.Append("one");
  EXPECT_EQ(log.Text(), "one");
  log.Append("two");
  EXPECT_EQ(log.Text(), "one\r\ntwo");
  EXPECT_EQ(log.Take(), "one\r\ntwo");
  EXPECT_TRUE(log.IsEmpty());
  log.Append("three");
  EXPECT_EQ(log.Text(), "three");
}

TEST(PendingLog, AtTheLimitItKeepsTheLastHalfFromAWholeLine) {
  PendingLog log;
  // 600 lines of 98 characters: 600 * 100 - 2 = 59998 characters, untouched.
  for (int i = 0; i < 600; ++i) log.Append(Line(i, 98));
  EXPECT_EQ(log.Text().size(), 59998u);
  log.Append(Line(600, 98));
  // 60098 characters: the last 30000 begin with the line break after line
  // 300, which goes with it; lines 301 to 600 remain.
  EXPECT_EQ(log.Text().size(), 29998u);
  EXPECT_EQ(log.Text().substr(0, 5), "L0301");
  EXPECT_EQ(log.Text().substr(log.Text().size() - 98, 5), "L0600");

  log.Append("next");
  EXPECT_EQ(log.Text().substr(log.Text().size() - 6), "\r\nnext");
}

TEST(PendingLog, ExactlySixtyThousandCharactersTrimsAndDropsTheFirstKeptLineEvenWhenWhole) {
  PendingLog log;
  // 599 lines of 98 plus one of 100: 599 * 100 + 100 = 60000. The last
  // 30000 characters begin exactly with line 300, which is dropped all the
  // same up to its line break.
  for (int i = 0; i < 599; ++i) log.Append(Line(i, 98));
  log.Append(Line(599, 100));
  EXPECT_EQ(log.Text().size(), 29900u);
  EXPECT_EQ(log.Text().substr(0, 5), "L0301");
}

TEST(PendingLog, ACutThroughALineBreakDropsTheLineAfterIt) {
  PendingLog log;
  // With 99-character lines (101 with the break) the cut falls between the
  // CR and the LF; the kept text starts with the LF, so the first whole
  // break found is the one after the next line.
  for (int i = 0; i < 594; ++i) log.Append(Line(i, 99));  // 59992 characters
  log.Append(Line(594, 103));                             // 60097: cut at 30097
  EXPECT_EQ(log.Text().substr(0, 5), "L0299");
  EXPECT_EQ(log.Text().size(), 30000u - 1 - 101);
}

TEST(PendingLog, AHugeLineWithoutABreakKeepsItsLastThirtyThousandCharacters) {
  PendingLog log;
  log.Append("short");
  std::string huge(70000, 'a');
  huge += "END";
  log.Append(huge);
  EXPECT_EQ(log.Text().size(), 30000u);
  EXPECT_EQ(log.Text().substr(log.Text().size() - 3), "END");
  EXPECT_EQ(log.Text().find("short"), std::string::npos);
}

// Whether `text` is whole UTF-8: no character cut at either end.
bool IsWholeUtf8(const std::string& text) {
  size_t i = 0;
  while (i < text.size()) {
    auto c = static_cast<unsigned char>(text[i]);
    size_t length = c < 0x80           ? 1
                    : (c >> 5) == 0x6  ? 2
                    : (c >> 4) == 0xE  ? 3
                    : (c >> 3) == 0x1E ? 4
                                       : 0;
    if (length == 0 || i + length > text.size()) return false;
    for (size_t k = 1; k < length; ++k) {
      if ((static_cast<unsigned char>(text[i + k]) & 0xC0) != 0x80) return false;
    }
    i += length;
  }
  return true;
}

TEST(PendingLog, AHugeLineIsNeverCutInsideACharacter) {
  // Two, three and four bytes per character, cut at every offset inside one.
  for (const std::string character : {"\xC3\xA9", "\xE2\x82\xAC", "\xF0\x9F\x8E\x84"}) {
    for (size_t shift = 0; shift < character.size(); ++shift) {
      PendingLog log;
      std::string huge;
      while (huge.size() < 70000) huge += character;
      huge.append(shift, 'x');  // moves the cut, which counts from the end
      log.Append(huge);
      EXPECT_TRUE(IsWholeUtf8(log.Text())) << character.size() << " bytes, shift " << shift;
      EXPECT_LE(log.Text().size(), PendingLog::kKeepAfterTrim);
      EXPECT_GT(log.Text().size(), PendingLog::kKeepAfterTrim - character.size());
    }
  }
}

}  // namespace
}  // namespace tav
