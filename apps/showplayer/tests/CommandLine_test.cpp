#include "../CommandLine.h"

#include <gtest/gtest.h>

#include "../ConsoleLog.h"

namespace tav::player {
namespace {

TEST(PlayerCommandLine, OwnOptionsAreTakenOutAndTheRestIsJoinedWithOneBlank) {
  struct Case {
    std::vector<std::string> args;
    std::string commandLine;
    bool view;
  };
  const Case cases[] = {
      {{}, "", false},
      {{"/noschedule"}, "/noschedule", false},
      {{"--view", "/noschedule"}, "/noschedule", true},
      {{"/noschedule", "--view=1-4"}, "/noschedule", true},
      {{"/noschedule "}, "/noschedule ", false},  // the blank stays: not on demand only
      {{"/NOSCHEDULE"}, "/NOSCHEDULE", false},
      {{"/noschedule", "x"}, "/noschedule x", false},
      {{"--veiw"}, "--veiw", false},  // not ours: part of the command line
  };
  for (const Case& c : cases) {
    PlayerCommandLine parsed = ParsePlayerCommandLine(c.args);
    EXPECT_EQ(parsed.commandLine, c.commandLine);
    EXPECT_EQ(parsed.view, c.view);
    EXPECT_FALSE(parsed.help);
  }
  EXPECT_EQ(ParsePlayerCommandLine({"--view=13,14"}).viewSpec, "13,14");
  EXPECT_TRUE(ParsePlayerCommandLine({"x", "--help"}).help);
  EXPECT_TRUE(ParsePlayerCommandLine({"--version"}).version);
}

TEST(PlayerCommandLine, RealtimeTakesAPriorityFromOneTo99) {
  EXPECT_EQ(ParsePlayerCommandLine({"--realtime"}).realtimePriority, kDefaultRealtimePriority);
  EXPECT_EQ(ParsePlayerCommandLine({"--realtime=50", "/noschedule"}).realtimePriority, 50);
  EXPECT_EQ(ParsePlayerCommandLine({"--realtime=50", "/noschedule"}).commandLine, "/noschedule");
  for (const char* bad :
       {"--realtime=0", "--realtime=100", "--realtime=x", "--realtime=5x", "--realtime="}) {
    PlayerCommandLine parsed = ParsePlayerCommandLine({bad});
    EXPECT_EQ(parsed.realtimePriority, 0) << bad;
    EXPECT_NE(parsed.error.find("1 to 99"), std::string::npos) << bad;
  }
}

TEST(ConsoleLog, OneLinePerLogLineWithDateLevelAndText) {
  DateTime at = DateTime::FromParts(2024, 12, 24, 18, 0, 5);
  EXPECT_EQ(FormatConsoleLine(1, at, "Starting show: demo.show"),
            "2024-12-24 18:00:05 info    Starting show: demo.show");
  EXPECT_EQ(FormatConsoleLine(3, at, "a\r\nb"),
            "2024-12-24 18:00:05 error   a\n2024-12-24 18:00:05 error   b");
  EXPECT_EQ(FormatConsoleLine(7, at, "x"), "2024-12-24 18:00:05 level 7 x");
}

TEST(ConsoleLog, ForTheViewKeepsOnlyTheLastLines) {
  ConsoleLog log(stderr);
  log.KeepForView(2);
  DateTime at = DateTime::FromParts(2024, 12, 24, 18, 0, 5);
  log.Write(1, at, "one");
  log.Write(2, at, "two\nthree");
  ASSERT_EQ(log.Recent().size(), 2u);
  EXPECT_EQ(log.Recent().back(), "2024-12-24 18:00:05 warning three");
}

}  // namespace
}  // namespace tav::player
