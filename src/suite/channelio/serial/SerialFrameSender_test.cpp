// The frame-sending transmitters (dimmer networks and DMX widgets) on a fake
// link and virtual time.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ports/testing/ManualClock.h"
#include "ports/testing/RecordingMessageLog.h"
#include "ports/testing/VirtualTimerService.h"
#include "suite/channelio/serial/DimmerTransmitter.h"
#include "suite/channelio/serial/UsbDmxTransmitter.h"
#include "suite/channelio/serial/testing/DimmerBoardModel.h"
#include "suite/channelio/serial/testing/FakeSerialLink.h"
#include "suite/channelio/serial/testing/UsbProModel.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

class SerialSendersTest : public ::testing::Test {
 protected:
  SerialSendersTest() {
    clock.SetTickCount(0xFFFFFF00u);  // the tick wraps during the tests
    clock.Follow(timers);
  }

  // A link that notes the tick of every write.
  std::unique_ptr<FakeSerialLink> NewLink() {
    auto link = std::make_unique<FakeSerialLink>();
    link->SetOnWrite([this](std::span<const uint8_t>) { writeTicks.push_back(clock.TickCount()); });
    fake = link.get();
    return link;
  }

  std::unique_ptr<DimmerTransmitter> Dimmer(int32_t channels, int32_t baud) {
    DimmerNetworkSettings settings;
    settings.name = "Fennick network";
    settings.serial = {"/dev/ttyUSB0", baud, 1};
    settings.layout.channelsPerBoard = channels;
    return std::make_unique<DimmerTransmitter>(settings, NewLink(), timers, clock, log);
  }

  VirtualTimerService timers;
  ManualClock clock;
  RecordingMessageLog log;
  FakeSerialLink* fake = nullptr;
  std::vector<uint32_t> writeTicks;
};

TEST_F(SerialSendersTest, DimmerFramesArePacedToWhatTheSpeedCarries) {
  auto dimmer = Dimmer(574, 115200);  // 581-byte frames: 50.4 ms each
  EXPECT_THAT(log.lines, IsEmpty());  // 574 channels fit 115200 baud
  std::vector<uint8_t> levels(574);
  for (int frame = 0; frame < 80; ++frame) {  // 40 frames a second for 2 s
    std::fill(levels.begin(), levels.end(), static_cast<uint8_t>(frame));
    dimmer->SendLevels(levels);
    timers.Advance(25);
  }
  timers.Advance(200);
  const auto& counters = dimmer->Sender().Counters();
  // 2.2 s of line at 50.4 ms a frame, and no frame handed over while more
  // than the slack of the previous one was still on the line.
  EXPECT_GE(counters.framesSent, 39u);
  EXPECT_LE(counters.framesSent, 42u);
  EXPECT_EQ(counters.framesSent + counters.framesReplaced, 80u);
  for (size_t i = 1; i < writeTicks.size(); ++i) {
    EXPECT_GE(static_cast<int32_t>(writeTicks[i] - writeTicks[i - 1]), 47) << i;
  }
  // The newest levels always got out.
  DimmerChainModel chain(1, 574);
  chain.Feed(fake->Writes().back().bytes);
  EXPECT_EQ(chain.AllChannels(), std::vector<uint8_t>(574, 79));
}

TEST_F(SerialSendersTest, AFrameWaitingForTheLineIsNotLostWhenTheNetworkCloses) {
  auto dimmer = Dimmer(574, 115200);
  std::vector<uint8_t> lastWritten;
  fake->SetOnWrite(
      [&](std::span<const uint8_t> bytes) { lastWritten.assign(bytes.begin(), bytes.end()); });
  dimmer->SendLevels(std::vector<uint8_t>(574, 200));
  timers.Advance(10);                                // the line is still busy with the first frame
  dimmer->SendLevels(std::vector<uint8_t>(574, 0));  // lights off, then close
  EXPECT_TRUE(dimmer->Sender().FrameWaiting());
  dimmer.reset();
  DimmerChainModel chain(1, 574);
  chain.Feed(lastWritten);
  EXPECT_EQ(chain.AllChannels(), std::vector<uint8_t>(574, 0));
}

TEST_F(SerialSendersTest, TooManyChannelsForTheSpeedIsOneWarning) {
  auto dimmer = Dimmer(600, 115200);
  ASSERT_EQ(log.lines.size(), 1u);
  EXPECT_EQ(log.lines[0],
            "2 Fennick network on /dev/ttyUSB0: 600 channels are more than 115200 baud carries 20 "
            "times a second (at most 574); frames will come about 18.9 times a second");
  dimmer->SendLevels(std::vector<uint8_t>(600, 1));
  EXPECT_EQ(log.lines.size(), 1u);
}

TEST_F(SerialSendersTest, LastFrameIsRefreshedAfterAQuietSecond) {
  auto dimmer = Dimmer(8, 57600);
  dimmer->SendLevels(std::vector<uint8_t>(8, 200));
  timers.Advance(3500);
  ASSERT_EQ(fake->Writes().size(), 4u);
  EXPECT_EQ(dimmer->Sender().Counters().refreshes, 3u);
  for (const auto& write : fake->Writes()) EXPECT_EQ(write.bytes, fake->Writes()[0].bytes);
}

TEST_F(SerialSendersTest, UnplugAndReplugAreOneLineEachAndTheNewestFrameFollows) {
  auto dimmer = Dimmer(8, 57600);
  dimmer->SendLevels(std::vector<uint8_t>(8, 1));
  fake->Unplug("Input/output error");
  dimmer->SendLevels(std::vector<uint8_t>(8, 2));
  dimmer->SendLevels(std::vector<uint8_t>(8, 3));
  timers.Advance(5000);
  EXPECT_EQ(fake->Writes().size(), 1u);
  fake->Replug();
  ASSERT_EQ(fake->Writes().size(), 2u);
  DimmerChainModel chain(1, 8);
  chain.Feed(fake->Writes().back().bytes);
  EXPECT_EQ(chain.AllChannels(), std::vector<uint8_t>(8, 3));
  EXPECT_THAT(log.lines,
              ElementsAre("2 Fennick network: lost /dev/ttyUSB0 (Input/output error); it is "
                          "reopened when it comes back",
                          "1 Fennick network: /dev/ttyUSB0 is back"));
}

TEST_F(SerialSendersTest, AFullDeviceQueueHoldsTheFrameUntilItDrains) {
  auto dimmer = Dimmer(8, 57600);
  fake->SetQueued(4000, true);
  dimmer->SendLevels(std::vector<uint8_t>(8, 9));
  timers.Advance(100);
  EXPECT_THAT(fake->Writes(), IsEmpty());
  EXPECT_TRUE(dimmer->Sender().FrameWaiting());
  fake->SetQueued(0);
  timers.Advance(700);  // 4000 bytes at 57600 baud take 694 ms
  EXPECT_EQ(fake->Writes().size(), 1u);
}

TEST_F(SerialSendersTest, UsbProSendsFramedSlotsOnChangeAndOncePerSecond) {
  UsbDmxSettings settings{"DMX universe 2", "/dev/ttyUSB1", UsbDmxWidget::kPro, 40};
  UsbDmxTransmitter widget(settings, NewLink(), timers, clock, log);
  std::vector<uint8_t> slots(512);
  for (size_t i = 0; i < slots.size(); ++i) slots[i] = static_cast<uint8_t>(i);
  widget.SendLevels(slots);
  const std::vector<uint8_t> first = slots;
  timers.Advance(10);
  slots[0] = 99;
  widget.SendLevels(slots);
  timers.Advance(2100);
  UsbProModel model;
  for (const auto& write : fake->Writes()) {
    EXPECT_EQ(write.breakMicros, 0u);
    model.Feed(write.bytes);
  }
  EXPECT_EQ(model.Errors(), 0u);
  ASSERT_EQ(model.Frames().size(), 4u);  // two changes, two refreshes
  // The universe's 40 slots, no more.
  EXPECT_EQ(model.Frames()[0], std::vector<uint8_t>(first.begin(), first.begin() + 40));
  EXPECT_EQ(model.Frames()[0][0], 0);
  EXPECT_EQ(model.Frames()[1][0], 99);
  EXPECT_EQ(model.Frames()[3], model.Frames()[1]);
}

TEST_F(SerialSendersTest, OpenDMXSendsEveryFrameBehindABreakAboutFortyTimesASecond) {
  UsbDmxSettings settings{"DMX universe 3", "/dev/ttyUSB2", UsbDmxWidget::kOpenDMX, 512};
  EXPECT_EQ(UsbDmxTransmitter::PortSettings(settings).baud, 250000);
  EXPECT_EQ(UsbDmxTransmitter::PortSettings(settings).stopBits, 2);
  UsbDmxTransmitter dongle(settings, NewLink(), timers, clock, log);
  dongle.SendLevels(std::vector<uint8_t>{10, 20, 30});
  timers.Advance(1000);
  EXPECT_GE(fake->Writes().size(), 38u);
  EXPECT_LE(fake->Writes().size(), 41u);
  OpenDMXModel model;
  for (const auto& write : fake->Writes()) {
    EXPECT_GE(write.breakMicros, 92u);
    EXPECT_GE(write.markMicros, 12u);
    model.Feed(write.bytes);
  }
  EXPECT_EQ(model.Errors(), 0u);
  EXPECT_EQ(model.Frames().back()[2], 30);
}

}  // namespace
}  // namespace tav
