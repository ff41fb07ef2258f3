// Opening the networks, at start, on first use, and again when the registry
// announces a new configuration.

#include "show/NetworkStartup.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "config/LibRegistry.h"
#include "config/MemoryRegistryStore.h"
#include "ports/testing/RecordingMessageLog.h"
#include "ports/testing/VirtualTimerService.h"
#include "show/TriggerFunctions.h"
#include "show/testing/ShowRig.h"
#include "suite/channelio/testing/RecordingChannelIO.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

// The four settings of every TAV network, in order, as the control records
// them.
std::vector<std::string> TAVSettings(const NetworkPreferences& prefs) {
  std::vector<std::string> calls;
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const auto& tav = prefs.TAVNetwork(i);
    std::string n = std::to_string(i);
    calls.push_back("SetTAVNetworkSpeed(" + n + ", " + std::to_string(tav.Speed()) + ")");
    calls.push_back("SetTAVNetworkOldMCP(" + n + ", " + (tav.OldMCP() ? "true" : "false") + ")");
    calls.push_back("SetTAVNetworkEnhanced(" + n + ", " + (tav.Enhanced() ? "true" : "false") +
                    ")");
    calls.push_back("SetTAVNetworkPort(" + n + ", " + tav.Port() + ")");
  }
  return calls;
}

class NetworkTest : public ::testing::Test {
 protected:
  NetworkPreferences Saved() {
    NetworkPreferences prefs;
    prefs.TAVNetwork(0).SetPort("/dev/ttyUSB0");
    prefs.TAVNetwork(3).SetPort("/dev/ttyS3");
    prefs.TAVNetwork(3).SetSpeed(115200);
    prefs.TAVNetwork(3).SetOldMCP(true);
    prefs.SetX10Port("/dev/ttyX10");
    prefs.SetFennickPort("/dev/ttyFen");
    prefs.SaveToRegistry(store);
    return prefs;
  }
  NetworkStartup& Make() {
    networks = std::make_unique<NetworkStartup>(store);
    networks->SetControls(&cio, &log);
    return *networks;
  }

  MemoryRegistryStore store;
  RecordingChannelIO cio;
  RecordingMessageLog log;
  std::unique_ptr<NetworkStartup> networks;
};

TEST_F(NetworkTest, TAVNetworksGetTheirFourSettingsInOrderThenTheRest) {
  NetworkPreferences prefs = Saved();
  Make().InitializeTAVNetworks();
  std::vector<std::string> expected = TAVSettings(prefs);
  expected.push_back("ApplyNetworkPreferences()");
  EXPECT_EQ(cio.CallTexts(), expected);
  EXPECT_EQ(expected[12], "SetTAVNetworkSpeed(3, 115200)");
  EXPECT_THAT(log.lines, ElementsAre("1 Initializing TAV networks", "1 TAV networks initialized"));
}

TEST_F(NetworkTest, X10AndFennickOpenOnFirstUseOnly) {
  Saved();
  NetworkStartup& n = Make();
  n.InitializeTAVNetworks();
  cio.ClearCalls();
  log.lines.clear();
  n.OpenFamiliesFor(true, false, false);
  EXPECT_THAT(cio.CallTexts(), IsEmpty());
  n.OpenFamiliesFor(false, true, false);
  n.OpenFamiliesFor(true, true, true);
  n.OpenFamiliesFor(true, true, true);
  EXPECT_THAT(cio.CallTexts(),
              ElementsAre("OpenX10Network(/dev/ttyX10)", "OpenFennickNetwork(/dev/ttyFen)"));
  EXPECT_THAT(log.lines,
              ElementsAre("1 Initializing X10 network", "1 X10 network initialized",
                          "1 Initializing Fennick network", "1 Fennick network initialized"));
}

TEST_F(NetworkTest, ARegistryChangeWithNoRealDifferenceSendsNothing) {
  Saved();
  NetworkStartup& n = Make();
  n.InitializeTAVNetworks();
  cio.ClearCalls();
  log.lines.clear();
  NetworkPreferences::BumpVersion(store);
  n.UpdateFromRegistry();
  EXPECT_THAT(log.lines, ElementsAre("1 A Network Config Registry Change was detected",
                                     "1 No actual network changes detected"));
  EXPECT_THAT(cio.CallTexts(), IsEmpty());
}

TEST_F(NetworkTest, ARealChangeHandsOverEveryTAVNetworkAndReopensAMovedFamily) {
  NetworkPreferences prefs = Saved();
  NetworkStartup& n = Make();
  n.InitializeTAVNetworks();
  n.OpenFamiliesFor(false, true, true);
  cio.ClearCalls();
  log.lines.clear();

  prefs.TAVNetwork(5).SetEnhanced(true);
  prefs.SetX10Port("/dev/ttyUSB7");
  prefs.SaveToRegistry(store);
  n.UpdateFromRegistry();
  std::vector<std::string> expected = TAVSettings(prefs);
  expected.push_back("ApplyNetworkPreferences()");
  EXPECT_EQ(cio.CallTexts(), expected);
  EXPECT_THAT(log.lines, ElementsAre("1 A Network Config Registry Change was detected",
                                     "1 Network Preferences need to be updated",
                                     "1 Network Preferences update complete"));
  // X10 moved: the next sequence that needs it opens it on the new port;
  // Fennick did not.
  cio.ClearCalls();
  n.OpenFamiliesFor(false, true, true);
  EXPECT_THAT(cio.CallTexts(), ElementsAre("OpenX10Network(/dev/ttyUSB7)"));
}

TEST_F(NetworkTest, AFailureOnTheWayIsLoggedAsItsOneLine) {
  NetworkPreferences prefs = Saved();
  NetworkStartup& n = Make();
  prefs.TAVNetwork(1).SetPort("/dev/ttyS1");
  prefs.SaveToRegistry(store);
  cio.FailNext("SetTAVNetworkPort", kErrorPortAlreadyOpen, "port busy");
  n.UpdateFromRegistry();
  EXPECT_THAT(log.lines, ElementsAre("1 A Network Config Registry Change was detected",
                                     "1 Network Preferences need to be updated",
                                     "3 Could not Auto Update Network Preferences from registry"));
  log.lines.clear();
  store.FailOperation(RegistryOperation::OpenKey, kRegistryIoFailed);
  n.UpdateFromRegistry();
  EXPECT_THAT(log.lines, ElementsAre("1 A Network Config Registry Change was detected",
                                     "3 Could not Auto Update Network Preferences from registry"));
}

TEST_F(NetworkTest, AValueOfTheWrongTypeIsReportedAndItsDefaultUsed) {
  Saved();
  SetStringSetting(store, "Speed", "Network\\TAV3", "fast");
  NetworkStartup& n = Make();
  n.ReportProblems();
  ASSERT_EQ(log.lines.size(), 1u);
  EXPECT_THAT(log.lines[0], ::testing::StartsWith("2 Network preferences: "));
  EXPECT_THAT(log.lines[0], ::testing::HasSubstr("TAV3\\Speed"));
  EXPECT_EQ(n.Preferences().TAVNetwork(3).Speed(), TAVNetworkPreferences().Speed());
  EXPECT_EQ(n.Preferences().TAVNetwork(3).Port(), "/dev/ttyS3");
}

// The host's side of the watch: DoUpdateNetworkPrefsFromRegistry, by name.
class Host : public CallableByName {
 public:
  explicit Host(std::function<void()> update) : m_update(std::move(update)) {}
  void CallByName(const std::string& name) override {
    if (name != "DoUpdateNetworkPrefsFromRegistry") {
      throw Error(438, "Host", "Object doesn't support this property or method");
    }
    m_update();
  }

 private:
  std::function<void()> m_update;
};

TEST_F(NetworkTest, TheWatchWritesAFirstVersionWhenThereIsNoneAndCallsTheHostOnAChange) {
  VirtualTimerService timers;
  RegistryWatcher watcher(timers, store);
  NetworkPreferences prefs = Saved();
  NetworkStartup& n = Make();
  n.AddRegistryWatch(watcher, std::make_shared<Host>([&] { n.UpdateFromRegistry(); }));
  EXPECT_TRUE(watcher.Armed());
  EXPECT_FALSE(GetStringSetting(store, "Ver", "Network", "").empty());
  EXPECT_THAT(log.lines, IsEmpty());

  prefs.TAVNetwork(2).SetPort("/dev/ttyS2");
  prefs.SaveToRegistry(store);
  NetworkPreferences::BumpVersion(store);
  timers.Advance(RegistryWatcher::kDefaultCheckInterval);
  EXPECT_THAT(log.lines, ElementsAre("1 A Network Config Registry Change was detected",
                                     "1 Network Preferences need to be updated",
                                     "1 Network Preferences update complete"));
  EXPECT_EQ(n.Preferences().TAVNetwork(2).Port(), "/dev/ttyS2");
}

TEST_F(NetworkTest, AWatchThatCannotStartIsLoggedWithItsKey) {
  VirtualTimerService timers;
  RegistryWatcher watcher(timers, store);
  // No version yet, and none can be written.
  store.FailOperation(RegistryOperation::SetValue);
  store.FailOperation(RegistryOperation::CreateKey);
  Make().AddRegistryWatch(watcher, std::make_shared<Host>([] {}));
  EXPECT_FALSE(watcher.Armed());
  EXPECT_THAT(log.lines, ElementsAre("3 Error starting the Tessavar Registry Watcher: Network)"));
}

// ---- In a show -------------------------------------------------------------

TEST(NetworksInAShow, OnlyTheFamiliesASequenceUsesAreOpened) {
  ShowRig rig;
  SequenceData dmx;
  dmx.lengthMs = 1000;
  dmx.channels.push_back({"flood", {kFamilyDMX, 1, 0, 1}, {{0, 0, kEffectSet, 50, 50, 0}}});
  rig.WriteSequence("dmx.tseq", dmx);
  SequenceData x10 = dmx;
  x10.channels[0].address = {kFamilyX10, 1, 0, 3};
  rig.WriteSequence("x10.tseq", x10);
  rig.Start();
  ShowParts parts;
  parts.main = {"dmx.tseq"};
  rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts));
  rig.Advance(5000);
  EXPECT_EQ(rig.cio->CountOf("OpenX10Network"), 0u);
  EXPECT_EQ(rig.cio->CountOf("OpenFennickNetwork"), 0u);
  EXPECT_EQ(rig.cio->CountOf("SetTAVNetworkPort"), 16u);  // once, at start

  parts.main = {"dmx.tseq", "x10.tseq"};
  rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts));
  rig.Advance(10'000);
  EXPECT_EQ(rig.cio->CountOf("OpenX10Network"), 1u);
  EXPECT_EQ(rig.cio->CountOf("OpenFennickNetwork"), 0u);
}

}  // namespace
}  // namespace tav
