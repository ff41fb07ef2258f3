// E1.31 packets against bytes written out by hand from the protocol's
// tables (docs/outputs.md), not from the encoder's own output.

#include "suite/channelio/E131Packet.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <vector>

namespace tav {
namespace {

using Bytes = std::vector<uint8_t>;

const Cid kCid = {0x01, 0x02, 0x03, 0x04, 0x05, 0x06, 0x07, 0x08,
                  0x09, 0x0A, 0x0B, 0x0C, 0x0D, 0x0E, 0x0F, 0x10};

Bytes RootLayer(uint16_t flagsAndLength, uint32_t vector) {
  Bytes b = {0x00, 0x10, 0x00, 0x00, 0x41, 0x53, 0x43, 0x2D,
             0x45, 0x31, 0x2E, 0x31, 0x37, 0x00, 0x00, 0x00};
  b.push_back(flagsAndLength >> 8);
  b.push_back(flagsAndLength & 0xFF);
  for (int shift = 24; shift >= 0; shift -= 8) b.push_back((vector >> shift) & 0xFF);
  b.insert(b.end(), kCid.begin(), kCid.end());
  return b;
}

// Universe 1, priority 100, sequence 5, source "Test", slots 10 20 30 40.
Bytes GoldenData(uint8_t options) {
  Bytes b = RootLayer(0x7072, 0x00000004);                                   // 130 - 16 = 114
  Bytes framing = {0x70, 0x5C, 0x00, 0x00, 0x00, 0x02, 'T', 'e', 's', 't'};  // 130 - 38 = 92
  b.insert(b.end(), framing.begin(), framing.end());
  b.insert(b.end(), 60, 0x00);              // rest of the 64-byte source name
  Bytes rest = {0x64,                       // priority
                0x00,    0x00,              // synchronization address
                0x05,                       // sequence number
                options,                    // options
                0x00,    0x01,              // universe
                0x70,    0x0F,              // DMP flags and length: 130 - 115 = 15
                0x02,    0xA1,              // vector, address and data type
                0x00,    0x00, 0x00, 0x01,  // first address, increment
                0x00,    0x05,              // property value count: 1 + 4
                0x00,                       // START code
                10,      20,   30,   40};
  b.insert(b.end(), rest.begin(), rest.end());
  return b;
}

Bytes Encoded(uint8_t options, const Bytes& slots = {10, 20, 30, 40}) {
  E131DataFields fields;
  fields.cid = kCid;
  fields.sourceName = "Test";
  fields.sequence = 5;
  fields.options = options;
  Bytes out(E131DataPacketSize(slots.size()));
  EncodeE131Data(fields, slots.data(), slots.size(), out.data());
  return out;
}

TEST(E131Packet, DataPacketMatchesTheTableByteForByte) {
  EXPECT_THAT(Encoded(0), ::testing::ElementsAreArray(GoldenData(0)));
}

TEST(E131Packet, StreamTerminatedIsTheDataPacketWithOption0x40) {
  EXPECT_THAT(Encoded(kE131OptionTerminated), ::testing::ElementsAreArray(GoldenData(0x40)));
}

TEST(E131Packet, FullUniverseCarriesTheTablesLengths) {
  Bytes packet = Encoded(0, Bytes(512, 7));
  ASSERT_EQ(packet.size(), 638u);
  EXPECT_EQ(packet[16] << 8 | packet[17], 0x726E);
  EXPECT_EQ(packet[38] << 8 | packet[39], 0x7258);
  EXPECT_EQ(packet[115] << 8 | packet[116], 0x720B);
  EXPECT_EQ(packet[123] << 8 | packet[124], 0x0201);
}

TEST(E131Packet, LongSourceNamesAreCutAndStillEndInZero) {
  std::string name(100, 'x');
  E131DataFields fields;
  fields.sourceName = name;
  Bytes out(E131DataPacketSize(1));
  EncodeE131Data(fields, nullptr, 1, out.data());
  EXPECT_EQ(std::string(out.begin() + 44, out.begin() + 107), std::string(63, 'x'));
  EXPECT_EQ(out[107], 0);
}

TEST(E131Packet, SyncPacketMatchesTheTable) {
  Bytes golden = RootLayer(0x7021, 0x00000008);
  Bytes framing = {0x70, 0x0B, 0x00, 0x00, 0x00, 0x01, 0x2A, 0x1B, 0x58, 0x00, 0x00};
  golden.insert(golden.end(), framing.begin(), framing.end());
  Bytes out(kE131SyncPacketSize);
  EncodeE131Sync(kCid, 42, 7000, out.data());
  EXPECT_THAT(out, ::testing::ElementsAreArray(golden));
}

TEST(E131Packet, ReaderTakesTheGoldenPacketApart) {
  Bytes packet = GoldenData(kE131OptionPreview);
  E131DataView view;
  ASSERT_EQ(ParseE131(packet.data(), packet.size(), view), E131Parse::kData);
  EXPECT_EQ(view.cid, kCid);
  EXPECT_EQ(view.priority, 100);
  EXPECT_EQ(view.sequence, 5);
  EXPECT_EQ(view.options, kE131OptionPreview);
  EXPECT_EQ(view.universe, 1);
  EXPECT_EQ(view.startCode, 0);
  EXPECT_THAT(Bytes(view.slots, view.slots + view.slotCount),
              ::testing::ElementsAre(10, 20, 30, 40));
}

TEST(E131Packet, ReaderSetsSyncAndDiscoveryAside) {
  Bytes out(kE131SyncPacketSize);
  EncodeE131Sync(kCid, 1, 7000, out.data());
  E131DataView view;
  EXPECT_EQ(ParseE131(out.data(), out.size(), view), E131Parse::kOther);
}

TEST(E131Packet, ReaderRefusesEveryBrokenField) {
  struct Case {
    const char* what;
    std::function<void(Bytes&)> damage;
  };
  std::vector<Case> cases = {
      {"empty", [](Bytes& b) { b.clear(); }},
      {"cut inside the header", [](Bytes& b) { b.resize(100); }},
      {"one slot missing", [](Bytes& b) { b.pop_back(); }},
      {"one byte too many", [](Bytes& b) { b.push_back(0); }},
      {"preamble", [](Bytes& b) { b[1] = 0x11; }},
      {"post-amble", [](Bytes& b) { b[3] = 1; }},
      {"identifier", [](Bytes& b) { b[4] = 'B'; }},
      {"root flags", [](Bytes& b) { b[16] = 0x60; }},
      {"root vector", [](Bytes& b) { b[21] = 0x05; }},
      {"framing length", [](Bytes& b) { b[39] += 1; }},
      {"framing vector", [](Bytes& b) { b[43] = 0x03; }},
      {"DMP length", [](Bytes& b) { b[116] -= 1; }},
      {"DMP vector", [](Bytes& b) { b[117] = 0x03; }},
      {"address and data type", [](Bytes& b) { b[118] = 0xA0; }},
      {"first address", [](Bytes& b) { b[120] = 1; }},
      {"address increment", [](Bytes& b) { b[122] = 2; }},
      {"value count", [](Bytes& b) { b[124] = 9; }},
      {"universe 0", [](Bytes& b) { b[113] = 0, b[114] = 0; }},
      {"universe 64000", [](Bytes& b) { b[113] = 0xFA, b[114] = 0x00; }},
      {"513 slots",
       [](Bytes& b) {
         // Every length consistent, but more slots than a universe has.
         b = Encoded(0, Bytes(512, 1));
         b.push_back(1);
         b[17] += 1, b[39] += 1, b[116] += 1, b[124] += 1;
       }},
  };
  for (const Case& c : cases) {
    Bytes packet = GoldenData(0);
    c.damage(packet);
    E131DataView view;
    EXPECT_EQ(ParseE131(packet.data(), packet.size(), view), E131Parse::kMalformed) << c.what;
  }
}

TEST(E131Packet, ZeroSlotsAreAValidPacket) {
  Bytes packet = Encoded(0, {});
  E131DataView view;
  ASSERT_EQ(ParseE131(packet.data(), packet.size(), view), E131Parse::kData);
  EXPECT_EQ(view.slotCount, 0);
}

TEST(Cid, ReadsTheUsualFormsAndWritesOne) {
  Cid cid{};
  for (const char* text :
       {"01020304-0506-0708-090a-0b0c0d0e0f10", "{01020304-0506-0708-090A-0B0C0D0E0F10}",
        "0102030405060708090a0b0c0d0e0f10"}) {
    cid = {};
    ASSERT_TRUE(ParseCid(text, cid)) << text;
    EXPECT_EQ(cid, kCid) << text;
  }
  EXPECT_EQ(FormatCid(kCid), "01020304-0506-0708-090a-0b0c0d0e0f10");
}

TEST(Cid, RefusesWhatIsNotAUuid) {
  Cid cid = kCid;
  for (const char* text :
       {"", "x", "01020304-0506-0708-090a-0b0c0d0e0f1", "01020304+0506-0708-090a-0b0c0d0e0f10",
        "0102030405060708090a0b0c0d0e0f1g", "00000000-0000-0000-0000-000000000000"}) {
    EXPECT_FALSE(ParseCid(text, cid)) << text;
  }
  EXPECT_EQ(cid, kCid);
}

TEST(Cid, NewOnesAreVersion4AndDiffer) {
  Cid a = NewRandomCid();
  Cid b = NewRandomCid();
  EXPECT_NE(a, b);
  EXPECT_EQ(a[6] >> 4, 4);
  EXPECT_EQ(a[8] & 0xC0, 0x80);
  Cid read{};
  EXPECT_TRUE(ParseCid(FormatCid(a), read));
  EXPECT_EQ(read, a);
}

}  // namespace
}  // namespace tav
