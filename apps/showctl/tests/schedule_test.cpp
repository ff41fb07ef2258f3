#include <gmock/gmock.h>

#include <filesystem>

#include "ShowctlRunner.h"

namespace tav::showctl::testing {
namespace {

using ::testing::HasSubstr;

class ScheduleCommand : public ShowctlTest {
 protected:
  // Every command names its files, so the caller's environment cannot matter.
  Result Schedule(std::vector<std::string> args) const {
    args.insert(args.begin(), "schedule");
    args.insert(args.end(), {"--week", Path("weeksched.tsc"), "--year", Path("yearsched.tsc")});
    return Run(args);
  }
  Result Check(const std::string& file) const { return Run({"schedule", "check", Path(file)}); }
};

TEST_F(ScheduleCommand, AddListAskAndRemove) {
  ASSERT_EQ(Schedule({"add", "weekly", "Xmas", "Mon 18:00", "Mon 22:00"}).exitCode, 0);
  ASSERT_EQ(Schedule({"add", "dated", "Eve", "2024-12-24 17:00", "23:00"}).exitCode, 0);
  EXPECT_EQ(Read("weeksched.tsc"), "((165600,2,(, 0,Xmas),151200))\r\n");
  EXPECT_EQ(Read("yearsched.tsc"), "((2024-12-24,((255600,2,(, 0,Eve),234000))))\r\n");

  Result list = Schedule({"list"});
  EXPECT_THAT(list.out, HasSubstr("Mon 18:00:00   Mon 22:00:00   Xmas"));
  EXPECT_THAT(list.out, HasSubstr("2024-12-24 17:00:00  2024-12-24 23:00:00  Eve"));

  Result at = Schedule({"at", "2024-12-23 19:00"});
  EXPECT_THAT(at.out, HasSubstr("current  \"Xmas\" from the week schedule"));
  EXPECT_THAT(at.out, HasSubstr("next     \"Eve\" from the year schedule, 2024-12-24 17:00:00"));
  EXPECT_THAT(Schedule({"at", "2024-12-24 18:00", "--on-demand-only"}).out,
              HasSubstr("on demand only"));

  ASSERT_EQ(Schedule({"remove", "weekly", "Mon 21:59:59"}).exitCode, 0);
  ASSERT_EQ(Schedule({"remove", "dated", "2024-12-24 17:00"}).exitCode, 0);
  EXPECT_EQ(Read("weeksched.tsc"), "\r\n");
  EXPECT_EQ(Read("yearsched.tsc"), "\r\n");
}

TEST_F(ScheduleCommand, BadInputFailsClearlyAndChangesNothing) {
  ASSERT_EQ(Schedule({"add", "weekly", "Xmas", "Mon 18:00", "Mon 22:00"}).exitCode, 0);
  ASSERT_EQ(Schedule({"add", "dated", "Eve", "2024-12-24 17:00", "23:00"}).exitCode, 0);
  const std::string week = Read("weeksched.tsc"), year = Read("yearsched.tsc");
  struct Case {
    std::vector<std::string> args;
    const char* message;
  } cases[] = {
      {{"add", "weekly", "Clash", "Mon 21:00", "Mon 23:00"},
       "Can't add event -- event conflict; \"Xmas\" (Mon 18:00:00 to Mon 22:00:00) is in the way"},
      {{"add", "weekly", "X", "Mon 25:00", "Mon 23:00"}, "is not a day and a time of day"},
      {{"add", "weekly", "X", "Mon 18:00", "Mon 18:00"}, "must end at another time"},
      {{"add", "dated", "X", "2024-12-24 22:00", "2024-12-26 01:00"},
       "Event spans more than two days"},
      {{"add", "dated", "X", "2024-12-23 23:00", "2024-12-24 18:00"},
       "End time conficts with event in next day"},
      {{"add", "dated", "X", "18:00", "19:00"}, "needs a date"},
      {{"remove", "weekly", "Tue 10:00"}, "no weekly show runs at Tue 10:00:00"},
      {{"remove", "dated", "2024-12-25 10:00"}, "no dated show runs at 2024-12-25 10:00:00"},
      {{"at", "someday"}, "is neither a date and time"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.message);
    Result r = Schedule(c.args);
    EXPECT_NE(r.exitCode, 0);
    EXPECT_THAT(r.err, HasSubstr(c.message));
    EXPECT_EQ(Read("weeksched.tsc"), week);
    EXPECT_EQ(Read("yearsched.tsc"), year);
  }

  // A damaged file is reported, with its first problem, and left as it is.
  const std::string overlapping = "((165600,2,(, 0,A),151200),(162000,2,(, 0,B),158400))\r\n";
  Write("weeksched.tsc", overlapping);
  Result add = Schedule({"add", "weekly", "C", "Tue 10:00", "Tue 11:00"});
  EXPECT_NE(add.exitCode, 0);
  EXPECT_THAT(add.err, HasSubstr("show 2 (\"B\", Mon 20:00:00 to Mon 21:00:00) overlaps \"A\""));
  EXPECT_EQ(Read("weeksched.tsc"), overlapping);
}

// A show file the player reads: five empty playlists.
const char* kShowFile = "((2,3,1,5,,),(0,1,2,0,,),(2,3,2,5,,),(0,1,2,0,,),(2,3,1,5,,))";

TEST_F(ScheduleCommand, CheckExplainsEachKindOfFile) {
  Write("good.tsc", "((2024-12-24,((252000,2,(, 0,Xmas),237600))))\r\n");
  Result good = Check("good.tsc");
  EXPECT_NE(good.exitCode, 0);
  EXPECT_THAT(good.out, HasSubstr("(year schedule)"));
  EXPECT_THAT(good.out, HasSubstr("problem: \"Xmas\" does not exist (looked for at " +
                                  Path("tessavar/Xmas") + ")"));
  std::filesystem::create_directories(Path("tessavar"));
  Write("tessavar/Xmas", kShowFile);
  Result withShow = Check("good.tsc");
  EXPECT_EQ(withShow.exitCode, 0) << withShow.out;
  EXPECT_THAT(withShow.out, HasSubstr("\"Xmas\" (" + Path("tessavar/Xmas") + "): OK"));

  Write("bad.tsc", "((165600,2,(, 0,A),151200),(12,2))\r\n");
  Result bad = Check("bad.tsc");
  EXPECT_NE(bad.exitCode, 0);
  EXPECT_THAT(bad.out, HasSubstr("problem: show 2 has too few fields"));

  Write("show.tss", "((2,3,1,5,,),(0,1,2,0,,),(2,3,2,5,,),(0,1,2");
  Result show = Check("show.tss");
  EXPECT_NE(show.exitCode, 0);
  EXPECT_THAT(show.out, HasSubstr("(show file)"));
  EXPECT_THAT(show.out, HasSubstr("not a well-formed list"));

  EXPECT_THAT(Check("missing.tsc").err, HasSubstr("there is no file"));
}

TEST_F(ScheduleCommand, AtTakesADayAndTimeAsTheNextSuchMoment) {
  ASSERT_EQ(Schedule({"add", "weekly", "Xmas", "Mon 18:00", "Mon 22:00"}).exitCode, 0);
  Result r = Schedule({"at", "Mon 19:00"});
  ASSERT_EQ(r.exitCode, 0) << r.err;
  EXPECT_THAT(r.out, HasSubstr("At Monday "));
  EXPECT_THAT(r.out, HasSubstr(" 19:00:00:"));
  EXPECT_THAT(r.out, HasSubstr("current  \"Xmas\" from the week schedule"));
}

TEST_F(ScheduleCommand, MissingShowFilesAreAddedWithAWarningAndCheckedWithTheSchedules) {
  Result add = Run({"schedule", "add", "weekly", "Later", "Tue 18:00", "Tue 19:00"});
  ASSERT_EQ(add.exitCode, 0) << add.err;
  EXPECT_THAT(add.err, HasSubstr("warning: the show file \"Later\" does not exist (looked for at " +
                                 Path("tessavar/Later") + "); added all the same"));
  Write("tessavar/Eve", kShowFile);
  Write("tessavar/Broken", "((2,3,1");
  ASSERT_EQ(Run({"schedule", "add", "dated", "Eve", "2024-12-24 17:00", "23:00"}).err, "");
  ASSERT_EQ(Run({"schedule", "add", "dated", "Broken", "2024-12-25 17:00", "23:00"}).exitCode, 0);

  // No file: the usual week and year schedules and every show they name.
  Result check = Run({"schedule", "check"});
  EXPECT_NE(check.exitCode, 0);
  EXPECT_THAT(check.out, HasSubstr(Path("tessavar/weeksched.tsc") + " (week schedule):"));
  EXPECT_THAT(check.out, HasSubstr(Path("tessavar/yearsched.tsc") + " (year schedule):"));
  EXPECT_THAT(check.out, HasSubstr("problem: \"Later\" does not exist"));
  EXPECT_THAT(check.out, HasSubstr("problem: \"Broken\" cannot be run"));
  EXPECT_THAT(check.out, HasSubstr("\"Eve\" (" + Path("tessavar/Eve") + "): OK"));
  EXPECT_THAT(check.err, HasSubstr("2 problem(s) in the schedules and their show files"));
}

TEST_F(ScheduleCommand, ADamagedSettingsFileIsReportedOnce) {
  Write("registry.reg",
        "Windows Registry Editor Version 5.00\r\n\r\n"
        "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\r\n\"X\"=dword:zz\r\n");
  for (const std::vector<std::string>& args : {std::vector<std::string>{"schedule", "list"},
                                               {"settings", "list"},
                                               {"schedule", "check"}}) {
    Result r = Run(args);
    size_t first = r.err.find("unreadable dword");
    ASSERT_NE(first, std::string::npos) << args[0] << " " << args[1] << ": " << r.err;
    EXPECT_EQ(r.err.find("unreadable dword", first + 1), std::string::npos) << r.err;
  }
}

}  // namespace
}  // namespace tav::showctl::testing
