#include "schedule/WeekTimeInput.h"

#include <gtest/gtest.h>

namespace tav {
namespace {

TEST(WeekTimeInput, ReadsDayNamesAndTimesOfDay) {
  struct Case {
    const char* text;
    int32_t timeVal;
  } cases[] = {
      {"Mon 18:00", 151200},
      {"monday 18:00:30", 151230},
      {"  SAT 23:59:59 ", 604799},
      {"Sun 0", 0},
      {"wed 6:30 PM", 3 * 86400 + 18 * 3600 + 1800},
      {"Thu 12 am", 4 * 86400},
      {"Thu 12:15 pm", 4 * 86400 + 12 * 3600 + 900},
      {"tues 7", 2 * 86400 + 7 * 3600},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    auto time = WeekTimeFromInput(c.text);
    ASSERT_TRUE(time);
    EXPECT_EQ((*time)->TimeVal(), c.timeVal);
  }
}

TEST(WeekTimeInput, RefusesWhatItCannotReadExactly) {
  for (const char* text :
       {"", "18:00", "Mo 18:00", "Mon", "Mon 24:00", "Mon 18:60", "Mon 18:5", "Mon 13 PM",
        "Mon 0 AM", "Mon 18:00 tomorrow", "Funday 10:00", "Mon 18:00:61", "Mon -1:00"}) {
    SCOPED_TRACE(text);
    EXPECT_FALSE(WeekTimeFromInput(text));
  }
}

TEST(WeekTimeInput, DisplayIsDayAndTwentyFourHourTime) {
  EXPECT_EQ(WeekTimeToDisplay(*NewWeekTime(1, 18, 0, 0)), "Mon 18:00:00");
  EXPECT_EQ(WeekTimeToDisplay(*NewWeekTime(6, 23, 59, 59)), "Sat 23:59:59");
  // A day outside the week still prints a name.
  WeekTime odd;
  odd.SetDay(-8);
  EXPECT_EQ(WeekTimeToDisplay(odd), "Sat 00:00:00");
}

}  // namespace
}  // namespace tav
