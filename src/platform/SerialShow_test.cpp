// A sequence from examples/ played through the real hardware-I/O control into
// every serial network family at once, each on a pseudo-terminal with a
// byte-exact device model behind it: a TAV network of four units, a Fennick
// chain of two boards (unplugged and replugged while the show plays), an X10
// interface and a DMX USB Pro widget. The test checks what each device
// received, and when.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>

#include "platform/AsioTimerService.h"
#include "platform/LocalFileSystem.h"
#include "platform/PosixSerialPort.h"
#include "platform/SystemClock.h"
#include "platform/TimerfdDeadlineTimer.h"
#include "platform/testing/PtyDevice.h"
#include "ports/testing/RecordingMessageLog.h"
#include "suite/channelio/ChannelIOControl.h"
#include "suite/channelio/serial/SerialOutputs.h"
#include "suite/channelio/serial/testing/Cm11aModel.h"
#include "suite/channelio/serial/testing/DimmerBoardModel.h"
#include "suite/channelio/serial/testing/UsbProModel.h"
#include "suite/channelio/testing/RecordingDatagramNetwork.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/PlayEvent.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

using ::testing::Contains;
using ::testing::HasSubstr;
using Steady = std::chrono::steady_clock;

// One level a device received, and when (seconds after the show started).
struct Seen {
  double at;
  uint8_t level;
};

// Levels seen in [from, to).
std::vector<uint8_t> Between(const std::vector<Seen>& seen, double from, double to) {
  std::vector<uint8_t> levels;
  for (const Seen& s : seen) {
    if (s.at >= from && s.at < to) levels.push_back(s.level);
  }
  return levels;
}

class SerialShowTest : public ::testing::Test {
 protected:
  SerialShowTest() {
    ports.clock = clock.get();
    ports.timer = &frameTimer;
    ports.network = &network;
    ports.log = &log;
    ports.serial = &serial;
    control = std::make_unique<ChannelIOControl>(ports);
  }

  double Now() const { return std::chrono::duration<double>(Steady::now() - started).count(); }

  void Dispatch(const PlayEvent& e) {
    if (e.playEventType == kPlayEventEffect) {
      control->OutputEffect(e.devType, e.lNetwork, e.byteUnit, e.lCircuit, e.szChannelName,
                            e.effectType, e.lDuration, e.lStartIntensity, e.lEndIntensity,
                            e.lPriority, e.dueTick);
    } else if (e.devType == kFamilyDMX) {
      control->OutputDMXLevels(e.lNetwork, e.nIntensityBlobStartAddress, e.nIntensityBlobCount,
                               e.byteIntensityBlob.data(), e.dueTick);
    } else if (e.devType == kFamilyTAV) {
      control->OutputTAVLevels(e.lNetwork, e.byteUnit, e.nIntensityBlobStartAddress,
                               e.nIntensityBlobCount, e.byteIntensityBlob.data(), e.dueTick);
    }
  }

  TempFolder folder{"tav-serial-show"};
  EventLoop loop;
  std::shared_ptr<SystemClock> clock = std::make_shared<SystemClock>();
  AsioTimerService timers{loop};
  RecordingMessageLog log;
  PosixSerialPorts serialPorts{loop};
  TimerfdDeadlineTimer frameTimer{loop};
  RecordingDatagramNetwork network{*clock};
  std::unique_ptr<ChannelIOControl> control;
  SerialOutputs serial{{&serialPorts, &timers, clock.get(), &log},
                       [this](int32_t n, int32_t u, int32_t i) { control->InjectInput(n, u, i); }};
  ChannelIOPorts ports;
  Steady::time_point started = Steady::now();
};

TEST_F(SerialShowTest, FrontYardPlaysOnEverySerialNetwork) {
  PtyDevice tavDevice(loop, folder / "tav1");
  PtyDevice fennickDevice(loop, folder / "fennick");
  PtyDevice x10Device(loop, folder / "cm11a");
  PtyDevice proDevice(loop, folder / "usbpro");

  // The devices, and what they saw of the channels the sequence drives.
  DimmerChainModel tavUnits(4, 8);
  std::vector<Seen> roofLine;                   // TAV 1, unit 2, circuit 5
  std::vector<std::vector<uint8_t>> unitThree;  // TAV 1, unit 3, circuits 1-4
  tavUnits.Board(1).SetOnFrame([&](const auto& c) { roofLine.push_back({Now(), c[4]}); });
  tavUnits.Board(2).SetOnFrame([&](const auto& c) {
    if (c[0] || c[1] || c[2] || c[3]) unitThree.emplace_back(c.begin(), c.begin() + 4);
  });
  tavDevice.SetOnBytes([&](std::span<const uint8_t> b) { tavUnits.Feed(b); });

  auto fennickChain = std::make_unique<DimmerChainModel>(2, 8);
  std::vector<Seen> arch;  // Fennick 1, channel 12: board 2, channel 4
  auto watchArch = [&] {
    fennickChain->Board(1).SetOnFrame([&](const auto& c) { arch.push_back({Now(), c[3]}); });
  };
  watchArch();
  fennickDevice.SetOnBytes([&](std::span<const uint8_t> b) { fennickChain->Feed(b); });

  Cm11aModel interface({}, Cm11aModelTiming{60.0, true});
  auto nowMs = [&] { return static_cast<uint64_t>(clock->TickCount()); };
  x10Device.SetOnBytes([&](std::span<const uint8_t> b) { interface.FromHost(b, nowMs()); });
  interface.toHost = [&](const std::vector<uint8_t>& b) { x10Device.Write(b); };
  std::vector<std::pair<double, std::string>> x10Sent;

  UsbProModel widget;
  size_t widgetFramesSeen = 0;
  std::vector<Seen> flood;  // DMX 1, slot 40
  proDevice.SetOnBytes([&](std::span<const uint8_t> b) {
    widget.Feed(b);
    for (; widgetFramesSeen < widget.Frames().size(); ++widgetFramesSeen)
      flood.push_back({Now(), widget.Frames()[widgetFramesSeen][39]});
  });

  // The preferences, as showctl network would set them.
  NetworkPreferences prefs;
  TAVNetworkPreferences& tav = prefs.TAVNetwork(0);
  tav.SetPort(tavDevice.Path());
  tav.SetSpeed(115200);
  tav.SetUnitCount(4);
  tav.SetCircuitsPerUnit(8);
  tav.SetEnhanced(true);
  prefs.SetFennickPort(fennickDevice.Path());
  prefs.Fennick().SetBoards(2);
  prefs.Fennick().SetChannelsPerBoard(8);
  prefs.SetX10Port(x10Device.Path());
  prefs.SetX10HouseCodes("A");
  DMXUniversePrefs universe;
  universe.SetUniverse(1);
  universe.SetTransport(DMXTransport::kUSBPro);
  universe.SetPort(proDevice.Path());
  prefs.AddDMXUniverse(universe);

  // What the show engine does: the preferences, the client, the TAV
  // network's four settings, and X10 and Fennick because the sequence uses
  // them.
  control->ApplyNetworkPreferences(prefs);
  control->SetupClient(false, "serial show test", true);
  control->SetTAVNetworkSpeed(0, tav.Speed());
  control->SetTAVNetworkOldMCP(0, tav.OldMCP());
  control->SetTAVNetworkEnhanced(0, tav.Enhanced());
  control->SetTAVNetworkPort(0, tav.Port());
  control->OpenX10Network(prefs.X10Port());
  control->OpenFennickNetwork(prefs.FennickPort());
  std::vector<ChannelInputEvent> inputs;
  control->RegisterInput(kX10InputNetwork, 1, 1, "Porch button");
  control->SetOnInput([&](const ChannelInputEvent& e) { inputs.push_back(e); });

  const std::string examples = std::string(TAV_SOURCE_DIR) + "/examples/sequences/";
  auto fs = LocalFileSystem();
  auto resolver = std::make_shared<PathResolver>(fs, [examples](int32_t) { return examples; });
  FileSequenceLibrary library(clock, fs, resolver);
  auto sequence = library.CreateSequence();
  sequence->LoadFile(examples + "front-yard.tseq");
  ASSERT_TRUE(sequence->UsesTAV() && sequence->UsesX10() && sequence->UsesFennick());
  sequence->SetLightsOffAtEnd(true);
  sequence->SetLookaheadMs(20);
  sequence->InitializeForPlay(false);
  sequence->StartPlay();
  started = Steady::now();

  bool unplugged = false, replugged = false, heard = false;
  for (;;) {
    PlayEvent event;
    std::optional<uint32_t> last;
    while (sequence->GetEvent(event)) {
      Dispatch(event);
      last = event.dueTick;
    }
    if (last) control->SendAccumulated(*last);
    if (!sequence->MillisecondsUntilDue()) break;
    loop.RunFor(std::chrono::milliseconds(5));
    interface.Advance(nowMs());
    while (x10Sent.size() < interface.Transmissions().size())
      x10Sent.emplace_back(Now(), interface.Transmissions()[x10Sent.size()].Text());
    // A USB adapter pulled mid-twinkle and put back a second later.
    if (!unplugged && Now() > 2.0) {
      fennickDevice.Unplug();
      unplugged = true;
    }
    if (!replugged && Now() > 3.0) {
      fennickChain = std::make_unique<DimmerChainModel>(2, 8);
      watchArch();
      fennickDevice.Replug();
      replugged = true;
    }
    // Someone presses an X10 remote's A1 On.
    if (!heard && Now() > 6.0) {
      interface.Hear({0x02, 0x66, 0x62}, nowMs());
      heard = true;
    }
  }
  const auto end = Steady::now() + std::chrono::milliseconds(1500);
  while (Steady::now() < end) {
    loop.RunFor(std::chrono::milliseconds(5));
    interface.Advance(nowMs());
  }
  control->ReleaseClient();

  // TAV: the roof line is full, fades to 20 %, and ends dark.
  auto roof = Between(roofLine, 0.3, 1.9);
  ASSERT_FALSE(roof.empty());
  EXPECT_THAT(roof, ::testing::Each(255));
  auto faded = Between(roofLine, 3.7, 5.9);
  ASSERT_FALSE(faded.empty());
  EXPECT_THAT(faded, ::testing::Each(51));
  auto fading = Between(roofLine, 2.0, 3.6);
  EXPECT_TRUE(std::is_sorted(fading.rbegin(), fading.rend())) << "the fade went up";
  EXPECT_EQ(roofLine.back().level, 0);
  // Unit 3's chase (frames of levels): each circuit in turn.
  std::vector<std::vector<uint8_t>> chase;
  for (const auto& c : unitThree) {
    if (chase.empty() || chase.back() != c) chase.push_back(c);
  }
  EXPECT_EQ(chase, (std::vector<std::vector<uint8_t>>{
                       {255, 0, 0, 0}, {0, 255, 0, 0}, {0, 0, 255, 0}, {0, 0, 0, 255}}));
  EXPECT_EQ(tavUnits.Errors(), 0u);

  // Fennick: dark before the twinkle, twinkling inside its range, back after
  // the replug, dark at the end; one log line each way.
  EXPECT_THAT(Between(arch, 0.0, 0.9), ::testing::Each(0));
  auto twinkle = Between(arch, 1.2, 1.9);
  ASSERT_FALSE(twinkle.empty());
  EXPECT_THAT(twinkle, ::testing::Each(::testing::AllOf(::testing::Ge(25), ::testing::Le(255))));
  EXPECT_FALSE(Between(arch, 3.0, 4.9).empty()) << "nothing after the replug";
  EXPECT_EQ(arch.back().level, 0);
  EXPECT_EQ(fennickChain->Errors(), 0u);
  EXPECT_THAT(log.lines,
              Contains(HasSubstr("Fennick network: lost " + fennickDevice.Path())).Times(1));
  EXPECT_THAT(log.lines,
              Contains("1 Fennick network: " + fennickDevice.Path() + " is back").Times(1));

  // X10: the porch lamp goes on at half a second and off at 10.5 s.
  std::vector<std::string> texts;
  for (const auto& [at, text] : x10Sent) texts.push_back(text);
  EXPECT_THAT(texts, ::testing::ElementsAre("A3", "A f2", "A3", "A f3"));
  ASSERT_EQ(x10Sent.size(), 4u);
  EXPECT_NEAR(x10Sent[1].first, 0.5, 0.3);
  EXPECT_NEAR(x10Sent[3].first, 10.5, 0.3);
  EXPECT_EQ(interface.Lamp('A', 3), 0);
  EXPECT_EQ(interface.ProtocolErrors(), 0);
  // ... and the remote's press reached the registered trigger.
  ASSERT_EQ(inputs.size(), 1u);
  EXPECT_EQ(inputs[0].name, "Porch button");

  // USB Pro: the flood fades up over 3 s, holds at 75 %, fades out.
  EXPECT_EQ(widget.Errors(), 0u);
  auto rising = Between(flood, 0.0, 3.0);
  EXPECT_TRUE(std::is_sorted(rising.begin(), rising.end()));
  EXPECT_THAT(Between(flood, 3.3, 8.8), ::testing::Each(191));
  auto falling = Between(flood, 9.0, 13.0);
  EXPECT_TRUE(std::is_sorted(falling.rbegin(), falling.rend()));
  EXPECT_EQ(flood.back().level, 0);
}

}  // namespace
}  // namespace tav
