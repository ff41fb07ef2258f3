// The control on virtual time: a manual clock, a deadline timer that fires
// when a test moves the clock, and a network that records every datagram.

#include "suite/channelio/ChannelIOControl.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>

#include "config/LibRegistry.h"
#include "config/MemoryRegistryStore.h"
#include "ports/testing/ManualClock.h"
#include "ports/testing/RecordingMessageLog.h"
#include "suite/channelio/ArtNetPacket.h"
#include "suite/channelio/E131Packet.h"
#include "suite/channelio/testing/ManualDeadlineTimer.h"
#include "suite/channelio/testing/RecordingDatagramNetwork.h"
#include "suite/seqlib/PlayEvent.h"
#include "support/testing/Failure.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

// How many logged lines contain `part`.
size_t Containing(const RecordingMessageLog& log, const std::string& part) {
  return static_cast<size_t>(
      std::count_if(log.lines.begin(), log.lines.end(),
                    [&](const std::string& l) { return l.find(part) != std::string::npos; }));
}

class FakeClaim : public OutputClaim {
 public:
  bool TryClaim(const std::string&, std::string& holder) override {
    holder = "showplayer, process 4242";
    claims += held ? 0 : 1;
    return !held;
  }
  void Release() override { ++releases; }
  bool held = false;
  int claims = 0;
  int releases = 0;
};

// An E1.31 data packet as the recording network saw it.
struct Seen {
  uint32_t tick;
  size_t batch;
  IPv4Endpoint destination;
  E131DataView view;
  std::vector<uint8_t> bytes;
  uint8_t Slot(int slot) const { return view.slots[slot - 1]; }
};

class Control : public ::testing::Test {
 protected:
  Control() : timer(clock), network(clock), control(Ports()) {}

  ChannelIOPorts Ports() {
    ChannelIOPorts ports;
    ports.clock = &clock;
    ports.timer = &timer;
    ports.network = &network;
    ports.log = &log;
    ports.settings = &store;
    ports.claim = &claim;
    return ports;
  }

  static NetworkPreferences Prefs(std::vector<int32_t> universes = {1, 2},
                                  DMXTransport transport = DMXTransport::kE131,
                                  const std::string& destination = "") {
    NetworkPreferences prefs;
    for (int32_t u : universes) {
      DMXUniversePrefs entry;
      entry.SetUniverse(u);
      entry.SetTransport(transport);
      entry.SetDestination(destination);
      prefs.AddDMXUniverse(entry);
    }
    prefs.SetSourceCID("11111111-2222-4333-8444-555555555555");
    return prefs;
  }

  void Start(const NetworkPreferences& prefs = Prefs()) {
    control.ApplyNetworkPreferences(prefs);
    control.SetupClient(true, "Show Player", true);
  }

  // One frame for universe `u`: every slot at `level`, due at `due`.
  void Levels(int32_t u, uint8_t level, uint32_t due) {
    std::vector<uint8_t> levels(512, level);
    control.OutputDMXLevels(u, 1, 512, levels.data(), due);
  }

  std::vector<Seen> Data() {
    std::vector<Seen> seen;
    for (auto& sent : network.SentDatagrams()) {
      Seen s{sent.tick, sent.batch, sent.destination, {}, sent.bytes};
      if (ParseE131(s.bytes.data(), s.bytes.size(), s.view) != E131Parse::kData) continue;
      seen.push_back(s);
    }
    // Views point into the copies held by each Seen.
    for (auto& s : seen) ParseE131(s.bytes.data(), s.bytes.size(), s.view);
    return seen;
  }
  std::vector<Seen> DataOf(uint16_t universe) {
    std::vector<Seen> all = Data(), of;
    for (auto& s : all)
      if (s.view.universe == universe) of.push_back(s);
    for (auto& s : of) ParseE131(s.bytes.data(), s.bytes.size(), s.view);
    return of;
  }

  ManualClock clock{DateTime::FromParts(2024, 1, 1), 1000};
  ManualDeadlineTimer timer;
  RecordingDatagramNetwork network;
  RecordingMessageLog log;
  MemoryRegistryStore store;
  FakeClaim claim;
  ChannelIOControl control;
};

TEST_F(Control, AFrameLeavesAtItsDeadlineNotWhenItWasSealed) {
  Start();
  Levels(1, 10, 1025);
  Levels(2, 20, 1025);
  control.SendAccumulated(1025);
  EXPECT_THAT(Data(), IsEmpty());
  EXPECT_EQ(timer.Deadline(), 1025u);
  timer.RunUntil(1025);
  auto data = Data();
  ASSERT_EQ(data.size(), 2u);
  EXPECT_EQ(data[0].tick, 1025u);
  EXPECT_EQ(data[0].batch, data[1].batch);  // one batch: one sendmmsg
  EXPECT_EQ(data[0].view.universe, 1);
  EXPECT_EQ(data[0].Slot(512), 10);
  EXPECT_EQ(data[1].Slot(1), 20);
  EXPECT_EQ(data[0].destination, (IPv4Endpoint{{239, 255, 0, 1}, 5568}));
  EXPECT_EQ(control.Statistics().framesLate, 0u);
}

TEST_F(Control, NothingLeavesUntilTheFrameIsSealed) {
  Start();
  Levels(1, 10, 1025);
  timer.RunUntil(1100);
  EXPECT_THAT(Data(), IsEmpty());
  control.SendAccumulated(1025);
  ASSERT_EQ(Data().size(), 1u);
  EXPECT_EQ(Data()[0].tick, 1100u);
}

TEST_F(Control, ALateFrameGoesAtOnceAndIsCounted) {
  Start();
  clock.SetTickCount(1080);
  Levels(1, 10, 1050);
  control.SendAccumulated(1050);
  ASSERT_EQ(DataOf(1).size(), 1u);
  EXPECT_EQ(DataOf(1)[0].tick, 1080u);
  EXPECT_EQ(control.Statistics().framesLate, 1u);
  EXPECT_EQ(control.Statistics().maxLatenessMs, 30u);
}

TEST_F(Control, FramesThatFellDueTogetherLeaveAtOnceInOrder) {
  Start();
  Levels(1, 10, 1025);
  control.SendAccumulated(1025);
  Levels(1, 20, 1050);
  control.SendAccumulated(1050);
  clock.SetTickCount(1060);  // the loop was busy past both deadlines
  timer.RunUntil(1060);
  auto data = DataOf(1);
  ASSERT_EQ(data.size(), 2u);
  EXPECT_EQ(data[0].Slot(1), 10);
  EXPECT_EQ(data[1].Slot(1), 20);
  EXPECT_EQ(data[1].tick, 1060u);
  EXPECT_EQ(data[1].view.sequence, data[0].view.sequence + 1);
  EXPECT_EQ(control.Statistics().frames, 2u);
  EXPECT_EQ(control.Statistics().framesLate, 2u);
}

TEST_F(Control, AWriteComingAfterALaterFrameJoinsItSoTheLaterWriteWins) {
  Start();
  Levels(1, 30, 1030);
  control.SendAccumulated(1030);
  Levels(1, 0, 1025);  // lights-off of a sequence stopped at 1025
  Levels(2, 5, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1100);
  auto data = Data();
  ASSERT_EQ(data.size(), 2u);
  EXPECT_EQ(data[0].tick, 1030u);
  EXPECT_EQ(data[0].Slot(1), 0);
  EXPECT_EQ(data[1].view.universe, 2);
}

TEST_F(Control, ReleaseSendsWhatWasSealedFirst) {
  Start();
  Levels(1, 30, 1020);
  control.SendAccumulated(1020);
  control.ReleaseClient();
  auto data = DataOf(1);
  ASSERT_EQ(data.size(), 4u);
  EXPECT_EQ(data[0].Slot(1), 30);
  EXPECT_EQ(data[0].view.options, 0);
  EXPECT_EQ(data[3].view.options, kE131OptionTerminated);
}

TEST_F(Control, UnchangedUniversesWaitForTheirKeepAlive) {
  Start();
  for (uint32_t due = 1025; due <= 4000; due += 25) {
    Levels(1, 7, due);                          // never changes
    Levels(2, static_cast<uint8_t>(due), due);  // changes every frame
    control.SendAccumulated(due);
    timer.RunUntil(due);
  }
  auto steady = DataOf(1);
  ASSERT_GE(steady.size(), 4u);
  for (size_t i = 1; i < steady.size(); ++i) {
    uint32_t gap = steady[i].tick - steady[i - 1].tick;
    EXPECT_GE(gap, UdpDMXOutput::kKeepAliveMs - UdpDMXOutput::kKeepAliveBatchMs);
    EXPECT_LE(gap, UdpDMXOutput::kKeepAliveMs);
  }
  EXPECT_EQ(DataOf(2).size(), 120u);
}

TEST_F(Control, IdleUniversesAreKeptAliveEvery800msWithNothingElseWaking) {
  Start();
  Levels(1, 7, 1025);
  Levels(2, 7, 1025);
  control.SendAccumulated(1025);
  int wakes = timer.RunUntil(1025 + 8000);
  auto data = DataOf(1);
  ASSERT_EQ(data.size(), 11u);
  for (size_t i = 1; i < data.size(); ++i) EXPECT_EQ(data[i].tick - data[i - 1].tick, 800u);
  EXPECT_EQ(wakes, 11);
  EXPECT_EQ(DataOf(2).size(), 11u);
  EXPECT_EQ(data.back().batch, DataOf(2).back().batch);  // the keep-alives travel together
}

TEST_F(Control, SequenceNumbersCountPerUniverseAndWrap) {
  Start();
  for (uint32_t k = 1; k <= 300; ++k) {
    Levels(1, static_cast<uint8_t>(k), 1000 + 25 * k);
    if (k % 2) Levels(2, static_cast<uint8_t>(k), 1000 + 25 * k);
    control.SendAccumulated(1000 + 25 * k);
    timer.RunUntil(1000 + 25 * k);
  }
  for (uint16_t u : {1, 2}) {
    auto data = DataOf(u);
    ASSERT_GE(data.size(), 150u);
    for (size_t i = 1; i < data.size(); ++i)
      ASSERT_EQ(static_cast<uint8_t>(data[i - 1].view.sequence + 1), data[i].view.sequence);
  }
}

TEST_F(Control, ReleaseEndsEveryUniverseWithThreeTerminatedPackets) {
  Start();
  Levels(1, 50, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  network.ClearSent();
  control.ReleaseClient();
  auto data = DataOf(1);
  ASSERT_EQ(data.size(), 3u);
  for (size_t i = 0; i < 3; ++i) {
    EXPECT_EQ(data[i].view.options, kE131OptionTerminated);
    EXPECT_EQ(data[i].view.sequence, i + 1);
  }
  EXPECT_THAT(DataOf(2), IsEmpty());  // never sourced, so nothing to end
  EXPECT_EQ(claim.releases, 1);
  Levels(1, 60, 1050);
  control.SendAccumulated(1050);
  timer.RunUntil(5000);
  EXPECT_EQ(Data().size(), 3u);
}

TEST_F(Control, NothingLeavesBeforeTheClientIsSetUpThenTheLevelsDo) {
  control.ApplyNetworkPreferences(Prefs());
  Levels(1, 50, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(2000);
  EXPECT_THAT(Data(), IsEmpty());
  EXPECT_EQ(control.Levels().DMXLevel(1, 1), 50);
  control.SetupClient(true, "Show Player", true);
  ASSERT_EQ(Data().size(), 1u);
  EXPECT_EQ(Data()[0].Slot(1), 50);
}

TEST_F(Control, AProgramHoldingTheOutputsMakesSetupFailWith8005) {
  claim.held = true;
  control.ApplyNetworkPreferences(Prefs());
  auto failure = testing::FailureOf([&] { control.SetupClient(true, "Show Player", true); });
  EXPECT_EQ(failure.number, 8005);
  EXPECT_EQ(failure.source, "ChannelIO.SetupClient");
  EXPECT_EQ(failure.description,
            "The lighting outputs are already open in another program (showplayer, process 4242)");
  EXPECT_FALSE(control.ClientIsSetUp());
  // Without the exclusive claim it may go ahead.
  control.SetupClient(false, "Viewer", true);
  EXPECT_TRUE(control.ClientIsSetUp());
}

TEST_F(Control, ASyncUniverseFollowsEachFramesDataButNotAKeepAlive) {
  NetworkPreferences prefs = Prefs();
  prefs.SetSyncUniverse(7000);
  Start(prefs);
  Levels(1, 5, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  auto& sent = network.SentDatagrams();
  ASSERT_EQ(sent.size(), 2u);
  EXPECT_EQ(Data()[0].view.syncAddress, 7000);
  EXPECT_EQ(sent[1].bytes.size(), kE131SyncPacketSize);
  EXPECT_EQ(sent[1].destination, (IPv4Endpoint{{239, 255, 27, 88}, 5568}));
  EXPECT_EQ(sent[1].batch, sent[0].batch);
  timer.RunUntil(1025 + 800);
  EXPECT_EQ(sent.size(), 3u);  // the keep-alive, no sync
}

TEST_F(Control, ArtNetBroadcastsOnTheInterfaceWithSequence1To255AndArtSync) {
  network.AddInterface("eth1", {{192, 168, 1, 255}, 0});
  NetworkPreferences prefs = Prefs({0, 5}, DMXTransport::kArtNet);
  prefs.DMXUniverse(0).SetInterface("eth1");
  prefs.DMXUniverse(1).SetInterface("eth1");
  prefs.DMXUniverse(1).SetDestination("10.0.0.5");
  prefs.DMXUniverse(1).SetSize(3);
  prefs.SetSyncUniverse(1);
  Start(prefs);
  for (uint32_t k = 1; k <= 256; ++k) {
    Levels(0, static_cast<uint8_t>(k), 1000 + 25 * k);
    Levels(5, static_cast<uint8_t>(k), 1000 + 25 * k);
    control.SendAccumulated(1000 + 25 * k);
    timer.RunUntil(1000 + 25 * k);
  }
  std::vector<uint8_t> sequences;
  size_t syncs = 0;
  for (auto& sent : network.SentDatagrams()) {
    ArtDmxView view;
    ArtNetParse kind = ParseArtNet(sent.bytes.data(), sent.bytes.size(), view);
    if (kind == ArtNetParse::kOther) {
      ++syncs;
      EXPECT_EQ(sent.destination, (IPv4Endpoint{{192, 168, 1, 255}, 6454}));
      continue;
    }
    ASSERT_EQ(kind, ArtNetParse::kDmx);
    if (view.portAddress == 0) {
      EXPECT_EQ(sent.destination, (IPv4Endpoint{{192, 168, 1, 255}, 6454}));
      sequences.push_back(view.sequence);
    } else {
      EXPECT_EQ(sent.destination, (IPv4Endpoint{{10, 0, 0, 5}, 6454}));
      EXPECT_EQ(view.length, 4);  // three slots, padded to even
    }
  }
  EXPECT_EQ(syncs, 256u);
  ASSERT_EQ(sequences.size(), 256u);
  EXPECT_EQ(sequences[0], 1);
  EXPECT_EQ(sequences[254], 255);
  EXPECT_EQ(sequences[255], 1);
}

TEST_F(Control, EachBadEntryIsOneLogLineAndTheOthersRun) {
  network.SetUnreachable({{10, 9, 9, 9}, 5568});
  NetworkPreferences prefs = Prefs({1, 70000, 3, 4, 5});
  prefs.DMXUniverse(2).SetInterface("eth9");
  prefs.DMXUniverse(3).SetDestination("10.9.9.9");
  prefs.DMXUniverse(4).SetDestination("no.such.host");
  Start(prefs);
  EXPECT_EQ(log.lines.size(), 4u) << ::testing::PrintToString(log.lines);
  EXPECT_EQ(Containing(log,
                       "DMX universe 70000 (E1.31, entry 2): the universe is outside "
                       "1-63999; it stays off"),
            1u);
  EXPECT_EQ(Containing(log, "The E1.31 universes on interface \"eth9\" stay off"), 1u);
  EXPECT_EQ(Containing(log,
                       "DMX universe 4 (E1.31, entry 4): 10.9.9.9:5568 cannot be "
                       "reached from the default interface (Network is unreachable)"),
            1u);
  EXPECT_EQ(Containing(log, "\"no.such.host\" cannot be found"), 1u);
  for (int32_t u : {1, 3, 4, 5}) Levels(u, 9, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  ASSERT_EQ(Data().size(), 1u);
  EXPECT_EQ(Data()[0].view.universe, 1);
}

TEST_F(Control, UnicastDestinationsTakeAnAddressAPortOrAName) {
  network.AddHost("porch.local", {{10, 0, 0, 40}, 0});
  NetworkPreferences prefs = Prefs({1, 2, 3});
  prefs.DMXUniverse(0).SetDestination("10.0.0.8");
  prefs.DMXUniverse(1).SetDestination("127.0.0.1:6000");
  prefs.DMXUniverse(2).SetDestination("porch.local");
  Start(prefs);
  for (int32_t u : {1, 2, 3}) Levels(u, 9, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  auto data = Data();
  ASSERT_EQ(data.size(), 3u);
  EXPECT_EQ(data[0].destination, (IPv4Endpoint{{10, 0, 0, 8}, 5568}));
  EXPECT_EQ(data[1].destination, (IPv4Endpoint{{127, 0, 0, 1}, 6000}));
  EXPECT_EQ(data[2].destination, (IPv4Endpoint{{10, 0, 0, 40}, 5568}));
}

TEST_F(Control, ReapplyingKeepsUnchangedUniversesRunningAndEndsRemovedOnes) {
  Start();
  for (uint32_t k = 1; k <= 3; ++k) {
    Levels(1, static_cast<uint8_t>(k), 1000 + 25 * k);
    Levels(2, static_cast<uint8_t>(k), 1000 + 25 * k);
    control.SendAccumulated(1000 + 25 * k);
    timer.RunUntil(1000 + 25 * k);
  }
  network.ClearSent();
  control.ApplyNetworkPreferences(Prefs({1}));
  auto ended = DataOf(2);
  ASSERT_EQ(ended.size(), 3u);
  EXPECT_EQ(ended[0].view.options, kE131OptionTerminated);
  EXPECT_THAT(DataOf(1), IsEmpty());
  EXPECT_EQ(network.SendersOpened(), 1u);
  Levels(1, 9, 1100);
  control.SendAccumulated(1100);
  timer.RunUntil(1100);
  ASSERT_EQ(DataOf(1).size(), 1u);
  EXPECT_EQ(DataOf(1)[0].view.sequence, 3);  // goes on from 0, 1, 2
  EXPECT_EQ(DataOf(1)[0].view.options, 0);
}

TEST_F(Control, TheSourceIdentifierIsMadeOnceAndKeptInTheSettings) {
  NetworkPreferences prefs = Prefs();
  prefs.SetSourceCID("");
  control.ApplyNetworkPreferences(prefs);
  std::string kept = GetStringSetting(store, "SourceCID", "Network", "");
  ASSERT_EQ(kept, FormatCid(control.SourceCid()));
  prefs.SetSourceCID(kept);
  control.ApplyNetworkPreferences(prefs);
  EXPECT_EQ(FormatCid(control.SourceCid()), kept);
  control.SetupClient(true, "Show Player", true);
  Levels(1, 1, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  EXPECT_EQ(FormatCid(Data()[0].view.cid), kept);

  prefs.SetSourceCID("not a uuid");
  control.ApplyNetworkPreferences(prefs);
  EXPECT_EQ(Containing(log, "\"not a uuid\" in the network preferences is not a UUID"), 1u);
  EXPECT_EQ(GetStringSetting(store, "SourceCID", "Network", ""), kept);
}

TEST_F(Control, AFadeIsRenderedAtTheRefreshRateAndThenStops) {
  Start();
  control.OutputEffect(kFamilyDMX, 1, 0, 4, "", kEffectFade, 100, 0, 100, 0, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1300);
  auto data = DataOf(1);
  std::vector<uint32_t> ticks;
  std::vector<int> levels;
  for (auto& s : data) {
    ticks.push_back(s.tick);
    levels.push_back(s.Slot(4));
  }
  EXPECT_THAT(ticks, ElementsAre(1025, 1050, 1075, 1100, 1125));
  EXPECT_THAT(levels, ElementsAre(0, 64, 128, 191, 255));
  EXPECT_EQ(timer.Deadline(), 1125u + UdpDMXOutput::kKeepAliveMs);
}

TEST_F(Control, ALevelBlockAfterAnEffectWinsTheChannel) {
  Start();
  control.OutputEffect(kFamilyDMX, 1, 0, 1, "", kEffectShimmer, 0, 0, 100, 0, 1025);
  Levels(1, 77, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1200);
  for (auto& s : DataOf(1)) EXPECT_EQ(s.Slot(1), 77);
}

TEST_F(Control, LightsOffSendsZerosAndKeepsTheLevels) {
  Start();
  Levels(1, 200, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  control.SetLightsActive(false);
  ASSERT_EQ(DataOf(1).size(), 2u);
  EXPECT_EQ(DataOf(1)[1].Slot(1), 0);
  EXPECT_EQ(control.Levels().DMXLevel(1, 1), 200);
  control.SetLightsActive(true);
  ASSERT_EQ(DataOf(1).size(), 3u);
  EXPECT_EQ(DataOf(1)[2].Slot(1), 200);
}

TEST_F(Control, AMappedTAVNetworkWritesItsUnitsIntoTheUniverse) {
  NetworkPreferences prefs = Prefs({3});
  prefs.TAVNetwork(0).SetDMXUniverse(3);
  prefs.TAVNetwork(0).SetDMXStartSlot(10);
  prefs.TAVNetwork(0).SetCircuitsPerUnit(8);
  Start(prefs);
  std::vector<uint8_t> circuits = {1, 2, 3, 4, 5, 6, 7, 8, 9};
  control.OutputTAVLevels(1, 2, 1, 9, circuits.data(), 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  auto data = DataOf(3);
  ASSERT_EQ(data.size(), 1u);
  EXPECT_EQ(data[0].Slot(17), 0);
  EXPECT_EQ(data[0].Slot(18), 1);
  EXPECT_EQ(data[0].Slot(25), 8);
  EXPECT_EQ(data[0].Slot(26), 0);  // circuit 9 is beyond the unit's 8
  EXPECT_EQ(control.Levels().TAVLevel(1, 2, 9), 9);
}

TEST_F(Control, KeepAliveSendsWhatFellDueWhileTheLoopWasBusy) {
  Start();
  Levels(1, 5, 1025);
  control.SendAccumulated(1025);
  clock.SetTickCount(1040);  // a long load holds the loop
  control.KeepAlive();
  ASSERT_EQ(Data().size(), 1u);
  EXPECT_EQ(Data()[0].tick, 1040u);
}

TEST_F(Control, AFullSocketBufferDropsCountsAndLogsOnce) {
  Start();
  network.SetBufferFull(true);
  for (uint32_t k = 1; k <= 4; ++k) {
    Levels(1, static_cast<uint8_t>(k), 1000 + 25 * k);
    control.SendAccumulated(1000 + 25 * k);
    timer.RunUntil(1000 + 25 * k);
  }
  EXPECT_EQ(control.Statistics().packetsDropped, 4u);
  EXPECT_EQ(Containing(log, "packets dropped (Resource temporarily unavailable)"), 1u);
  network.SetBufferFull(false);
  Levels(1, 9, 1200);
  control.SendAccumulated(1200);
  timer.RunUntil(1200);
  EXPECT_EQ(control.Statistics().packetsSent, 1u);
}

TEST_F(Control, ADueTickFarAheadIsTakenAsNow) {
  Start();
  Levels(1, 5, 1000 + 3600000);
  control.SendAccumulated(0);
  EXPECT_EQ(Data().size(), 1u);
}

class Inputs : public Control {
 protected:
  void SetUp() override {
    NetworkPreferences prefs = Prefs();
    prefs.Listener().SetEnabled(true);
    prefs.Listener().SetUniverse(9);
    prefs.Listener().SetNetwork(2);
    prefs.Listener().SetUnit(4);
    Start(prefs);
    control.SetOnInput([this](const ChannelInputEvent& e) {
      events.push_back(std::to_string(e.network) + "/" + std::to_string(e.unitId) + "/" +
                       std::to_string(e.inputNumber) + " " + e.name);
    });
  }
  void Slots(std::vector<uint8_t> slots) {
    E131DataFields f;
    f.cid = {7, 7, 7, 7, 7, 7, 7, 7, 7, 7, 7, 7, 7, 7, 7, 7};
    f.universe = 9;
    f.sequence = m_sequence++;
    std::vector<uint8_t> bytes(E131DataPacketSize(slots.size()));
    EncodeE131Data(f, slots.data(), slots.size(), bytes.data());
    network.Deliver(5568, bytes);
  }
  std::vector<std::string> events;
  uint8_t m_sequence = 0;
};

TEST_F(Inputs, TheListenerJoinsItsUniversesGroup) {
  auto receivers = network.Receivers();
  ASSERT_EQ(receivers.size(), 1u);
  EXPECT_EQ(receivers[0].port, 5568);
  EXPECT_EQ(receivers[0].group, (IPv4Endpoint{{239, 255, 0, 9}, 5568}));
}

TEST_F(Inputs, ARegisteredSlotFiresItsEventWithItsName) {
  control.RegisterInput(2, 4, 3, "Button");
  Slots({0, 0, 0});
  Slots({0, 255, 255});
  EXPECT_THAT(events, ElementsAre("2/4/3 Button"));  // slot 2 is not registered
  control.ClearInputs();
  Slots({0, 0, 0});
  Slots({0, 0, 255});
  EXPECT_EQ(events.size(), 1u);
  EXPECT_EQ(control.Statistics().listener.accepted, 4u);
}

TEST_F(Inputs, AHandlerMayReleaseTheControlInTheMiddleOfABatch) {
  control.RegisterInput(2, 4, 1, "A");
  control.RegisterInput(2, 4, 2, "B");
  control.SetOnInput([this](const ChannelInputEvent& e) {
    events.push_back(e.name);
    control.ReleaseClient();
  });
  Slots({0, 0});
  Slots({255, 255});
  EXPECT_THAT(events, ElementsAre("A", "B"));
  EXPECT_THAT(network.Receivers(), IsEmpty());
}

TEST_F(Inputs, InjectedInputsFireOnlyWhenRegistered) {
  control.RegisterInput(1, 1, 1, "Door");
  EXPECT_TRUE(control.InjectInput(1, 1, 1));
  EXPECT_FALSE(control.InjectInput(1, 1, 2));
  EXPECT_THAT(events, ElementsAre("1/1/1 Door"));
}

TEST_F(Control, AListenerThatCannotOpenIsOneLogLine) {
  network.FailReceiverOpen(true);
  NetworkPreferences prefs = Prefs();
  prefs.Listener().SetEnabled(true);
  Start(prefs);
  EXPECT_EQ(Containing(log,
                       "The DMX listener (E1.31 universe 1) cannot listen: Address "
                       "already in use; inputs from it stay off"),
            1u);
  EXPECT_FALSE(control.ListenerIsOpen());
}

TEST_F(Control, SerialNetworksWithoutATransmitterKeepTheirLevels) {
  Start();
  control.SetTAVNetworkPort(0, "/dev/ttyUSB0");
  control.OpenFennickNetwork("/dev/ttyUSB1");
  EXPECT_EQ(Containing(log, "TAV network 1 on /dev/ttyUSB0: no serial transmitter"), 1u);
  EXPECT_EQ(Containing(log, "Fennick network on /dev/ttyUSB1: no serial transmitter"), 1u);
  control.OutputEffect(kFamilyFennick, 1, 0, 3, "", kEffectSet, 0, 100, 100, 0, 1025);
  control.SendAccumulated(1025);
  timer.RunUntil(1025);
  EXPECT_EQ(control.Levels().FennickLevel(1, 3), 255);
}

}  // namespace
}  // namespace tav

namespace tav {
namespace {

// A serial transmitter that records the frames it is handed.
class FakeSerialOutput : public NetworkOutput {
 public:
  FakeSerialOutput(std::string name, std::vector<std::string>& journal)
      : m_name(std::move(name)), m_journal(journal) {
    m_journal.push_back("open " + m_name);
  }
  std::string Name() const override { return m_name; }
  void Send(const OutputFrame& frame) override {
    if (frame.newFrame) m_journal.push_back(m_name + " frame at " + std::to_string(frame.now));
  }
  std::optional<uint32_t> NextRefresh() const override { return std::nullopt; }
  void Close() override { m_journal.push_back("close " + m_name); }
  OutputCounters Counters() const override { return {}; }

 private:
  std::string m_name;
  std::vector<std::string>& m_journal;
};

class FakeSerialFactory : public SerialOutputFactory {
 public:
  std::unique_ptr<NetworkOutput> OpenTAVNetwork(int32_t network, const TAVNetworkPreferences& p,
                                                LevelBuffers&) override {
    if (p.Port() == "/dev/busy")
      throw Error(kErrorPortAlreadyOpen, "Serial.Open", "the port is already open");
    return std::make_unique<FakeSerialOutput>(
        "TAV " + std::to_string(network) + " at " + std::to_string(p.Speed()), journal);
  }
  std::unique_ptr<NetworkOutput> OpenX10(const std::string& port, const NetworkPreferences&,
                                         LevelBuffers&) override {
    return std::make_unique<FakeSerialOutput>("X10 " + port, journal);
  }
  std::unique_ptr<NetworkOutput> OpenFennick(const std::string& port, const FennickPreferences&,
                                             LevelBuffers&) override {
    return std::make_unique<FakeSerialOutput>("Fennick " + port, journal);
  }
  std::unique_ptr<NetworkOutput> OpenDMXWidget(const DMXUniversePrefs& p, LevelBuffers&) override {
    return std::make_unique<FakeSerialOutput>("widget " + p.Port(), journal);
  }
  std::vector<std::string> journal;
};

class Serial : public Control {
 protected:
  Serial() {
    ChannelIOPorts ports = Ports();
    ports.serial = &factory;
    serial = std::make_unique<ChannelIOControl>(ports);
  }
  FakeSerialFactory factory;
  std::unique_ptr<ChannelIOControl> serial;
};

TEST_F(Serial, SerialNetworksAreOutputsOfTheSameFrames) {
  NetworkPreferences prefs = Prefs({});
  DMXUniversePrefs widget;
  widget.SetUniverse(4);
  widget.SetTransport(DMXTransport::kUSBPro);
  widget.SetPort("/dev/ttyUSB3");
  prefs.AddDMXUniverse(widget);
  serial->ApplyNetworkPreferences(prefs);
  serial->SetTAVNetworkSpeed(0, 19200);
  serial->SetTAVNetworkPort(0, "/dev/ttyS0");
  serial->OpenX10Network("/dev/ttyS1");
  serial->SetupClient(true, "Show Player", true);
  serial->OutputEffect(kFamilyX10, 1, 0, 1, "", kEffectSet, 0, 100, 100, 0, 1025);
  serial->SendAccumulated(1025);
  timer.RunUntil(1025);
  EXPECT_THAT(factory.journal,
              ElementsAre("open widget /dev/ttyUSB3", "open TAV 1 at 19200", "open X10 /dev/ttyS1",
                          "widget /dev/ttyUSB3 frame at 1025", "TAV 1 at 19200 frame at 1025",
                          "X10 /dev/ttyS1 frame at 1025"));
  factory.journal.clear();
  serial->ApplyNetworkPreferences(prefs);  // nothing changed: nothing reopens
  EXPECT_THAT(factory.journal, IsEmpty());
  serial->ReleaseClient();
  EXPECT_THAT(factory.journal, ElementsAre("close TAV 1 at 19200", "close widget /dev/ttyUSB3",
                                           "close X10 /dev/ttyS1"));
}

TEST_F(Serial, APortHeldElsewhereFailsWith8005) {
  auto failure = testing::FailureOf([&] { serial->SetTAVNetworkPort(2, "/dev/busy"); });
  EXPECT_EQ(failure.number, kErrorPortAlreadyOpen);
  EXPECT_EQ(serial->OutputCount(), 0u);
}

}  // namespace
}  // namespace tav
