#include "schedule/WeekTime.h"
#include "support/testing/Failure.h"

#include <gtest/gtest.h>

#include <limits>

#include "support/Error.h"

namespace tav {
namespace {

struct Parts {
  int32_t timeVal, day, hour, minute, second;
};

void ExpectParts(const WeekTime& w, Parts expected) {
  EXPECT_EQ(w.TimeVal(), expected.timeVal);
  EXPECT_EQ(w.Day(), expected.day);
  EXPECT_EQ(w.Hour(), expected.hour);
  EXPECT_EQ(w.Minute(), expected.minute);
  EXPECT_EQ(w.Second(), expected.second);
}

WeekTime At(int32_t timeVal) {
  WeekTime w;
  w.SetTimeVal(timeVal);
  return w;
}

TEST(WeekTime, WritingTimeValWrapsAndDerivesTheParts) {
  struct Case {
    int32_t written;
    Parts expected;
  } cases[] = {
      {604800, {0, 0, 0, 0, 0}},
      {-1, {604799, 6, 23, 59, 59}},
      {90061, {90061, 1, 1, 1, 1}},
      {604799 + 604800, {604799, 6, 23, 59, 59}},
      // Only one week is added before the remainder, so this stays negative.
      {-604801, {-1, 0, 0, 0, -1}},
      {-604800 - 3661, {-3661, 0, -1, -1, -1}},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.written);
    ExpectParts(At(c.written), c.expected);
  }
  ExpectParts(WeekTime(), {0, 0, 0, 0, 0});  // a new week time
}

TEST(WeekTime, TimeValNearTheTopOfThe32BitRangeOverflows) {
  constexpr int32_t kLargest = std::numeric_limits<int32_t>::max() - kSecondsPerWeek;
  EXPECT_EQ(At(kLargest).TimeVal(), kLargest % kSecondsPerWeek);
  EXPECT_EQ(tav::testing::FailureOf([] { At(kLargest + 1); }).number, 6);
  EXPECT_EQ(At(std::numeric_limits<int32_t>::min()).TimeVal(),
            (std::numeric_limits<int32_t>::min() + kSecondsPerWeek) % kSecondsPerWeek);
}

TEST(WeekTime, WritingPartsWrapsDaysAndClampsTheRest) {
  WeekTime w = At(3 * kSecondsPerDay + 5);  // Wednesday 00:00:05
  w.SetDay(-1);
  ExpectParts(w, {6 * kSecondsPerDay + 5, 6, 0, 0, 5});
  w.SetDay(9);
  ExpectParts(w, {2 * kSecondsPerDay + 5, 2, 0, 0, 5});
  w.SetHour(24);
  EXPECT_EQ(w.Hour(), 23);
  w.SetMinute(-5);
  EXPECT_EQ(w.Minute(), 0);
  w.SetSecond(75);
  ExpectParts(w, {2 * kSecondsPerDay + 23 * 3600 + 59, 2, 23, 0, 59});
  EXPECT_EQ(w.DaySecond(), 23 * 3600 + 59);
  // A day below -7 is wrapped only once and stays negative.
  w.SetDay(-8);
  EXPECT_EQ(w.Day(), -1);
  EXPECT_EQ(w.TimeVal(), -kSecondsPerDay + 23 * 3600 + 59);
}

TEST(WeekTime, NewWeekTimeWritesDayHourMinuteSecond) {
  ExpectParts(*NewWeekTime(8, 25, -1, 70), {kSecondsPerDay + 23 * 3600 + 59, 1, 23, 0, 59});
  ExpectParts(*NewWeekTime(1, 18, 0, 0), {151200, 1, 18, 0, 0});
}

TEST(WeekTime, IntervalTestsFollowTheirTable) {
  // s against a and b for each of the three shapes of interval.
  struct Case {
    int32_t a, b, s;
    bool between, betweenEquals, inRange;
  } cases[] = {
      // a < b
      {100, 200, 150, true, true, true},
      {100, 200, 100, false, true, true},
      {100, 200, 200, false, true, false},
      {100, 200, 99, false, false, false},
      {100, 200, 201, false, false, false},
      // a > b: the interval runs across the week end
      {500000, 1000, 600000, true, true, true},
      {500000, 1000, 0, true, true, true},
      {500000, 1000, 500000, false, true, true},
      {500000, 1000, 1000, false, true, false},
      {500000, 1000, 2000, false, false, false},
      {500000, 1000, 499999, false, false, false},
      // a = b: the whole week, the bound itself included
      {300, 300, 300, true, true, true},
      {300, 300, 0, true, true, true},
      {300, 300, 604799, true, true, true},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(::testing::Message() << "a=" << c.a << " b=" << c.b << " s=" << c.s);
    WeekTime a = At(c.a), b = At(c.b), s = At(c.s);
    EXPECT_EQ(s.Between(a, b), c.between);
    EXPECT_EQ(s.BetweenEquals(a, b), c.betweenEquals);
    EXPECT_EQ(s.InRange(a, b), c.inRange);
  }
}

TEST(WeekTime, InRangeAcrossTheWeekEnd) {
  auto saturday23 = NewWeekTime(6, 23, 0, 0);
  auto sunday01 = NewWeekTime(0, 1, 0, 0);
  EXPECT_TRUE(NewWeekTime(0, 0, 0, 0)->InRange(*saturday23, *sunday01));
  EXPECT_TRUE(saturday23->InRange(*saturday23, *sunday01));
  EXPECT_FALSE(sunday01->InRange(*saturday23, *sunday01));
}

TEST(WeekTime, MinusIsTheForwardDistance) {
  EXPECT_EQ(At(5000).Minus(At(5000)), 0);
  EXPECT_EQ(At(7200).Minus(At(3600)), 3600);
  EXPECT_EQ(NewWeekTime(0, 1, 0, 0)->Minus(*NewWeekTime(6, 23, 0, 0)), 7200);
  EXPECT_EQ(At(0).Minus(At(1)), 604799);
}

TEST(WeekTime, PlusDurationMakesANewNormalisedTime) {
  WeekTime saturday = *NewWeekTime(6, 23, 0, 0);
  auto later = saturday.PlusDuration(7200);
  EXPECT_EQ(later->TimeVal(), 3600);
  EXPECT_EQ(saturday.TimeVal(), 6 * kSecondsPerDay + 23 * 3600);
  EXPECT_EQ(At(0).PlusDuration(kSecondsPerWeek)->TimeVal(), 0);
  EXPECT_EQ(At(10).PlusDuration(-20)->TimeVal(), 604790);
  EXPECT_EQ(tav::testing::FailureOf([] {
              At(10).PlusDuration(std::numeric_limits<int32_t>::max());
            }).number,
            6);
}

TEST(WeekTime, MinusDurationNeverYieldsATime) {
  try {
    At(5000).MinusDuration(100);
    ADD_FAILURE() << "MinusDuration returned";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 91);
    EXPECT_EQ(e.Description(), "Object variable or With block variable not set");
  }
  // The subtraction is checked first.
  EXPECT_EQ(tav::testing::FailureOf([] {
              At(5000).MinusDuration(std::numeric_limits<int32_t>::min());
            }).number,
            6);
}

TEST(WeekTime, ToStringIsCompactWithoutSeparators) {
  EXPECT_EQ(NewWeekTime(1, 10, 3, 0)->ToString(), "Mon1030");
  EXPECT_EQ(NewWeekTime(6, 23, 59, 59)->ToString(), "Sat235959");
  EXPECT_EQ(WeekTime().ToString(), "Sun000");
  WeekTime outOfWeek;
  outOfWeek.SetDay(-8);  // day -1 has no name
  EXPECT_EQ(outOfWeek.ToString(), "000");
}

TEST(WeekTime, DayTimeToStringUsesTwelveHours) {
  struct Case {
    int32_t hour, minute, second;
    const char* text;
  } cases[] = {
      {0, 5, 9, "12:05:09 AM"}, {13, 30, 0, "1:30:00 PM"},   {12, 0, 0, "12:00:00 PM"},
      {0, 0, 0, "12:00:00 AM"}, {11, 59, 59, "11:59:59 AM"}, {23, 10, 10, "11:10:10 PM"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(NewWeekTime(4, c.hour, c.minute, c.second)->DayTimeToString(), c.text);
  }
}

TEST(WeekTime, FromDateTakesWeekdayAndTimeOfDay) {
  // 24 December 2024 was a Tuesday.
  ExpectParts(*WeekTimeFromDate(DateTime::FromParts(2024, 12, 24, 18, 30, 15)),
              {2 * kSecondsPerDay + 18 * 3600 + 30 * 60 + 15, 2, 18, 30, 15});
  EXPECT_EQ(WeekTimeFromDate(DateTime::FromParts(2024, 12, 22))->TimeVal(), 0);  // a Sunday
}

TEST(WeekTime, FromTextReadsTheLeadingNumberRoundedHalfToEven) {
  struct Case {
    const char* field;
    int32_t timeVal;
  } cases[] = {
      {"252000", 252000}, {" 7", 7},      {"abc", 0},    {"", 0},   {"2.5", 2},    {"3.5", 4},
      {"12abc", 12},      {"-1", 604799}, {"604800", 0}, {"*S", 0}, {"1e3", 1000}, {"-604801", -1},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.field);
    EXPECT_EQ(WeekTimeFromText(c.field)->TimeVal(), c.timeVal);
  }
  EXPECT_EQ(tav::testing::FailureOf([] { WeekTimeFromText("99999999999"); }).number, 6);
  EXPECT_EQ(tav::testing::FailureOf([] { WeekTimeFromText("2147483000"); }).number, 6);
}

TEST(WeekTime, ToDateFindsTheTimeInTheReferenceWeek) {
  const DateTime wednesday = DateTime::FromParts(2024, 12, 25, 12, 0, 0);
  EXPECT_EQ(WeekTimeToDate(*NewWeekTime(1, 18, 0, 0), wednesday),
            DateTime::FromParts(2024, 12, 23, 18, 0, 0));
  EXPECT_EQ(WeekTimeToDate(*NewWeekTime(0, 0, 0, 0), wednesday), DateTime::FromParts(2024, 12, 22));
  EXPECT_EQ(WeekTimeToDate(*NewWeekTime(6, 23, 59, 59), wednesday),
            DateTime::FromParts(2024, 12, 28, 23, 59, 59));
  // A Sunday reference is the first day of its own week; Saturday the last.
  EXPECT_EQ(WeekTimeToDate(*NewWeekTime(2, 1, 2, 3), DateTime::FromParts(2024, 12, 29, 23, 0, 0)),
            DateTime::FromParts(2024, 12, 31, 1, 2, 3));
  EXPECT_EQ(WeekTimeToDate(*NewWeekTime(0, 5, 0, 0), DateTime::FromParts(2024, 12, 28, 1, 0, 0)),
            DateTime::FromParts(2024, 12, 22, 5, 0, 0));
}

}  // namespace
}  // namespace tav
