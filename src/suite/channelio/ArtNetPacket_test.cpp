// Art-Net packets against bytes written out by hand from the protocol's
// tables (docs/outputs.md).

#include "suite/channelio/ArtNetPacket.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <vector>

namespace tav {
namespace {

using Bytes = std::vector<uint8_t>;
using ::testing::ElementsAreArray;

TEST(ArtNetPacket, ArtDmxMatchesTheTableAndPadsAnOddLength) {
  // Port-Address 0x1234: Net 0x12, Sub-Net 3, Universe 4; sequence 7;
  // physical 2; three slots padded to four.
  Bytes golden = {'A',  'r',  't',  '-',  'N',  'e',  't',  0x00, 0x00, 0x50, 0x00,
                  0x0E, 0x07, 0x02, 0x34, 0x12, 0x00, 0x04, 0x01, 0x02, 0x03, 0x00};
  Bytes slots = {1, 2, 3};
  Bytes out(ArtDmxPacketSize(slots.size()), 0xEE);
  EncodeArtDmx(7, 2, 0x1234, slots.data(), slots.size(), out.data());
  EXPECT_THAT(out, ElementsAreArray(golden));
}

TEST(ArtNetPacket, DataLengthIsEvenAndAtLeastTwo) {
  EXPECT_EQ(ArtDmxDataLength(0), 2u);
  EXPECT_EQ(ArtDmxDataLength(1), 2u);
  EXPECT_EQ(ArtDmxDataLength(170), 170u);
  EXPECT_EQ(ArtDmxDataLength(511), 512u);
  EXPECT_EQ(ArtDmxPacketSize(512), 530u);
}

TEST(ArtNetPacket, ArtSyncMatchesTheTable) {
  Bytes golden = {'A', 'r', 't', '-', 'N', 'e', 't', 0x00, 0x00, 0x52, 0x00, 0x0E, 0x00, 0x00};
  Bytes out(kArtSyncPacketSize, 0xEE);
  EncodeArtSync(out.data());
  EXPECT_THAT(out, ElementsAreArray(golden));
}

TEST(ArtNetPacket, ReaderTakesArtDmxApart) {
  Bytes slots(170, 9);
  Bytes packet(ArtDmxPacketSize(slots.size()));
  EncodeArtDmx(200, 1, 0x7FFF, slots.data(), slots.size(), packet.data());
  ArtDmxView view;
  ASSERT_EQ(ParseArtNet(packet.data(), packet.size(), view), ArtNetParse::kDmx);
  EXPECT_EQ(view.sequence, 200);
  EXPECT_EQ(view.physical, 1);
  EXPECT_EQ(view.portAddress, 0x7FFF);
  EXPECT_EQ(view.length, 170);
  EXPECT_EQ(view.data[169], 9);
}

TEST(ArtNetPacket, ReaderSetsOtherOpCodesAsideAndRefusesBrokenOnes) {
  Bytes sync(kArtSyncPacketSize);
  EncodeArtSync(sync.data());
  ArtDmxView view;
  EXPECT_EQ(ParseArtNet(sync.data(), sync.size(), view), ArtNetParse::kOther);

  struct Case {
    const char* what;
    std::function<void(Bytes&)> damage;
  };
  std::vector<Case> cases = {
      {"not Art-Net", [](Bytes& b) { b[0] = 'B'; }},
      {"cut header", [](Bytes& b) { b.resize(17); }},
      {"length 0", [](Bytes& b) { b[16] = 0, b[17] = 0; }},
      {"length 514", [](Bytes& b) { b[16] = 0x02, b[17] = 0x02; }},
      {"length beyond the datagram", [](Bytes& b) { b[17] = 12; }},
  };
  for (const Case& c : cases) {
    Bytes packet(ArtDmxPacketSize(10));
    EncodeArtDmx(1, 0, 1, Bytes(10, 1).data(), 10, packet.data());
    c.damage(packet);
    EXPECT_EQ(ParseArtNet(packet.data(), packet.size(), view), ArtNetParse::kMalformed) << c.what;
  }
}

}  // namespace
}  // namespace tav
