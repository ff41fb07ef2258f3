#include "suite/channelio/serial/UsbDmxFraming.h"

#include <gtest/gtest.h>

#include "suite/channelio/serial/testing/UsbProModel.h"

namespace tav {
namespace {

TEST(UsbDmxFraming, ProMessageFramesTheStartCodeAndSlots) {
  std::vector<uint8_t> slots(512);
  for (size_t i = 0; i < slots.size(); ++i) slots[i] = static_cast<uint8_t>(i * 3);
  std::vector<uint8_t> out;
  EncodeUsbProSendDMX(slots, 512, out);
  ASSERT_EQ(out.size(), 518u);
  // 513 data bytes, length little-endian.
  EXPECT_EQ((std::vector<uint8_t>(out.begin(), out.begin() + 5)),
            (std::vector<uint8_t>{0x7E, 0x06, 0x01, 0x02, 0x00}));
  EXPECT_EQ(out.back(), 0xE7);
  EXPECT_EQ(std::vector<uint8_t>(out.begin() + 5, out.end() - 1), slots);
}

TEST(UsbDmxFraming, ProSlotCountIsKeptWithinWhatTheWidgetTakes) {
  struct Case {
    size_t given, asked, sent;
  };
  for (const Case& c :
       {Case{3, 3, 24}, Case{600, 600, 512}, Case{10, 100, 100}, Case{100, 30, 30}}) {
    std::vector<uint8_t> slots(c.given, 0x11), out;
    EncodeUsbProSendDMX(slots, c.asked, out);
    ASSERT_EQ(out.size(), c.sent + 6) << c.asked;
    EXPECT_EQ(out[2] | (out[3] << 8), static_cast<int>(c.sent + 1));
    // Slots beyond those given are dark.
    EXPECT_EQ(out[5 + c.sent - 1], c.given >= c.sent ? 0x11 : 0x00);
  }
}

TEST(UsbDmxFraming, ModelFindsMessagesInAnyPiecesAndRejectsBadOnes) {
  std::vector<uint8_t> stream, one, two;
  EncodeUsbProSendDMX(std::vector<uint8_t>(40, 7), 40, one);
  EncodeUsbProSendDMX(std::vector<uint8_t>(512, 9), 512, two);
  stream = one;
  stream.insert(stream.end(), {0x7E, 0x03, 0x00, 0x00, 0xE7});  // another label
  stream.insert(stream.end(), two.begin(), two.end());
  UsbProModel model;
  for (size_t at = 0; at < stream.size(); at += 7)
    model.Feed(std::span(stream).subspan(at, std::min<size_t>(7, stream.size() - at)));
  ASSERT_EQ(model.Frames().size(), 2u);
  EXPECT_EQ(model.Frames()[0], std::vector<uint8_t>(40, 7));
  EXPECT_EQ(model.Frames()[1], std::vector<uint8_t>(512, 9));
  EXPECT_GE(model.Errors(), 1u);
}

TEST(UsbDmxFraming, OpenDMXFrameIsTheStartCodeAndAllSlots) {
  std::vector<uint8_t> out;
  EncodeOpenDMXFrame(std::vector<uint8_t>{1, 2, 3}, out);
  ASSERT_EQ(out.size(), 513u);
  EXPECT_EQ(out[0], 0x00);
  EXPECT_EQ(out[1], 1);
  EXPECT_EQ(out[3], 3);
  EXPECT_EQ(out[4], 0);
  EncodeOpenDMXFrame(std::vector<uint8_t>(600, 5), out);
  EXPECT_EQ(out.size(), 513u);
  EXPECT_EQ(out[512], 5);
}

}  // namespace
}  // namespace tav
