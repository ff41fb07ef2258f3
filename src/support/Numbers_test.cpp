#include "support/Numbers.h"

#include <gtest/gtest.h>

#include "support/Error.h"

namespace tav {
namespace {

TEST(Numbers, RoundHalfEven) {
  const std::pair<double, double> cases[] = {{0.5, 0},   {1.5, 2},   {2.5, 2},    {-0.5, 0},
                                             {-1.5, -2}, {-2.5, -2}, {2.4999, 2}, {2.5001, 3}};
  for (auto [in, out] : cases) EXPECT_EQ(RoundHalfEven(in), out) << in;
}

TEST(Numbers, LeadingNumberIsLenient) {
  const std::pair<const char*, double> cases[] = {
      {"2", 2},       {"  -1", -1}, {"3abc", 3}, {"", 0},   {"abc", 0},
      {"1.5e1x", 15}, {"+4", 4},    {".5", 0.5}, {"1e", 1}, {"-", 0}};
  for (auto [in, out] : cases) EXPECT_EQ(LeadingNumber(in), out) << in;
  EXPECT_EQ(NumberOf("2.5"), 2);
  EXPECT_EQ(NumberOf("3.5"), 4);
  EXPECT_THROW(NumberOf("99999999999"), Error);
}

TEST(Numbers, ParseNumberIsStrict) {
  EXPECT_EQ(ParseNumber(" 7 "), 7.0);
  EXPECT_EQ(ParseNumber("-1.25"), -1.25);
  EXPECT_FALSE(ParseNumber(""));
  EXPECT_FALSE(ParseNumber("7 7"));
  EXPECT_FALSE(ParseNumber("1,000"));
}

TEST(Numbers, OverflowChecks) {
  EXPECT_EQ(ToInt16(32767), 32767);
  EXPECT_EQ(ToInt16(-32768.4), -32768);
  try {
    ToInt16(32767.5);
    ADD_FAILURE();
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 6);
    EXPECT_EQ(e.Description(), "Overflow");
  }
  EXPECT_THROW(ToInt32(2147483647.5), Error);
  EXPECT_EQ(SignedNumberText(5), " 5");
  EXPECT_EQ(SignedNumberText(-12), "-12");
}

}  // namespace
}  // namespace tav
