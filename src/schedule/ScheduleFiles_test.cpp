// Saving and loading schedules on the local file system, through the
// overloads that take no file store.

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>

#include "schedule/Schedule.h"
#include "schedule/YearSchedule.h"

namespace tav {
namespace {

// The overloads without a store use the local file system.
TEST(LocalTextFiles, OneArgumentSaveAndLoadUseTheLocalFiles) {
  char pattern[] = "/tmp/tav-sched-XXXXXX";
  ASSERT_NE(mkdtemp(pattern), nullptr);
  const std::string dir = pattern;
  Schedule week;
  week.AddShowEventByFile("Xmas", NewWeekTime(1, 18, 0, 0), NewWeekTime(1, 22, 0, 0));
  EXPECT_TRUE(week.Save(dir + "/weeksched.tsc"));
  EXPECT_FALSE(week.Modified());
  EXPECT_FALSE(week.Save(dir + "/no/such/folder/weeksched.tsc"));
  EXPECT_TRUE(WriteTextFile(dir + "/yearsched.tsc", ""));
  EXPECT_TRUE(LoadYearSchedule(dir + "/yearsched.tsc")->Keys().empty());
  EXPECT_TRUE(LoadYearSchedule(dir + "/missing.tsc")->Keys().empty());
  std::filesystem::remove_all(dir);
}

}  // namespace
}  // namespace tav
