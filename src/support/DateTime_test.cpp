#include "support/DateTime.h"

#include <gtest/gtest.h>

#include "support/Error.h"

namespace tav {
namespace {

TEST(DateTime, SerialEpochAndKnownDates) {
  EXPECT_EQ(DateTime().ToText(), "1899-12-30 00:00:00");
  EXPECT_EQ(DateTime::FromParts(1900, 1, 1).Serial(), 2.0);
  EXPECT_EQ(DateTime::FromParts(2024, 12, 24).Serial(), 45650.0);
  EXPECT_EQ(DateTime::FromParts(2024, 12, 24, 18).Serial(), 45650.75);
  EXPECT_EQ(DateTime(-1.25).ToText(), "1899-12-29 06:00:00");
}

TEST(DateTime, PartsAndWeekday) {
  DateTime t = DateTime::FromParts(2024, 2, 29, 23, 59, 58);
  EXPECT_EQ(t.Year(), 2024);
  EXPECT_EQ(t.Month(), 2);
  EXPECT_EQ(t.Day(), 29);
  EXPECT_EQ(t.Hour(), 23);
  EXPECT_EQ(t.Minute(), 59);
  EXPECT_EQ(t.Second(), 58);
  EXPECT_EQ(t.DayOfWeek(), 4);  // Thursday
  EXPECT_EQ(DateTime::FromParts(2024, 12, 22).DayOfWeek(), 0);
  EXPECT_EQ(DateTime::FromParts(1899, 12, 30).DayOfWeek(), 6);
  EXPECT_EQ(DateTime::FromParts(1899, 12, 24).DayOfWeek(), 0);
}

TEST(DateTime, AddSecondsCrossesDaysYearsAndTheEpoch) {
  DateTime t = DateTime::FromParts(2024, 12, 31, 23, 59, 59);
  EXPECT_EQ(t.AddSeconds(1).ToText(), "2025-01-01 00:00:00");
  EXPECT_EQ(t.AddSeconds(1), DateTime::FromParts(2025, 1, 1));
  EXPECT_EQ(DateTime::FromParts(1899, 12, 30, 3).AddSeconds(-6 * 3600).ToText(),
            "1899-12-29 21:00:00");
  EXPECT_EQ(DateTime(-1.25).AddSeconds(3600).ToText(), "1899-12-29 07:00:00");
  EXPECT_EQ(t.AddSeconds(86400).SecondsSince(t), 86400);
}

TEST(DateTime, RejectsImpossibleParts) {
  EXPECT_THROW(DateTime::FromParts(2023, 2, 29), Error);
  EXPECT_THROW(DateTime::FromParts(2024, 1, 1, 24), Error);
}

TEST(DateTime, ReadsTheAcceptedForms) {
  struct Case {
    const char* text;
    const char* expected;  // nullptr: refused
  };
  const Case cases[] = {
      {"2024-12-24 18:30:00", "2024-12-24 18:30:00"},
      {"  2024-12-24 18:30  ", "2024-12-24 18:30:00"},
      {"2024-12-24", "2024-12-24 00:00:00"},
      {"2024/1/2 6:05:09 PM", "2024-01-02 18:05:09"},
      {"2024-12-24T07:00:00", "2024-12-24 07:00:00"},
      {"12:00:00 AM", "1899-12-30 00:00:00"},
      {"2024-12-24 25:00:00", nullptr},
      {"2024-12-24x", nullptr},
      {"24-12-2024", nullptr},
      {"", nullptr},
  };
  for (const auto& c : cases) {
    auto t = DateTime::FromText(c.text);
    if (c.expected) {
      ASSERT_TRUE(t.has_value()) << c.text;
      EXPECT_EQ(t->ToText(), c.expected) << c.text;
    } else {
      EXPECT_FALSE(t.has_value()) << c.text;
    }
  }
}

}  // namespace
}  // namespace tav
