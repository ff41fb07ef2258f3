#include "platform/LocalTextFiles.h"
#include "support/testing/Failure.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include "schedule/Schedule.h"
#include "schedule/YearSchedule.h"
#include "support/Error.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

namespace fs = std::filesystem;

class LocalTextFilesTest : public ::testing::Test {
 protected:
  ~LocalTextFilesTest() override { fs::permissions(m_folder, fs::perms::owner_all); }

  std::string Path(const std::string& name) const { return (fs::path(m_folder) / name).string(); }
  std::vector<std::string> Entries() const {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(m_folder)) {
      names.push_back(entry.path().filename().string());
    }
    std::sort(names.begin(), names.end());
    return names;
  }

  LocalTextFiles files;
  TempFolder m_temp{"tav-files"};
  std::string m_folder = m_temp.Path();
};

TEST_F(LocalTextFilesTest, WritesAndReadsWholeTexts) {
  std::string text = "((165600,2,(, 0,Xmas),151200))\r\n";
  text += std::string(200000, 'x');  // more than one read buffer
  files.WriteText(Path("weeksched.tsc"), text);
  EXPECT_EQ(files.ReadText(Path("weeksched.tsc")), text);
  files.WriteText(Path("weeksched.tsc"), "\r\n");
  EXPECT_EQ(files.ReadText(Path("weeksched.tsc")), "\r\n");
  EXPECT_EQ(Entries(), std::vector<std::string>{"weeksched.tsc"});  // no temporary left behind
}

TEST_F(LocalTextFilesTest, AMissingFileReadsAsNothing) {
  EXPECT_EQ(files.ReadText(Path("missing.tsc")), std::nullopt);
  EXPECT_NE(tav::testing::FailureOf([&] { files.ReadText(m_folder); }).number,
            0);  // a folder is no file
}

TEST_F(LocalTextFilesTest, AnOverwrittenFileKeepsItsPermissions) {
  files.WriteText(Path("yearsched.tsc"), "old");
  ::chmod(Path("yearsched.tsc").c_str(), 0640);
  files.WriteText(Path("yearsched.tsc"), "new");
  struct stat info {};
  ASSERT_EQ(::stat(Path("yearsched.tsc").c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 0777, 0640u);
}

TEST_F(LocalTextFilesTest, AFailedWriteLeavesThePreviousFileAndNoTemporary) {
  files.WriteText(Path("weeksched.tsc"), "previous\r\n");
  EXPECT_EQ(
      tav::testing::FailureOf([&] { files.WriteText(Path("no/such/folder.tsc"), "x"); }).number,
      76);
  EXPECT_NE(tav::testing::FailureOf([&] { files.WriteText(m_folder, "x"); }).number,
            0);            // onto a folder
  if (::geteuid() != 0) {  // permissions do not hold back root
    fs::permissions(m_folder, fs::perms::owner_read | fs::perms::owner_exec);
    EXPECT_EQ(
        tav::testing::FailureOf([&] { files.WriteText(Path("weeksched.tsc"), "new\r\n"); }).number,
        70);
    fs::permissions(m_folder, fs::perms::owner_all);
  }
  EXPECT_EQ(files.ReadText(Path("weeksched.tsc")), "previous\r\n");
  EXPECT_EQ(Entries(), std::vector<std::string>{"weeksched.tsc"});
}

TEST_F(LocalTextFilesTest, SchedulesSaveAndLoadThroughTheLocalFiles) {
  Schedule week;
  week.AddShowEventByFile("Xmas", NewWeekTime(1, 18, 0, 0), NewWeekTime(1, 22, 0, 0));
  EXPECT_TRUE(week.Save(Path("weeksched.tsc"), files));
  EXPECT_FALSE(week.Modified());
  EXPECT_FALSE(week.Save(Path("no/such/folder/weeksched.tsc"), files));
  EXPECT_EQ(ScheduleToText(*LoadWeekSchedule(Path("weeksched.tsc"), files)), ScheduleToText(week));
  EXPECT_TRUE(WriteTextFile(Path("yearsched.tsc"), "", files));
  EXPECT_TRUE(LoadYearSchedule(Path("yearsched.tsc"), files)->Keys().empty());
  EXPECT_TRUE(LoadYearSchedule(Path("missing.tsc"), files)->Keys().empty());
}

}  // namespace
}  // namespace tav
