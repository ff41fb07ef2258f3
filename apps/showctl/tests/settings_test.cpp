#include <gmock/gmock.h>

#include "ShowctlRunner.h"

namespace tav::showctl::testing {
namespace {

using ::testing::HasSubstr;
using SettingsCommand = ShowctlTest;

TEST_F(SettingsCommand, SetThenGetAndDefaults) {
  EXPECT_EQ(Run({"settings", "get", "MonitorRestart", "-s", "MonitorMemory"}).out, "true\n");
  EXPECT_FALSE(std::filesystem::exists(Path("registry.reg")));  // reading creates nothing

  ASSERT_EQ(Run({"settings", "set", "MonitorRestart", "false", "-s", "MonitorMemory"}).exitCode, 0);
  ASSERT_EQ(Run({"settings", "set", "RemoteHost", "10.1.2.3", "-s", "Visualizer"}).exitCode, 0);
  EXPECT_EQ(Run({"settings", "get", "MonitorRestart", "-s", "MonitorMemory"}).out, "false\n");
  EXPECT_EQ(Run({"settings", "get", "RemoteHost", "-s", "Visualizer"}).out, "10.1.2.3\n");
  EXPECT_THAT(Read("registry.reg"), HasSubstr("\"MonitorRestart\"=dword:00000000"));

  Result list = Run({"settings", "list"});
  EXPECT_EQ(list.exitCode, 0);
  EXPECT_THAT(list.out, HasSubstr("MonitorDecacheHigh"));
  EXPECT_THAT(list.out, HasSubstr("10.1.2.3"));
}

TEST_F(SettingsCommand, BadInputFailsClearlyAndChangesNothing) {
  ASSERT_EQ(Run({"settings", "set", "MonitorX", "5", "-s", "VideoPreferences"}).exitCode, 0);
  const std::string before = Read("registry.reg");
  struct Case {
    std::vector<std::string> args;
    const char* message;
  };
  Write("broken.reg",
        "REGEDIT4\n\n[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Visualizer]\n"
        "\"RemoteHost\"=\"10.0.0.9\"\nbroken line\n");
  const Case cases[] = {
      {{"settings", "set", "MonitorDecacheHigh", "lots", "-s", "MonitorMemory"}, "lots"},
      {{"settings", "import", "broken.reg"}, "nothing was imported"},
      {{"settings", "import", "missing.reg"}, "missing.reg"},
      {{"settings", "frobnicate"}, ""},
  };
  for (const auto& c : cases) {
    Result r = Run(c.args);
    EXPECT_NE(r.exitCode, 0) << c.args[1];
    EXPECT_THAT(r.err, HasSubstr(c.message)) << c.args[1];
    EXPECT_EQ(Read("registry.reg"), before) << c.args[1];
  }
}

TEST_F(SettingsCommand, ExportImportRoundTripsThroughWindowsFormats) {
  ASSERT_EQ(Run({"settings", "set", "MonitorY", "7", "-s", "VideoPreferences"}).exitCode, 0);
  ASSERT_EQ(Run({"settings", "export", "--utf16", "out.reg"}).exitCode, 0);
  std::string exported = Read("out.reg");
  ASSERT_GE(exported.size(), 2u);
  EXPECT_EQ(static_cast<unsigned char>(exported[0]), 0xFF);  // UTF-16LE mark
  EXPECT_EQ(static_cast<unsigned char>(exported[1]), 0xFE);

  std::filesystem::remove(Path("registry.reg"));
  ASSERT_EQ(Run({"settings", "import", "out.reg"}).exitCode, 0);
  EXPECT_EQ(Run({"settings", "get", "MonitorY", "-s", "VideoPreferences"}).out, "7\n");

  // An 8-bit file from an older editor, read from standard input.
  Result r = Run({"settings", "import", "-"},
                 "REGEDIT4\r\n\r\n[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\r\n"
                 "\"UserDataPath\"=\"/srv/shows/\"\r\n");
  ASSERT_EQ(r.exitCode, 0) << r.err;
  EXPECT_EQ(Run({"settings", "get", "UserDataPath"}).out, "/srv/shows/\n");
}

TEST_F(SettingsCommand, EveryCommandHasHelp) {
  for (const char* command : {"get", "set", "list", "import", "export"}) {
    Result r = Run({"settings", command, "--help"});
    EXPECT_EQ(r.exitCode, 0) << command;
    EXPECT_THAT(r.out, HasSubstr("Usage")) << command;
  }
}

}  // namespace
}  // namespace tav::showctl::testing

namespace tav::showctl::testing {
namespace {

// Schedules are looked for where the settings say the user data lives.
TEST_F(SettingsCommand, ScheduleCommandsFollowTheUserDataPathSetting) {
  std::filesystem::create_directory(Path("shows"));
  ASSERT_EQ(Run({"settings", "set", "UserDataPath", Path("shows")}).exitCode, 0);
  Result add = Run({"schedule", "add", "weekly", "Xmas.tss", "Mon 18:00", "Mon 22:00"});
  EXPECT_EQ(add.exitCode, 0) << add.err;
  EXPECT_TRUE(std::filesystem::exists(Path("shows/weeksched.tsc")));
  EXPECT_FALSE(std::filesystem::exists(Path("tessavar/weeksched.tsc")));
}

}  // namespace
}  // namespace tav::showctl::testing
