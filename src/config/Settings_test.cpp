#include "config/Settings.h"

#include <gtest/gtest.h>

#include <functional>

#include "config/LibRegistry.h"
#include "config/MemoryRegistryStore.h"
#include "ports/testing/RecordingMessageLog.h"
#include "support/Error.h"
#include "support/testing/Failure.h"

namespace tav {
namespace {

class SettingsTest : public ::testing::Test {
 protected:
  void Store(const char* section, const char* name, RegistryValue value) {
    RegistryCreateKey(store, SharedSettingsKey(section));
    RegistrySetValue(store, SharedSettingsKey(section), name, std::move(value));
  }

  MemoryRegistryStore store;
  RecordingMessageLog log;
  Settings settings{store, PathDefaults{"/home/u/.local/share/tessavar/", "/opt/tav", '/'}, &log};
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

TEST_F(SettingsTest, AValueThatCannotBeReadGivesItsDefaultWithOneWarningPerSetting) {
  struct Case {
    const char* section;
    const char* name;
    RegistryValue stored;
    std::function<std::string(const Settings&)> read;
    const char* expected;
    const char* warning;
  } cases[] = {
      {"Sequences", "UseCompressedSequences", RegistryValue::String("yes"),
       [](const Settings& s) { return std::string(s.UseCompressedSequences() ? "T" : "F"); }, "T",
       "2 Setting Sequences\\UseCompressedSequences cannot be read (Type mismatch); using its "
       "default true"},
      {"MonitorMemory", "MonitorDecacheHigh", RegistryValue::Binary("\x01\x02"),
       [](const Settings& s) { return std::to_string(s.MonitorDecacheHigh()); }, "1073741824",
       "2 Setting MonitorMemory\\MonitorDecacheHigh cannot be read (Error getting registry "
       "value); using its default 1073741824"},
      {"Visualizer", "RemotePort", RegistryValue::String("99999999999"),
       [](const Settings& s) { return std::to_string(s.RemotePort()); }, "30303",
       "2 Setting Visualizer\\RemotePort cannot be read (Overflow); using its default 30303"},
      {"Visualizer", "RemoteHost", RegistryValue::Binary("\x7f"),
       [](const Settings& s) { return s.RemoteHost(); }, "127.0.0.1",
       "2 Setting Visualizer\\RemoteHost cannot be read (Error getting registry value); using its "
       "default \"127.0.0.1\""},
      // Kept as 16 bits: a larger number cannot be read either.
      {"Visualizer", "MaxCommandsPerMessage", RegistryValue::Dword(32768),
       [](const Settings& s) { return std::to_string(s.MaxCommandsPerMessage()); }, "999",
       "2 Setting Visualizer\\MaxCommandsPerMessage cannot be read (Overflow); using its "
       "default 999"},
  };
  for (const auto& c : cases) {
    log.lines.clear();
    Store(c.section, c.name, c.stored);
    for (int read = 0; read < 3; ++read) EXPECT_EQ(c.read(settings), c.expected) << c.name;
    EXPECT_EQ(log.lines, std::vector<std::string>{c.warning}) << c.name;
  }
}

TEST_F(SettingsTest, AValueMadeReadableCountsAndALaterBreakageWarnsAgain) {
  Store("Sequences", "UseCompressedSequences", RegistryValue::String("yes"));
  EXPECT_TRUE(settings.UseCompressedSequences());
  Store("Sequences", "UseCompressedSequences", RegistryValue::String("False"));
  EXPECT_FALSE(settings.UseCompressedSequences());
  Store("Sequences", "UseCompressedSequences", RegistryValue::String("no"));
  EXPECT_TRUE(settings.UseCompressedSequences());
  EXPECT_EQ(log.lines.size(), 2u);
  // Without a log the default is given all the same.
  EXPECT_TRUE(Settings(store, {}).UseCompressedSequences());
}

TEST_F(SettingsTest, AFailingRegistryStillFails) {
  store.FailOperation(RegistryOperation::OpenKey, kRegistryAccessDenied);
  auto failure = testing::FailureOf([&] { settings.MonitorRestart(); });
  EXPECT_EQ(failure.number, kRegistryAccessDenied);
  EXPECT_EQ(failure.description, "RegOpenKeyEx failure");
  EXPECT_TRUE(log.lines.empty());
}

TEST_F(SettingsTest, MaxCommandsPerMessageIsKeptAs16Bits) {
  EXPECT_EQ(settings.MaxCommandsPerMessage(), 999);
  settings.Set(settings::kMaxCommandsPerMessage, 32767);
  EXPECT_EQ(settings.MaxCommandsPerMessage(), 32767);
  settings.Set(settings::kMaxCommandsPerMessage, -32768);
  EXPECT_EQ(settings.MaxCommandsPerMessage(), -32768);
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
