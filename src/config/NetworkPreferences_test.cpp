#include "config/NetworkPreferences.h"

#include <gtest/gtest.h>

#include "config/LibRegistry.h"
#include "config/MemoryRegistryStore.h"
#include "support/testing/Failure.h"

namespace tav {
namespace {

NetworkPreferences Sample() {
  NetworkPreferences prefs;
  prefs.TAVNetwork(0).SetPort("/dev/ttyUSB0");
  prefs.TAVNetwork(0).SetSpeed(115200);
  prefs.TAVNetwork(3).SetEnhanced(true);
  prefs.TAVNetwork(15).SetDMXUniverse(9);
  DMXUniversePrefs first;
  first.SetUniverse(1);
  DMXUniversePrefs second;
  second.SetUniverse(7);
  second.SetTransport(DMXTransport::kArtNet);
  second.SetDestination("10.0.0.7");
  second.SetStartChannel(513);
  second.SetSize(170);
  prefs.AddDMXUniverse(first);
  prefs.AddDMXUniverse(second);
  prefs.SetX10Port("/dev/ttyS1");
  prefs.SetX10HouseCodes("AC");
  prefs.SetFennickPort("/dev/ttyUSB2");
  prefs.Fennick().SetClampSpecialValues(true);
  prefs.Listener().SetEnabled(true);
  prefs.Listener().SetUniverse(64);
  prefs.Listener().SetPort(5570);
  prefs.SetSyncUniverse(7000);
  return prefs;
}

TEST(NetworkPreferences, SavedPreferencesReadBackEqual) {
  MemoryRegistryStore store;
  NetworkPreferences saved = Sample();
  saved.SaveToRegistry(store);
  NetworkPreferences read;
  read.InitFromRegistry(store);
  EXPECT_FALSE(read.DiffersFrom(saved));
  EXPECT_TRUE(read.Problems().empty());
  EXPECT_EQ(read.DMXUniverse(1).Destination(), "10.0.0.7");
  EXPECT_EQ(read.DMXUniverse(1).Transport(), DMXTransport::kArtNet);
}

TEST(NetworkPreferences, FewerUniversesRemoveTheKeysBeyond) {
  MemoryRegistryStore store;
  NetworkPreferences prefs = Sample();
  prefs.SaveToRegistry(store);
  prefs.RemoveDMXUniverse(0);
  prefs.SaveToRegistry(store);
  NetworkPreferences read;
  read.InitFromRegistry(store);
  ASSERT_EQ(read.DMXUniverseCount(), 1);
  EXPECT_EQ(read.DMXUniverse(0).Universe(), 7);
}

TEST(NetworkPreferences, AnEmptyRegistryGivesTheDefaults) {
  MemoryRegistryStore store;
  NetworkPreferences read;
  read.InitFromRegistry(store);
  EXPECT_FALSE(read.DiffersFrom(NetworkPreferences()));
  EXPECT_EQ(read.DMXUniverseCount(), 0);
  EXPECT_EQ(read.NetPrefUUIDKey(), "Network");
}

TEST(NetworkPreferences, AValueOfTheWrongTypeKeepsItsDefaultAndIsReported) {
  MemoryRegistryStore store;
  Sample().SaveToRegistry(store);
  SetStringSetting(store, "Speed", "Network\\TAV0", "fast");
  SetStringSetting(store, "Transport", "Network\\DMX\\2", "carrier pigeon");
  RegistryCreateKey(store, SharedSettingsKey("Network\\TAV1"));
  store.SetValue(SharedSettingsKey("Network\\TAV1"), "Port", RegistryValue::Binary("\x01\x02"));
  NetworkPreferences read;
  read.InitFromRegistry(store);
  EXPECT_EQ(read.TAVNetwork(0).Speed(), TAVNetworkPreferences().Speed());
  EXPECT_EQ(read.TAVNetwork(0).Port(), "/dev/ttyUSB0");  // the rest still read
  EXPECT_EQ(read.DMXUniverse(1).Transport(), DMXTransport::kE131);
  EXPECT_EQ(read.TAVNetwork(1).Port(), "");
  ASSERT_EQ(read.Problems().size(), 3u);
  EXPECT_NE(read.Problems()[0].find("Shared\\Network\\TAV0\\Speed"), std::string::npos);
}

// A store that fails every value read, as an unreadable settings file does.
class FailingStore : public MemoryRegistryStore {
 public:
  int32_t QueryValueInfo(const std::string&, const std::string&, uint32_t&, uint32_t&) override {
    return kRegistryIoFailed;
  }
  int32_t QueryValue(const std::string&, const std::string&, RegistryValue&) override {
    return kRegistryIoFailed;
  }
};

TEST(NetworkPreferences, AStoreThatCannotBeReadIsRaisedAndChangesNothing) {
  FailingStore store;
  RegistryCreateKey(store, SharedSettingsKey("Network"));
  NetworkPreferences prefs = Sample();
  EXPECT_EQ(testing::FailureOf([&] { prefs.InitFromRegistry(store); }).number, kRegistryIoFailed);
  EXPECT_FALSE(prefs.DiffersFrom(Sample()));
}

TEST(NetworkPreferences, DiffersFromSeesEveryPart) {
  NetworkPreferences base = Sample();
  std::vector<std::function<void(NetworkPreferences&)>> changes = {
      [](auto& p) { p.TAVNetwork(2).SetOldMCP(true); },
      [](auto& p) { p.DMXUniverse(0).SetPriority(150); },
      [](auto& p) { p.SetX10Port(""); },
      [](auto& p) { p.Fennick().SetBoards(3); },
      [](auto& p) { p.Listener().SetThreshold(10); },
      [](auto& p) { p.SetSourceCID("x"); },
      [](auto& p) { p.AddDMXUniverse(DMXUniversePrefs()); },
  };
  for (size_t i = 0; i < changes.size(); ++i) {
    NetworkPreferences changed;
    changed.CopyFrom(base);
    EXPECT_FALSE(changed.DiffersFrom(base));
    changes[i](changed);
    EXPECT_TRUE(changed.DiffersFrom(base)) << "change " << i;
  }
}

TEST(NetworkPreferences, OutOfRangeValuesAreNamed) {
  NetworkPreferences prefs = Sample();
  EXPECT_TRUE(prefs.Validate().empty());
  prefs.DMXUniverse(0).SetUniverse(64000);
  prefs.DMXUniverse(1).SetTransport(DMXTransport::kUSBPro);
  prefs.SetX10HouseCodes("AZ");
  auto problems = prefs.Validate();
  ASSERT_EQ(problems.size(), 3u);
  EXPECT_EQ(problems[0], "DMX universe entry 1 universe is 64000, outside 1-63999");
  EXPECT_EQ(testing::FailureOf([&] { prefs.TAVNetwork(16); }).number, 9);
}

TEST(NetworkPreferences, BumpingTheVersionChangesItsText) {
  MemoryRegistryStore store;
  NetworkPreferences::BumpVersion(store);
  std::string first = GetStringSetting(store, "Ver", "Network", "");
  NetworkPreferences::BumpVersion(store);
  std::string second = GetStringSetting(store, "Ver", "Network", "");
  EXPECT_EQ(first.size(), 38u);
  EXPECT_NE(first, second);
}

}  // namespace
}  // namespace tav
