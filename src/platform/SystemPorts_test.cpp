#include <gtest/gtest.h>

#include <ctime>
#include <fstream>

#include "platform/LinuxProcessMemory.h"
#include "platform/SystemClock.h"

namespace tav {
namespace {

TEST(SystemClock, NowAgreesWithTheLocalCalendar) {
  SystemClock clock;
  std::time_t before = std::time(nullptr);
  DateTime now = clock.Now();
  std::tm local{};
  localtime_r(&before, &local);
  // Same day unless the test straddled midnight; a whole number of seconds.
  EXPECT_EQ(now.Year(), local.tm_year + 1900);
  EXPECT_NEAR(now.SecondOfDay(), local.tm_hour * 3600 + local.tm_min * 60 + local.tm_sec, 5);
  EXPECT_EQ(now, DateTime::FromParts(now.Year(), now.Month(), now.Day(), now.Hour(), now.Minute(),
                                     now.Second()));
}

TEST(SystemClock, SecondsSinceMidnightIsNowWithItsFraction) {
  SystemClock clock;
  double seconds = clock.SecondsSinceMidnight();
  int whole = clock.Now().SecondOfDay();
  EXPECT_GE(seconds, 0.0);
  EXPECT_LT(seconds, 86400.0);
  // Taken a moment apart; only midnight between the two readings could part them further.
  double apart = whole - seconds;
  if (apart < -43200) apart += 86400;
  EXPECT_GT(apart, -2.0);
  EXPECT_LT(apart, 2.0);
}

TEST(SystemClock, TickCountMovesForward) {
  SystemClock clock;
  uint32_t first = clock.TickCount();
  uint32_t later = clock.TickCount();
  EXPECT_LT(static_cast<uint32_t>(later - first), 1000u);
}

TEST(LinuxProcessMemory, PrivateBytesAreAnonymousResidentPlusSwapped) {
  const char* status =
      "Name:\tshowplayer\nVmRSS:\t  90000 kB\nRssAnon:\t   51200 kB\nRssFile:\t  38800 kB\n"
      "VmSwap:\t    1024 kB\n";
  EXPECT_EQ(LinuxProcessMemory::PrivateBytesFromStatus(status), (51200 + 1024) * 1024);
  EXPECT_EQ(LinuxProcessMemory::PrivateBytesFromStatus("RssAnon: 4 kB\n"), 4096);
  // Larger than 32 bits: the largest 32-bit figure, still above every threshold.
  EXPECT_EQ(LinuxProcessMemory::PrivateBytesFromStatus("RssAnon: 4194304 kB\n"), 2147483647);
}

TEST(LinuxProcessMemory, UnreadableFigureFailsWithTheCodeInTheText) {
  for (const char* status : {"", "VmRSS: 5 kB\n", "RssAnon: lots\n", "RssAnonymous: 5 kB\n"}) {
    try {
      LinuxProcessMemory::PrivateBytesFromStatus(status);
      ADD_FAILURE() << "no failure for: " << status;
    } catch (const Error& e) {
      EXPECT_EQ(e.Description(),
                "Cannot get process memory info; error: " + std::to_string(e.Number()));
      EXPECT_NE(e.Number(), 0);
    }
  }
  try {
    LinuxProcessMemory("/nonexistent/status").PrivateBytes();
    ADD_FAILURE() << "no failure for a missing file";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), ENOENT);
    EXPECT_EQ(e.Description(), "Cannot get process memory info; error: " + std::to_string(ENOENT));
  }
}

TEST(LinuxProcessMemory, OwnProcessGrowsWithTouchedMemory) {
  LinuxProcessMemory memory;
  int32_t before = memory.PrivateBytes();
  EXPECT_GT(before, 0);
  std::vector<char> block(64 << 20, 1);  // touched: must become resident
  int32_t after = memory.PrivateBytes();
  EXPECT_GT(after, before + (32 << 20)) << static_cast<int>(block[12345]);
}

}  // namespace
}  // namespace tav
