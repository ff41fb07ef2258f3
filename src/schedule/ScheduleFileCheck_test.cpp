#include "schedule/ScheduleFileCheck.h"

#include <gtest/gtest.h>

namespace tav {
namespace {

// All findings, one per line, problems marked with "!".
std::string Report(const FileCheck& check) {
  std::string text;
  for (const auto& f : check.Findings) text += (f.IsProblem ? "! " : "  ") + f.Text + "\n";
  return text;
}

TEST(ScheduleFileCheck, AGoodWeekFileHasOnlyANote) {
  FileCheck check =
      CheckWeekScheduleText("((165600,2,(, 0,Xmas),151200),(3600,2,(, 0,Night),601200))\r\n");
  EXPECT_FALSE(check.HasProblems()) << Report(check);
  EXPECT_EQ(Report(check), "  2 weekly show(s), no overlaps\n");
  EXPECT_EQ(Report(CheckWeekScheduleText("\r\n")), "  no weekly shows\n");
}

TEST(ScheduleFileCheck, WeekFileProblemsNameTheShowAndTheCause) {
  struct Case {
    const char* text;
    const char* expected;  // a line of the report
  } cases[] = {
      {"((165600,2,(, 0,A),151200),(162000,2,(, 0,B),158400))",
       "! show 2 (\"B\", Mon 20:00:00 to Mon 21:00:00) overlaps \"A\" (Mon 18:00:00 to Mon "
       "22:00:00)\n"},
      {"((165600,2,(, 0,A),151200),(162000,2))", "! show 2 has too few fields\n"},
      {"((165600,2,(, 0,A),151200),(x,y,(, 0,B),1))",
       "! show 2 holds text where a number or a date belongs\n"},
      {"((165600,2,(, 0,),151200))",
       "! show 1 (\"\", Mon 18:00:00 to Mon 22:00:00) has no show file name; the player reads it "
       "as a pause\n"},
      {"((700000,2,(, 0,A),151200))",
       "! show 1 (\"A\", Mon 18:00:00 to Mon 02:26:40): its end time 700000 is not a second of the "
       "week (0 to 604799)\n"},
      {"((151200,2,(, 0,A),151200))",
       "! show 1 (\"A\", Mon 18:00:00 to Mon 18:00:00) starts and ends at the same time, which "
       "the player takes for the whole week\n"},
      {"((165600,2,(, 0,A),151200)", "! the show list is not a well-formed list"},
      {"weekly shows", "! the file holds no list of shows\n"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    FileCheck check = CheckWeekScheduleText(c.text);
    EXPECT_TRUE(check.HasProblems());
    EXPECT_NE(Report(check).find(c.expected), std::string::npos) << Report(check);
  }
}

TEST(ScheduleFileCheck, YearFileChecks) {
  FileCheck good = CheckYearScheduleText("((2024-12-24,((252000,2,(, 0,Xmas),237600))))\r\n");
  EXPECT_EQ(Report(good), "  1 dated show(s) on 1 date(s), no overlaps\n");

  struct Case {
    const char* text;
    const char* expected;
  } cases[] = {
      // Monday 18:00-22:00 filed under a Tuesday.
      {"((2024-12-24,((165600,2,(, 0,Xmas),151200))))",
       "! 2024-12-24 \"Xmas\" starts on a Monday, but 2024-12-24 is a Tuesday; it would play on "
       "2024-12-30 18:00:00\n"},
      {"((2024-12-24,),(2024-12-24,))", "! the date 2024-12-24 appears twice"},
      {"((Christmas,))", "! date record 1 holds text where a number or a date belongs"},
      {"((2024-12-24))", "! date record 1 has too few fields"},
      // 23:00 to 01:00 on the 24th, and 00:30 to 02:00 on the 25th.
      {"((2024-12-24,((262800,2,(, 0,Late),255600))),(2024-12-25,((266400,2,(, 0,Early),261000))))",
       "! 2024-12-25 \"Early\" (from 2024-12-25 00:30:00) overlaps 2024-12-24 \"Late\" (until "
       "2024-12-25 01:00:00)\n"},
      {"((2024-12-24,((252000,2,(, 0,A),237600),(250000,2,(, 0,B),240000))))",
       "! 2024-12-24, show 2 (\"B\", Tue 18:40:00 to Tue 21:26:40) overlaps \"A\""},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    FileCheck check = CheckYearScheduleText(c.text);
    EXPECT_TRUE(check.HasProblems());
    EXPECT_NE(Report(check).find(c.expected), std::string::npos) << Report(check);
  }
}

TEST(ScheduleFileCheck, TellsYearFilesFromWeekFiles) {
  EXPECT_TRUE(LooksLikeYearSchedule("((2024-12-24,((252000,2,(, 0,Xmas),237600))))"));
  EXPECT_TRUE(LooksLikeYearSchedule("((2024-12-24,))"));
  EXPECT_FALSE(LooksLikeYearSchedule("((165600,2,(, 0,Xmas),151200))"));
  EXPECT_FALSE(LooksLikeYearSchedule(""));
  EXPECT_FALSE(LooksLikeYearSchedule("(((("));
}

}  // namespace
}  // namespace tav
