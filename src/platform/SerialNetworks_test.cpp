// The serial transmitters end to end: the real serial-port adapter on
// pseudo-terminals, with byte-exact device models on the other side, playing
// frames of the repository's FSEQ test files.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>

#include "platform/AsioTimerService.h"
#include "platform/LocalFileSystem.h"
#include "platform/PosixSerialPort.h"
#include "platform/SystemClock.h"
#include "platform/testing/PtyDevice.h"
#include "ports/testing/RecordingMessageLog.h"
#include "suite/channelio/serial/DimmerTransmitter.h"
#include "suite/channelio/serial/UsbDmxTransmitter.h"
#include "suite/channelio/serial/X10Transmitter.h"
#include "suite/channelio/serial/testing/Cm11aModel.h"
#include "suite/channelio/serial/testing/DimmerBoardModel.h"
#include "suite/channelio/serial/testing/UsbProModel.h"
#include "suite/seqlib/FseqFile.h"
#include "support/testing/TempFolder.h"
#include "support/testing/TestData.h"

namespace tav {
namespace {

using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::SizeIs;
using Ms = std::chrono::milliseconds;

class SerialNetworksTest : public ::testing::Test {
 protected:
  template <typename Predicate>
  bool RunUntil(Predicate done, int ms = 5000) {
    auto until = std::chrono::steady_clock::now() + Ms(ms);
    while (!done()) {
      if (std::chrono::steady_clock::now() > until) return false;
      loop.RunFor(Ms(1));
    }
    return true;
  }
  void RunFor(int ms) {
    auto until = std::chrono::steady_clock::now() + Ms(ms);
    while (std::chrono::steady_clock::now() < until) loop.RunFor(Ms(1));
  }

  static FseqFile OpenFseq(const std::string& name) {
    return FseqFile(LocalFileSystem()->OpenForRead(testing::TestDataFile("fseq/" + name)));
  }

  // Which frame of the file `received` is, looking from frame `from` on;
  // -1 when none matches.
  static int FindFrame(FseqFile& file, const std::vector<uint8_t>& received, size_t offset,
                       int from, uint8_t (*transform)(uint8_t) = nullptr) {
    for (int n = std::max(from, 0); n < static_cast<int>(file.FrameCount()); ++n) {
      const uint8_t* frame = file.Frame(static_cast<uint32_t>(n));
      bool same = true;
      for (size_t i = 0; i < received.size() && same; ++i) {
        uint8_t expected = frame[offset + i];
        same = received[i] == (transform ? transform(expected) : expected);
      }
      if (same) return n;
    }
    return -1;
  }

  TempFolder folder{"tav-serial-networks"};
  EventLoop loop;
  AsioTimerService timers{loop};
  SystemClock clock;
  RecordingMessageLog log;
  PosixSerialPorts ports{loop};
};

struct ChainCase {
  const char* name;
  DimmerAddressing addressing;
  DimmerSpecialValues specials;
};

class FennickChainTest : public SerialNetworksTest,
                         public ::testing::WithParamInterface<ChainCase> {};

// A chain of three 200-channel boards plays the 600 channels of an FSEQ
// file: every frame a board completes holds that board's share of one frame
// of the file, frames come in order, and the last frame arrives whole.
TEST_P(FennickChainTest, ThreeBoardsReceiveEveryFrameOfAnFseqFile) {
  FseqFile file = OpenFseq("v2_zlib.fseq");  // 600 channels, 150 frames
  PtyDevice device(loop, folder / "ttyUSB0");
  DimmerChainModel chain(3, 200);
  std::vector<std::vector<std::vector<uint8_t>>> frames(3);
  for (size_t b = 0; b < 3; ++b)
    chain.Board(b).SetOnFrame(
        [&frames, b](const auto& channels) { frames[b].push_back(channels); });
  device.SetOnBytes([&](std::span<const uint8_t> bytes) { chain.Feed(bytes); });

  DimmerNetworkSettings settings;
  settings.name = "Fennick network";
  settings.serial = {device.Path(), 460800, 1};  // a 608-byte frame takes 13.2 ms
  settings.layout.boards = 3;
  settings.layout.channelsPerBoard = 200;
  settings.layout.addressing = GetParam().addressing;
  settings.layout.specials = GetParam().specials;
  DimmerTransmitter fennick(settings, ports.Open(settings.serial), timers, clock, log);

  for (uint32_t n = 0; n < file.FrameCount(); ++n) {
    fennick.SendLevels(std::span<const uint8_t>(file.Frame(n), 600));
    RunFor(15);
  }
  auto transform = GetParam().specials == DimmerSpecialValues::kClamp ? &DimmerClamp : nullptr;
  ASSERT_TRUE(RunUntil([&] {
    return !frames[2].empty() && FindFrame(file, frames[2].back(), 400, 0, transform) == 149;
  }));
  EXPECT_EQ(chain.Errors(), 0u);
  EXPECT_TRUE(chain.LeftOver().empty());
  for (size_t b = 0; b < 3; ++b) {
    SCOPED_TRACE(b);
    int last = -1;
    for (const auto& received : frames[b]) {
      int n = FindFrame(file, received, 200 * b, last, transform);
      ASSERT_GE(n, last) << "a frame that is none of the file's, or out of order";
      last = n;
    }
    // Paced at 13.2 ms against 15 ms of new frames: few overtaken.
    EXPECT_GE(frames[b].size(), 120u);
  }
  EXPECT_THAT(log.lines, SizeIs(0));
}

INSTANTIATE_TEST_SUITE_P(
    Layouts, FennickChainTest,
    ::testing::Values(ChainCase{"OneHeaderEscaped", DimmerAddressing::kOneHeader,
                                DimmerSpecialValues::kEscape},
                      ChainCase{"HeaderPerBoardClamped", DimmerAddressing::kHeaderPerBoard,
                                DimmerSpecialValues::kClamp}),
    [](const auto& info) { return std::string(info.param.name); });

TEST_F(SerialNetworksTest, UnplugAndReplugWhileFramesPlayLogOneLineEachWay) {
  FseqFile file = OpenFseq("v2_zlib.fseq");
  PtyDevice device(loop, folder / "ttyUSB0");
  DimmerChainModel chain(3, 200);
  device.SetOnBytes([&](std::span<const uint8_t> bytes) { chain.Feed(bytes); });
  DimmerNetworkSettings settings;
  settings.name = "Fennick network";
  settings.serial = {device.Path(), 460800, 1};
  settings.layout.boards = 3;
  settings.layout.channelsPerBoard = 200;
  DimmerTransmitter fennick(settings, ports.Open(settings.serial), timers, clock, log);

  for (uint32_t n = 0; n < file.FrameCount(); ++n) {
    if (n == 40) device.Unplug();
    if (n == 80) {
      device.Replug();
      chain = DimmerChainModel(3, 200);  // a fresh board (the new pty)
    }
    fennick.SendLevels(std::span<const uint8_t>(file.Frame(n), 600));
    RunFor(15);
  }
  ASSERT_TRUE(RunUntil([&] {
    return chain.Board(2).FramesTaken() > 0 &&
           FindFrame(file, chain.Board(2).Channels(), 400, 0) == 149;
  }));
  EXPECT_EQ(chain.Errors(), 0u);
  EXPECT_EQ(chain.AllChannels(), std::vector<uint8_t>(file.Frame(149), file.Frame(149) + 600));
  EXPECT_THAT(log.lines, Contains(HasSubstr("Fennick network: lost " + device.Path())).Times(1));
  EXPECT_THAT(log.lines, Contains("1 Fennick network: " + device.Path() + " is back").Times(1));
  EXPECT_THAT(log.lines, SizeIs(2));
}

TEST_F(SerialNetworksTest, UsbProWidgetReceivesEveryFrameOfAnFseqUniverse) {
  FseqFile file = OpenFseq("v1_basic.fseq");  // 512 channels, 100 frames
  PtyDevice device(loop, folder / "ttyUSB1");
  UsbProModel widget;
  device.SetOnBytes([&](std::span<const uint8_t> bytes) { widget.Feed(bytes); });
  UsbDmxSettings settings{"DMX universe 1", device.Path(), UsbDmxWidget::kPro, 512};
  UsbDmxTransmitter pro(settings, ports.Open(UsbDmxTransmitter::PortSettings(settings)), timers,
                        clock, log);
  for (uint32_t n = 0; n < file.FrameCount(); ++n) {
    pro.SendLevels(std::span<const uint8_t>(file.Frame(n), 512));
    RunFor(5);
  }
  ASSERT_TRUE(RunUntil([&] {
    return !widget.Frames().empty() && FindFrame(file, widget.Frames().back(), 0, 0) == 99;
  }));
  EXPECT_EQ(widget.Errors(), 0u);
  int last = -1;
  for (const auto& frame : widget.Frames()) {
    ASSERT_EQ(frame.size(), 512u);
    int n = FindFrame(file, frame, 0, last);
    ASSERT_GE(n, last);
    last = n;
  }
  EXPECT_GE(widget.Frames().size(), 95u);
}

TEST_F(SerialNetworksTest, OpenDMXDongleGetsWholeFramesAgainAndAgain) {
  PtyDevice device(loop, folder / "ttyUSB2");
  OpenDMXModel dongle;
  device.SetOnBytes([&](std::span<const uint8_t> bytes) { dongle.Feed(bytes); });
  UsbDmxSettings settings{"DMX universe 2", device.Path(), UsbDmxWidget::kOpenDMX, 512};
  UsbDmxTransmitter open(settings, ports.Open(UsbDmxTransmitter::PortSettings(settings)), timers,
                         clock, log);
  std::vector<uint8_t> slots(512);
  for (size_t i = 0; i < slots.size(); ++i) slots[i] = static_cast<uint8_t>(255 - i);
  open.SendLevels(slots);
  RunFor(500);
  // About 40 a second, none of them changed.
  EXPECT_GE(dongle.Frames().size(), 15u);
  EXPECT_EQ(dongle.Errors(), 0u);
  for (const auto& frame : dongle.Frames()) EXPECT_EQ(frame, slots);
}

// The X10 interface model answers at once (no power-line delay) so the test
// runs quickly, but is awkward: wrong checksums, polls and a clock request
// at bad moments.
class X10NetworkTest : public SerialNetworksTest {
 protected:
  void Start(Cm11aModelScript script) {
    device = std::make_unique<PtyDevice>(loop, folder / "ttyS0");
    model = std::make_unique<Cm11aModel>(std::move(script), Cm11aModelTiming{60.0, true});
    device->SetOnBytes([this](std::span<const uint8_t> bytes) { model->FromHost(bytes, NowMs()); });
    model->toHost = [this](const std::vector<uint8_t>& bytes) { device->Write(bytes); };
    X10NetworkSettings settings;
    settings.path = device->Path();
    x10 = std::make_unique<X10Transmitter>(
        settings, ports.Open(X10Transmitter::PortSettings(settings)), timers, clock, log);
    x10->SetOnReceived([this](const X10Received& r) { received.push_back(r); });
  }
  uint64_t NowMs() const { return clock.TickCount(); }
  template <typename Predicate>
  bool RunModelUntil(Predicate done, int ms = 5000) {
    return RunUntil(
        [&] {
          model->Advance(NowMs());
          return done();
        },
        ms);
  }

  std::unique_ptr<PtyDevice> device;
  std::unique_ptr<Cm11aModel> model;
  std::unique_ptr<X10Transmitter> x10;
  std::vector<X10Received> received;
};

TEST_F(X10NetworkTest, LampsFollowTheLevelsWhateverTheInterfaceDoes) {
  Cm11aModelScript script;
  script.wrongChecksumAt = {2, 9};
  script.pollInsteadOfChecksumAt = {4};
  script.clockRequestInsteadOfReadyAt = {6};
  script.pollInsteadOfReadyAt = {11};
  Start(script);
  std::vector<uint8_t> levels(256, 0);
  levels[0] = 255;      // A1 full
  levels[1] = 128;      // A2 half
  levels[16 + 2] = 64;  // B3 a quarter
  x10->SetLevels(levels);
  RunFor(20);
  levels[0] = 0;  // A1 off again: a flash, kept
  x10->SetLevels(levels);
  ASSERT_TRUE(RunModelUntil([&] { return x10->QueueDepth() == 0 && model->Idle(); }));
  EXPECT_EQ(model->Lamp('A', 1), 0);
  EXPECT_EQ(model->Lamp('A', 2), 11);
  EXPECT_EQ(model->Lamp('B', 3), 6);
  EXPECT_EQ(model->ProtocolErrors(), 0);
  EXPECT_THAT(model->ClockSets(), SizeIs(1));
  // The scripted polls uploaded "A1 A On" twice: inputs for the triggers.
  ASSERT_THAT(received, SizeIs(2));
  EXPECT_EQ(received[0], (X10Received{1, 1, X10Function::kOn, 0}));
  // A1 went on before it went off.
  std::vector<std::string> a1;
  for (const auto& t : model->Transmissions()) a1.push_back(t.Text());
  auto on = std::find(a1.begin(), a1.end(), "A f2");
  auto off = std::find(a1.begin(), a1.end(), "A f3");
  EXPECT_LT(on, off);
}

TEST_F(X10NetworkTest, AnInterfaceThatSendsGarbageIsOneLineAndBlocksNothing) {
  Start({});
  model->toHost = nullptr;  // the model stays silent; garbage comes instead
  device->SetOnBytes([this](std::span<const uint8_t>) {
    device->Write(std::vector<uint8_t>{0x13, 0x37});
  });
  x10->SetLevel(1, 1, 255);
  auto started = std::chrono::steady_clock::now();
  RunFor(1500);
  EXPECT_LT(std::chrono::steady_clock::now() - started, std::chrono::milliseconds(2500));
  EXPECT_THAT(log.lines, Contains(HasSubstr("X10 network: the X10 interface")).Times(1));
  EXPECT_EQ(x10->QueueDepth(), 1u);  // kept, not lost
}

}  // namespace
}  // namespace tav
