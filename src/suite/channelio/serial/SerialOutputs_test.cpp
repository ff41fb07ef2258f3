#include "suite/channelio/serial/SerialOutputs.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ports/testing/ManualClock.h"
#include "ports/testing/RecordingMessageLog.h"
#include "ports/testing/VirtualTimerService.h"
#include "suite/channelio/serial/testing/FakeSerialLink.h"
#include "suite/channelio/serial/testing/UsbProModel.h"
#include "support/Error.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::IsEmpty;

struct Input {
  int32_t network, unit, input;
  friend bool operator==(const Input&, const Input&) = default;
};

class SerialOutputsTest : public ::testing::Test {
 protected:
  SerialOutputsTest() { clock.Follow(timers); }

  void Send(NetworkOutput& output, bool dark = false) {
    output.Send(OutputFrame{levels, clock.TickCount(), true, dark});
    timers.Advance(100);
  }
  FakeSerialLink& Link(size_t i = 0) { return *opener.links.at(i); }

  VirtualTimerService timers;
  ManualClock clock;
  RecordingMessageLog log;
  FakeSerialPortOpener opener;
  LevelBuffers levels;
  std::vector<Input> inputs;
  SerialOutputs outputs{{&opener, &timers, &clock, &log}, [this](int32_t n, int32_t u, int32_t i) {
                          inputs.push_back({n, u, i});
                        }};
};

TEST_F(SerialOutputsTest, TAVNetworkSendsItsUnitsAsBoardsWithItsVariant) {
  TAVNetworkPreferences prefs;
  prefs.SetPort("/dev/ttyUSB3");
  prefs.SetSpeed(115200);
  prefs.SetStopBits(2);
  prefs.SetUnitCount(3);
  prefs.SetCircuitsPerUnit(4);
  prefs.SetEnhanced(true);  // a header per unit
  prefs.SetOldMCP(true);    // clamped, not escaped
  const uint8_t unit1[] = {1, 2, 3, 4};
  const uint8_t unit3[] = {0x7E};
  levels.WriteTAV(2, 1, 1, unit1, 4);
  levels.WriteTAV(2, 3, 2, unit3, 1);
  levels.WriteTAV(1, 1, 1, unit1, 4);  // another network
  auto output = outputs.OpenTAVNetwork(2, prefs, levels);
  EXPECT_EQ(output->Name(), "TAV network 2 on /dev/ttyUSB3");
  ASSERT_EQ(opener.opened.size(), 1u);
  EXPECT_EQ(opener.opened[0].baud, 115200);
  EXPECT_EQ(opener.opened[0].stopBits, 2);
  Send(*output);
  EXPECT_THAT(Link().Bytes(), ElementsAreArray({0x7E, 0x80, 1, 2, 3, 4, 0x7E, 0x81, 0, 0, 0, 0,
                                                0x7E, 0x82, 0, 0x7C, 0, 0}));
}

TEST_F(SerialOutputsTest, FennickSendsChangesAndZerosWhileDark) {
  FennickPreferences prefs;
  prefs.SetChannelsPerBoard(4);
  levels.SetFennick(1, 2, 9);
  levels.SetFennick(2, 1, 7);  // no port for a second Fennick network
  auto output = outputs.OpenFennick("/dev/ttyUSB0", prefs, levels);
  Send(*output);
  Send(*output);  // nothing changed: no new frame (the refresh is the sender's)
  ASSERT_EQ(Link().Writes().size(), 1u);
  EXPECT_THAT(Link().Writes()[0].bytes, ElementsAre(0x7E, 0x80, 0, 9, 0, 0));
  Send(*output, true);
  EXPECT_THAT(Link().Writes().back().bytes, ElementsAre(0x7E, 0x80, 0, 0, 0, 0));
  Send(*output);
  EXPECT_THAT(Link().Writes().back().bytes, ElementsAre(0x7E, 0x80, 0, 9, 0, 0));
  EXPECT_EQ(output->Counters().packetsSent, 3u);
}

TEST_F(SerialOutputsTest, X10LevelsBecomeCommandsAndOnCommandsHeardBecomeInputs) {
  NetworkPreferences prefs;
  prefs.SetX10HouseCodes("B");
  auto output = outputs.OpenX10("/dev/ttyS0", prefs, levels);
  EXPECT_EQ(opener.opened[0].baud, 4800);
  levels.SetX10(2, 5, 255);
  Send(*output);
  EXPECT_THAT(Link().Bytes(), ElementsAre(0x04, 0xE1));  // B5's address
  Link().ClearWrites();
  // The interface polls and uploads "A1 A On", then "A1 A Off".
  Link().Receive({0x5A});
  EXPECT_THAT(Link().Bytes(), ElementsAre(0xC3));
  Link().Receive({0x03, 0x02, 0x66, 0x62});
  Link().Receive({0x5A});
  Link().Receive({0x03, 0x02, 0x66, 0x63});
  EXPECT_THAT(inputs, ElementsAre(Input{kX10InputNetwork, 1, 1}));
}

TEST_F(SerialOutputsTest, WidgetSendsItsUniversesSlots) {
  DMXUniversePrefs prefs;
  prefs.SetUniverse(7);
  prefs.SetTransport(DMXTransport::kUSBPro);
  prefs.SetPort("/dev/ttyUSB4");
  prefs.SetSize(100);
  std::vector<uint8_t> slots(512);
  for (size_t i = 0; i < slots.size(); ++i) slots[i] = static_cast<uint8_t>(i);
  levels.WriteDMX(7, 1, slots.data(), 512);
  auto output = outputs.OpenDMXWidget(prefs, levels);
  EXPECT_EQ(output->Name(), "USBPro on /dev/ttyUSB4");
  Send(*output);
  UsbProModel widget;
  widget.Feed(Link().Bytes());
  ASSERT_EQ(widget.Frames().size(), 1u);
  EXPECT_EQ(widget.Frames()[0], std::vector<uint8_t>(slots.begin(), slots.begin() + 100));
}

TEST_F(SerialOutputsTest, APortThatCannotBeOpenedFailsAndLeavesNothingOpen) {
  opener.held = {"/dev/ttyUSB0"};
  opener.missing = {"/dev/ttyUSB9"};
  try {
    outputs.OpenFennick("/dev/ttyUSB0", FennickPreferences(), levels);
    ADD_FAILURE() << "opened a held port";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), kErrorPortAlreadyOpen);
  }
  try {
    outputs.OpenX10("/dev/ttyUSB9", NetworkPreferences(), levels);
    ADD_FAILURE() << "opened a missing port";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), kErrorPortInvalid);
  }
  EXPECT_THAT(opener.links, IsEmpty());
}

}  // namespace
}  // namespace tav
