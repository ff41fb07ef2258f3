#include "config/LibRegistry.h"

#include <gtest/gtest.h>

#include <functional>

#include "config/MemoryRegistryStore.h"
#include "support/Error.h"

namespace tav {
namespace {

const std::string kVideo = "Software\\Tessavar\\Shared\\VideoPreferences";

class LibRegistryTest : public ::testing::Test {
 protected:
  // The error a call raises, as "number|source|description", or "" if none.
  static std::string Failure(const std::function<void()>& call) {
    try {
      call();
    } catch (const Error& e) {
      return std::to_string(e.Number()) + "|" + e.Source() + "|" + e.Description();
    }
    return "";
  }

  MemoryRegistryStore store;
};

TEST_F(LibRegistryTest, KeysOfTheSuite) {
  EXPECT_EQ(SuiteKey(""), "Software\\Tessavar");
  EXPECT_EQ(SuiteKey("Network"), "Software\\Tessavar\\Network");
  EXPECT_EQ(SharedSettingsKey(""), "Software\\Tessavar\\Shared");
  EXPECT_EQ(SharedSettingsKey("VideoPreferences"), kVideo);
}

TEST_F(LibRegistryTest, AbsentSettingGivesTheDefaultAndCreatesNothing) {
  EXPECT_TRUE(GetBooleanSetting(store, "DisplayVideos", "VideoPreferences", true));
  EXPECT_FALSE(GetBooleanSetting(store, "AudioOnly", "VideoPreferences", false));
  EXPECT_EQ(GetLongSetting(store, "MonitorX", "VideoPreferences", -7), -7);
  EXPECT_EQ(GetStringSetting(store, "RemoteHost", "Visualizer", "127.0.0.1"), "127.0.0.1");
  // Key present, value absent: still the default.
  SetLongSetting(store, "MonitorY", "VideoPreferences", 3);
  EXPECT_EQ(GetLongSetting(store, "MonitorX", "VideoPreferences", 11), 11);
  EXPECT_EQ(store.Calls(RegistryOperation::CreateKey), 1);
  EXPECT_EQ(store.Document().Sections().size(), 1u);
  EXPECT_EQ(RegistryEnumSubKeys(store, SharedSettingsKey("")),
            std::vector<std::string>{"VideoPreferences"});
}

TEST_F(LibRegistryTest, EmptySectionIsTheSharedKeyItself) {
  SetStringSetting(store, "UserDataPath", "", "/data/");
  RegistryValue value = RegistryQueryValue(store, "Software\\Tessavar\\Shared", "UserDataPath");
  EXPECT_EQ(value, RegistryValue::String("/data/"));
  EXPECT_EQ(GetStringSetting(store, "UserDataPath", "", "x"), "/data/");
  EXPECT_EQ(GetStringSetting(store, "UserDataPath", "Other", "x"), "x");
}

TEST_F(LibRegistryTest, SettersStoreNumbersAndTextAndGettersReadThemBack) {
  SetBooleanSetting(store, "FullScreenVideo", "VideoPreferences", true);
  SetBooleanSetting(store, "AudioOnly", "VideoPreferences", false);
  SetLongSetting(store, "MonitorX", "VideoPreferences", -1920);
  SetStringSetting(store, "RemoteHost", "Visualizer", "show-pc");
  EXPECT_EQ(RegistryQueryValue(store, kVideo, "FullScreenVideo"), RegistryValue::Dword(1));
  EXPECT_EQ(RegistryQueryValue(store, kVideo, "AudioOnly"), RegistryValue::Dword(0));
  EXPECT_TRUE(GetBooleanSetting(store, "fullscreenvideo", "videopreferences", false));
  EXPECT_FALSE(GetBooleanSetting(store, "AudioOnly", "VideoPreferences", true));
  EXPECT_EQ(GetLongSetting(store, "MonitorX", "VideoPreferences", 0), -1920);
  EXPECT_EQ(GetStringSetting(store, "MonitorX", "VideoPreferences", ""), "-1920");
  EXPECT_EQ(GetStringSetting(store, "RemoteHost", "Visualizer", ""), "show-pc");
}

TEST_F(LibRegistryTest, HandEditedTextConvertsLikeThePlatformOrFails) {
  struct Case {
    std::string text;
    std::string asLong;  // value, or "error N"
    std::string asBool;
  };
  const Case cases[] = {
      {"42", "42", "true"},
      {" -3 ", "-3", "true"},
      {"0", "0", "false"},
      {"2.5", "2", "true"},
      {"True", "error 13", "true"},
      {"false", "error 13", "false"},
      {"abc", "error 13", "error 13"},
      {"", "error 13", "error 13"},
      {"99999999999", "error 6", "error 6"},
  };
  auto outcome = [](const std::function<std::string()>& read) {
    try {
      return read();
    } catch (const Error& e) {
      return "error " + std::to_string(e.Number());
    }
  };
  for (const auto& c : cases) {
    SetStringSetting(store, "Value", "S", c.text);
    EXPECT_EQ(outcome([&] { return std::to_string(GetLongSetting(store, "Value", "S", 7)); }),
              c.asLong)
        << c.text;
    EXPECT_EQ(
        outcome([&] {
          return std::string(GetBooleanSetting(store, "Value", "S", false) ? "true" : "false");
        }),
        c.asBool)
        << c.text;
  }
}

TEST_F(LibRegistryTest, ValueOfAnotherTypeIsAnError) {
  RegistryCreateKey(store, kVideo);
  RegistrySetValue(store, kVideo, "Blob", RegistryValue::Binary("\x01\x02"));
  EXPECT_EQ(Failure([&] { GetLongSetting(store, "Blob", "VideoPreferences", 0); }),
            "87|LibRegistry.RegistryGetValue|Error getting registry value");
}

TEST_F(LibRegistryTest, EachFailingCallIsNamedInItsError) {
  SetLongSetting(store, "MonitorX", "VideoPreferences", 1);
  struct Case {
    RegistryOperation operation;
    std::function<void()> call;
    std::string expected;
  };
  const Case cases[] = {
      {RegistryOperation::OpenKey,
       [&] { GetLongSetting(store, "MonitorX", "VideoPreferences", 0); },
       "5|LibRegistry.RegistryKeyExists|RegOpenKeyEx failure"},
      {RegistryOperation::QueryValueInfo,
       [&] { GetLongSetting(store, "MonitorX", "VideoPreferences", 0); },
       "5|LibRegistry.RegistryQueryValueLength|RegQueryValueEx failure (length)"},
      {RegistryOperation::QueryValue,
       [&] { GetLongSetting(store, "MonitorX", "VideoPreferences", 0); },
       "5|LibRegistry.RegistryQueryValue|RegQueryValueEx failure"},
      {RegistryOperation::CreateKey, [&] { SetLongSetting(store, "MonitorX", "New", 0); },
       "5|LibRegistry.RegistryCreateKey|RegCreateKeyEx failure"},
      {RegistryOperation::SetValue,
       [&] { SetLongSetting(store, "MonitorX", "VideoPreferences", 0); },
       "5|LibRegistry.RegistrySetValue|RegSetValueEx failure"},
      {RegistryOperation::DeleteValue, [&] { RegistryDeleteValue(store, kVideo, "MonitorX"); },
       "5|LibRegistry.RegistryDeleteValue|RegDeleteValue failure"},
      {RegistryOperation::DeleteKey, [&] { RegistryDeleteKey(store, kVideo); },
       "5|LibRegistry.RegistryDeleteKey|RegDeleteKey failure"},
      {RegistryOperation::EnumSubKeys, [&] { RegistryEnumSubKeys(store, kVideo); },
       "5|LibRegistry.RegistryEnumSubKeys|Error getting registry value"},
      {RegistryOperation::EnumValues, [&] { RegistryEnumValues(store, kVideo); },
       "5|LibRegistry.RegistryEnumValues|Error getting registry value"},
      {RegistryOperation::QueryKeyInfo, [&] { RegistryQueryKeyInfo(store, kVideo); },
       "5|LibRegistry.RegistryQueryKeyInfo|Error getting registry value"},
  };
  for (const auto& c : cases) {
    store.FailOperation(c.operation, kRegistryAccessDenied, 1);
    EXPECT_EQ(Failure(c.call), c.expected);
    // The failure was one-off: the same call now succeeds.
    EXPECT_EQ(Failure(c.call), "") << c.expected;
    SetLongSetting(store, "MonitorX", "VideoPreferences", 1);
  }
}

TEST_F(LibRegistryTest, MissingThingsAreFailuresForThePrimitives) {
  EXPECT_FALSE(RegistryKeyExists(store, kVideo));
  EXPECT_EQ(RegistryQueryValueLength(store, kVideo, "X"), std::nullopt);
  EXPECT_EQ(Failure([&] { RegistryQueryValue(store, kVideo, "X"); }),
            "2|LibRegistry.RegistryQueryValue|RegQueryValueEx failure");
  EXPECT_EQ(Failure([&] { RegistrySetValue(store, kVideo, "X", RegistryValue::Dword(1)); }),
            "2|LibRegistry.RegistrySetValue|RegSetValueEx failure");
  EXPECT_EQ(Failure([&] { RegistryDeleteKey(store, kVideo); }),
            "2|LibRegistry.RegistryDeleteKey|RegOpenKeyEx failure");
}

TEST_F(LibRegistryTest, DeletingAKeyDeletesItsSubKeysFirst) {
  SetLongSetting(store, "A", "Net\\One\\Deep", 1);
  SetLongSetting(store, "B", "Net\\Two", 2);
  SetLongSetting(store, "C", "Net", 3);
  SetLongSetting(store, "D", "Other", 4);
  RegistryDeleteKey(store, SharedSettingsKey("Net"));
  EXPECT_FALSE(RegistryKeyExists(store, SharedSettingsKey("Net")));
  EXPECT_EQ(RegistryEnumSubKeys(store, SharedSettingsKey("")), std::vector<std::string>{"Other"});
  // Deepest first, one key at a time: Deep, One, Two, Net.
  EXPECT_EQ(store.Calls(RegistryOperation::DeleteKey), 4);
}

TEST_F(LibRegistryTest, KeyInfoCountsSubKeysAndValues) {
  SetStringSetting(store, "Name", "Sec", "four");
  SetLongSetting(store, "LongerName", "Sec", 1);
  SetLongSetting(store, "X", "Sec\\Child", 1);
  RegistryKeyInfo info = RegistryQueryKeyInfo(store, SharedSettingsKey("Sec"));
  EXPECT_EQ(info.subKeyCount, 1u);
  EXPECT_EQ(info.maxSubKeyLength, 5u);
  EXPECT_EQ(info.valueCount, 2u);
  EXPECT_EQ(info.maxValueNameLength, 10u);
  EXPECT_EQ(info.maxValueLength, 5u);  // "four" and its terminator
  uint32_t type = 0;
  EXPECT_EQ(RegistryQueryValueLength(store, SharedSettingsKey("Sec"), "Name", &type), 5u);
  EXPECT_EQ(type, kRegSz);
}

TEST(RegistryValueTypeName, NamesKnownTypesAndNumbersOthers) {
  const std::pair<uint32_t, std::string> names[] = {
      {0, "REG_NONE"},    {1, "REG_SZ"},        {2, "REG_EXPAND_SZ"},
      {3, "REG_BINARY"},  {4, "REG_DWORD"},     {5, "REG_DWORD_BIG_ENDIAN"},
      {6, "REG_LINK"},    {7, "REG_MULTI_SZ"},  {11, "REG_QWORD"},
      {8, "Unknown (8)"}, {12, "Unknown (12)"},
  };
  for (const auto& [type, name] : names) EXPECT_EQ(RegistryValueTypeName(type), name);
}

}  // namespace
}  // namespace tav
