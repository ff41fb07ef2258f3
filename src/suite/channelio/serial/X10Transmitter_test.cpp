#include "suite/channelio/serial/X10Transmitter.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ports/testing/ManualClock.h"
#include "ports/testing/RecordingMessageLog.h"
#include "ports/testing/VirtualTimerService.h"
#include "suite/channelio/serial/testing/Cm11aModel.h"
#include "suite/channelio/serial/testing/FakeSerialLink.h"

namespace tav {
namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::SizeIs;

// The X10 transmitter on a fake link wired to an interface model with the
// power line's timing, on virtual time.
class X10TransmitterTest : public ::testing::Test {
 protected:
  explicit X10TransmitterTest(Cm11aModelScript script = {}) : model(std::move(script)) {
    clock.Follow(timers);
    auto link = std::make_unique<FakeSerialLink>();
    fake = link.get();
    fake->SetOnWrite([this](std::span<const uint8_t> bytes) {
      toModel.insert(toModel.end(), bytes.begin(), bytes.end());
    });
    model.toHost = [this](const std::vector<uint8_t>& bytes) {
      toHost.insert(toHost.end(), bytes.begin(), bytes.end());
    };
    X10NetworkSettings settings;
    settings.path = "/dev/ttyS0";
    settings.houseCodes = "AB";
    settings.warnDepth = 8;
    x10 = std::make_unique<X10Transmitter>(settings, std::move(link), timers, clock, log);
    x10->SetOnReceived([this](const X10Received& r) { received.push_back(r); });
  }

  // Runs `ms` of virtual time a millisecond at a time, moving bytes between
  // the transmitter and the model as the event loop would.
  void Run(uint64_t ms) {
    for (uint64_t i = 0; i < ms; ++i) {
      Deliver();
      timers.Advance(1);
      model.Advance(timers.NowMs());
    }
    Deliver();
  }
  void Deliver() {
    while (!toModel.empty() || !toHost.empty()) {
      auto bytes = std::move(toModel);
      toModel.clear();
      model.FromHost(bytes, timers.NowMs());
      bytes = std::move(toHost);
      toHost.clear();
      if (!bytes.empty()) fake->Receive(bytes);
    }
  }
  static size_t Unit(int house, int unit) {
    return static_cast<size_t>((house - 1) * 16 + unit - 1);
  }

  VirtualTimerService timers;
  ManualClock clock;
  RecordingMessageLog log;
  Cm11aModel model;
  FakeSerialLink* fake = nullptr;
  std::unique_ptr<X10Transmitter> x10;
  std::vector<uint8_t> toModel, toHost;
  std::vector<X10Received> received;
};

TEST_F(X10TransmitterTest, LevelsReachTheLampsAndAFirstDarkFrameSendsNothing) {
  std::vector<uint8_t> levels(256, 0);
  x10->SetLevels(levels);
  Run(100);
  EXPECT_EQ(model.Exchanges(), 0);
  levels[Unit(1, 1)] = 255;
  levels[Unit(2, 3)] = 128;
  x10->SetLevels(levels);
  Run(5000);
  EXPECT_EQ(model.Lamp('A', 1), 22);
  EXPECT_EQ(model.Lamp('B', 3), 11);
  EXPECT_EQ(model.ProtocolErrors(), 0);
  EXPECT_EQ(x10->QueueDepth(), 0u);
}

TEST_F(X10TransmitterTest, AFadeCollapsesButEndsWhereTheSequenceEnded) {
  std::vector<uint8_t> levels(256, 0);
  for (int step = 0; step <= 40; ++step) {  // 0 to full in a second, 40 frames
    levels[Unit(1, 2)] = static_cast<uint8_t>(step * 255 / 40);
    x10->SetLevels(levels);
    Run(25);
  }
  Run(8000);
  EXPECT_EQ(model.Lamp('A', 2), 22);
  // The first step went out at once; the rest of the fade collapsed into
  // its end.
  std::vector<std::string> sent;
  for (const auto& t : model.Transmissions()) sent.push_back(t.Text());
  EXPECT_THAT(sent, ElementsAre("A2", "A f2", "A f4 x21", "A2", "A f2"));
}

TEST_F(X10TransmitterTest, QueueDepthIsLoggedWhenItGrowsAndWhenItCatchesUp) {
  for (int unit = 1; unit <= 16; ++unit) x10->SetLevel(1, unit, 255);
  // Past the threshold of 8, and again at twice that.
  EXPECT_THAT(log.lines,
              Contains("2 X10 network: 8 commands are waiting for the power line").Times(1));
  EXPECT_THAT(log.lines,
              Contains("2 X10 network: 16 commands are waiting for the power line").Times(1));
  EXPECT_THAT(log.lines, Contains(HasSubstr("commands are waiting")).Times(2));
  Run(20000);
  EXPECT_THAT(log.lines, Contains(HasSubstr("caught up")).Times(1));
  for (int unit = 1; unit <= 16; ++unit) EXPECT_EQ(model.Lamp('A', unit), 22) << unit;
}

TEST_F(X10TransmitterTest, PowerLineTrafficBecomesReceivedCommands) {
  model.Hear({0x02, 0xE6, 0xE2}, 0);  // B1, B On
  Run(50);
  ASSERT_THAT(received, SizeIs(1));
  EXPECT_EQ(received[0], (X10Received{2, 1, X10Function::kOn, 0}));
}

TEST_F(X10TransmitterTest, UnplugMidCommandResumesAfterReplug) {
  x10->SetLevel(1, 5, 128);  // A5: on, then dim
  Run(200);
  fake->Unplug("No such device");
  x10->SetLevel(1, 6, 255);  // queued while away
  Run(5000);
  fake->Replug();
  Run(6000);
  EXPECT_EQ(model.Lamp('A', 5), 11);
  EXPECT_EQ(model.Lamp('A', 6), 22);
  EXPECT_THAT(log.lines,
              Contains(HasSubstr("X10 network: lost /dev/ttyS0 (No such device)")).Times(1));
  EXPECT_THAT(log.lines, Contains("1 X10 network: /dev/ttyS0 is back").Times(1));
}

class X10TransmitterClockTest : public X10TransmitterTest {
 protected:
  X10TransmitterClockTest() : X10TransmitterTest(Script()) {}
  static Cm11aModelScript Script() {
    Cm11aModelScript script;
    script.clockRequestInsteadOfReadyAt = {2};
    script.wrongChecksumAt = {3};
    return script;
  }
};

TEST_F(X10TransmitterClockTest, ClockIsSetFromTheWallClockMidCommand) {
  clock.SetNow(DateTime::FromParts(2025, 3, 1, 9, 30, 0));
  x10->SetLevel(2, 2, 255);
  Run(5000);
  EXPECT_EQ(model.Lamp('B', 2), 22);
  ASSERT_THAT(model.ClockSets(), SizeIs(1));
  // Monitors the first house in use; minutes past an odd hour count on.
  EXPECT_EQ(model.ClockSets()[0][2], 90);
  EXPECT_EQ(model.ClockSets()[0][6], 0x60);
}

}  // namespace
}  // namespace tav
