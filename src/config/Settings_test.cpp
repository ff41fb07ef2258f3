#include "config/Settings.h"

#include <gtest/gtest.h>

#include "config/LibRegistry.h"
#include "config/MemoryRegistryStore.h"
#include "support/Error.h"

namespace tav {
namespace {

class SettingsTest : public ::testing::Test {
 protected:
  MemoryRegistryStore store;
  Settings settings{store, PathDefaults{"/home/u/.local/share/tessavar/", "/opt/tav", '/'}};
};

TEST_F(SettingsTest, EverySettingHasItsSectionTypeAndDefault) {
  std::vector<std::string> rows;
  for (const auto& s : KnownSettings()) {
    rows.push_back(std::string(s.section) + "|" + std::string(s.name) + "|" + std::string(s.type) +
                   "|" + s.defaultText);
  }
  EXPECT_EQ(rows, (std::vector<std::string>{
                      "VideoPreferences|AudioOnly|boolean|false",
                      "VideoPreferences|DisplayVideos|boolean|true",
                      "VideoPreferences|DisplayVisualizations|boolean|false",
                      "VideoPreferences|FullScreenVideo|boolean|false",
                      "VideoPreferences|MonitorX|long|0",
                      "VideoPreferences|MonitorY|long|0",
                      "MonitorMemory|MonitorDecache|boolean|true",
                      "MonitorMemory|MonitorDecacheHigh|long|1073741824",
                      "MonitorMemory|MonitorDecacheLow|long|943718400",
                      "MonitorMemory|MonitorRestart|boolean|true",
                      "MonitorMemory|MonitorRestartBytesThreshold|long|104857600",
                      "MonitorMemory|MonitorRestartSecondsThreshold|long|60",
                      "MonitorMemory|MonitorRestartSuppressSeconds|long|300",
                      "Visualizer|RemotePort|long|30303",
                      "Visualizer|RemoteHost|string|127.0.0.1",
                      "Visualizer|MaxCommandsPerMessage|long|999",
                      "Visualizer|MaxBytesPerMessage|long|9999",
                      "Visualizer|MaxDatagramSize|long|65535",
                      "Visualizer|MaxDatagramsPerCycle|long|1",
                      "Visualizer|ThrottleDatagrams|boolean|false",
                      "|AppPath|string|",
                      "|UserDataPath|string|",
                      "Sequences|UseCompressedSequences|boolean|true",
                      "Media|AudioOutput|string|",
                      "Media|AudioDevice|string|",
                      "Media|VideoOutput|string|",
                  }));
}

TEST_F(SettingsTest, AccessorsReadTheStoreAtEachUse) {
  EXPECT_TRUE(settings.MonitorRestart());
  EXPECT_EQ(settings.MonitorDecacheHigh(), 1073741824);
  SetBooleanSetting(store, "MonitorRestart", "MonitorMemory", false);
  SetLongSetting(store, "MonitorDecacheHigh", "MonitorMemory", 5);
  EXPECT_FALSE(settings.MonitorRestart());
  EXPECT_EQ(settings.MonitorDecacheHigh(), 5);
  settings.Set(settings::kUseCompressedSequences, false);
  EXPECT_FALSE(GetBooleanSetting(store, "UseCompressedSequences", "Sequences", true));
  settings.Set(settings::kRemoteHost, "10.0.0.2");
  EXPECT_EQ(settings.RemoteHost(), "10.0.0.2");
}

TEST_F(SettingsTest, MaxCommandsPerMessageIsKeptAs16Bits) {
  EXPECT_EQ(settings.MaxCommandsPerMessage(), 999);
  settings.Set(settings::kMaxCommandsPerMessage, 32767);
  EXPECT_EQ(settings.MaxCommandsPerMessage(), 32767);
  settings.Set(settings::kMaxCommandsPerMessage, 32768);
  try {
    settings.MaxCommandsPerMessage();
    FAIL() << "expected overflow";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), errors::kOverflow);
  }
}

TEST_F(SettingsTest, PathsAreReadOnceAndEndWithTheSeparator) {
  SetStringSetting(store, "UserDataPath", "", "/srv/shows");
  EXPECT_EQ(settings.UserDataPath(), "/srv/shows/");
  EXPECT_EQ(settings.WeekSchedulePath(), "/srv/shows/weeksched.tsc");
  EXPECT_EQ(settings.YearSchedulePath(), "/srv/shows/yearsched.tsc");
  SetStringSetting(store, "UserDataPath", "", "/elsewhere/");
  EXPECT_EQ(settings.UserDataPath(), "/srv/shows/");
  // A fresh reader sees the new value, already ending with the separator.
  EXPECT_EQ(Settings(store, {}).UserDataPath(), "/elsewhere/");
}

TEST_F(SettingsTest, EmptyPathsFallBackToThePlatformFolders) {
  EXPECT_EQ(settings.UserDataPath(), "/home/u/.local/share/tessavar/");
  EXPECT_EQ(settings.AppPath(), "/opt/tav/");
  SetStringSetting(store, "AppPath", "", "");
  EXPECT_EQ(Settings(store, {"", "", '\\'}).AppPath(), "\\");
}

}  // namespace
}  // namespace tav
