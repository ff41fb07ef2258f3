#include "suite/channelio/DMXListener.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "suite/channelio/ArtNetPacket.h"
#include "suite/channelio/E131Packet.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

const Cid kA = {1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1};
const Cid kB = {2, 2, 2, 2, 2, 2, 2, 2, 2, 2, 2, 2, 2, 2, 2, 2};
const Cid kOwn = {9, 9, 9, 9, 9, 9, 9, 9, 9, 9, 9, 9, 9, 9, 9, 9};

struct Packet {
  Cid cid = kA;
  uint8_t sequence = 0;
  uint8_t priority = 100;
  uint8_t options = 0;
  uint16_t universe = 7;
  std::vector<uint8_t> slots = std::vector<uint8_t>(8, 0);
  uint8_t startCode = 0;

  std::vector<uint8_t> Bytes() const {
    E131DataFields f;
    f.cid = cid;
    f.sourceName = "test";
    f.sequence = sequence;
    f.priority = priority;
    f.options = options;
    f.universe = universe;
    std::vector<uint8_t> out(E131DataPacketSize(slots.size()));
    EncodeE131Data(f, slots.data(), slots.size(), out.data());
    out[125] = startCode;
    return out;
  }
};

// Slot 3 at `level`, everything else dark.
Packet Slot3(uint8_t level, uint8_t sequence, Cid cid = kA) {
  Packet p;
  p.cid = cid;
  p.sequence = sequence;
  p.slots[2] = level;
  return p;
}

class Listener : public ::testing::Test {
 protected:
  Listener() : listener(Settings()) {}
  static DMXListener::Settings Settings() {
    DMXListener::Settings s;
    s.universe = 7;
    s.firstSlot = 1;
    s.slotCount = 8;
    s.threshold = 128;
    s.ownCid = kOwn;
    return s;
  }
  std::vector<int32_t> Receive(const Packet& packet, uint32_t tick = 0) {
    return ReceiveBytes(packet.Bytes(), tick);
  }
  std::vector<int32_t> ReceiveBytes(const std::vector<uint8_t>& bytes, uint32_t tick = 0,
                                    bool truncated = false) {
    std::vector<int32_t> pressed;
    listener.Receive({bytes.data(), bytes.size(), truncated, {{10, 0, 0, 2}, 5568}}, tick, pressed);
    return pressed;
  }
  DMXListener listener;
};

TEST_F(Listener, ASlotRisingThroughTheThresholdPressesOnce) {
  EXPECT_THAT(Receive(Slot3(0, 1)), IsEmpty());
  EXPECT_THAT(Receive(Slot3(127, 2)), IsEmpty());
  EXPECT_THAT(Receive(Slot3(128, 3)), ElementsAre(3));
  EXPECT_THAT(Receive(Slot3(255, 4)), IsEmpty());
  EXPECT_THAT(Receive(Slot3(20, 5)), IsEmpty());
  EXPECT_THAT(Receive(Slot3(200, 6)), ElementsAre(3));
  EXPECT_EQ(listener.GetCounters().accepted, 6u);
}

TEST_F(Listener, AlreadyHighWhenTheSourceAppearsIsNoPress) {
  EXPECT_THAT(Receive(Slot3(255, 1)), IsEmpty());
  EXPECT_THAT(Receive(Slot3(0, 2)), IsEmpty());
  EXPECT_THAT(Receive(Slot3(255, 3)), ElementsAre(3));
}

TEST_F(Listener, OutOfOrderPacketsAreDroppedButARestartIsTaken) {
  Receive(Slot3(0, 100));
  EXPECT_THAT(Receive(Slot3(255, 99)), IsEmpty());   // one behind
  EXPECT_THAT(Receive(Slot3(255, 100)), IsEmpty());  // a repeat
  EXPECT_THAT(Receive(Slot3(255, 81)), IsEmpty());   // 19 behind
  EXPECT_EQ(listener.GetCounters().outOfOrder, 3u);
  EXPECT_THAT(Receive(Slot3(255, 80)), ElementsAre(3));  // 20 behind: a restart
  Receive(Slot3(0, 255));
  EXPECT_THAT(Receive(Slot3(255, 0)), ElementsAre(3));  // wraps 255 -> 0
}

TEST_F(Listener, IgnoredPacketsChangeNothing) {
  Receive(Slot3(0, 1));
  struct Case {
    const char* what;
    Packet packet;
  };
  Packet preview = Slot3(255, 2);
  preview.options = kE131OptionPreview;
  Packet loud = Slot3(255, 3);
  loud.priority = 201;
  Packet other = Slot3(255, 4);
  other.universe = 8;
  Packet own = Slot3(255, 5, kOwn);
  Packet startCode = Slot3(255, 6);
  startCode.startCode = 0xDD;
  for (const Packet& p : {preview, loud, other, own, startCode}) EXPECT_THAT(Receive(p), IsEmpty());
  EXPECT_EQ(listener.GetCounters().ignored, 5u);
  EXPECT_THAT(Receive(Slot3(255, 7)), ElementsAre(3));
}

TEST_F(Listener, StreamTerminatedEndsTheSourceAndItsLevelsAreIgnored) {
  Receive(Slot3(0, 1));
  Packet end = Slot3(255, 2);
  end.options = kE131OptionTerminated;
  EXPECT_THAT(Receive(end), IsEmpty());
  EXPECT_EQ(listener.SourceCount(), 0u);
  EXPECT_EQ(listener.GetCounters().terminated, 1u);
  // The source's next stream starts a fresh baseline.
  EXPECT_THAT(Receive(Slot3(255, 3)), IsEmpty());
}

TEST_F(Listener, ASilentSourceIsGoneAfterTwoAndAHalfSeconds) {
  Receive(Slot3(0, 1), 1000);
  Receive(Slot3(0, 2, kB), 1000);
  Receive(Slot3(0, 3, kB), 3400);
  EXPECT_EQ(listener.SourceCount(), 2u);
  Receive(Slot3(0, 4, kB), 3501);
  EXPECT_EQ(listener.SourceCount(), 1u);
  EXPECT_EQ(listener.GetCounters().lost, 1u);
}

TEST_F(Listener, HighestPriorityWinsAndEqualPrioritiesMergeHighestLevel) {
  Packet a = Slot3(0, 1);
  a.slots[0] = 200;
  Packet b = Slot3(0, 1, kB);
  b.slots[1] = 150;
  Receive(a);
  Receive(b);
  EXPECT_EQ(listener.Levels()[0], 200);
  EXPECT_EQ(listener.Levels()[1], 150);
  Packet louder = Slot3(255, 2, kB);
  louder.priority = 150;
  EXPECT_THAT(Receive(louder), ElementsAre(3));
  EXPECT_EQ(listener.Levels()[0], 0);  // only the priority-150 source counts
}

TEST_F(Listener, SourcesBeyondTheLimitAreRefused) {
  for (uint8_t i = 0; i < DMXListener::kMaxSources + 2; ++i) {
    Cid cid{};
    cid[0] = static_cast<uint8_t>(i + 1);
    Receive(Slot3(0, 1, cid));
  }
  EXPECT_EQ(listener.SourceCount(), DMXListener::kMaxSources);
  EXPECT_EQ(listener.GetCounters().refused, 2u);
}

TEST_F(Listener, MalformedAndTruncatedDatagramsAreCounted) {
  std::vector<uint8_t> good = Slot3(0, 1).Bytes();
  ReceiveBytes({1, 2, 3});
  ReceiveBytes(std::vector<uint8_t>(good.begin(), good.end() - 1));
  ReceiveBytes(good, 0, true);
  ReceiveBytes(std::vector<uint8_t>(2000, 0x41));
  EXPECT_EQ(listener.GetCounters().malformed, 4u);
  EXPECT_EQ(listener.GetCounters().accepted, 0u);
}

TEST_F(Listener, SlotsOutsideTheRangeNeverPress) {
  DMXListener::Settings s = Settings();
  s.firstSlot = 4;
  s.slotCount = 2;
  DMXListener narrow(s);
  std::vector<int32_t> pressed;
  Packet p;
  auto receive = [&](uint8_t level, uint8_t sequence) {
    p.sequence = sequence;
    std::fill(p.slots.begin(), p.slots.end(), level);
    auto bytes = p.Bytes();
    narrow.Receive({bytes.data(), bytes.size(), false, {}}, 0, pressed);
  };
  receive(0, 1);
  receive(255, 2);
  EXPECT_THAT(pressed, ElementsAre(4, 5));
}

TEST(ArtNetListener, ArtDmxOfTheListenedPortAddressPresses) {
  DMXListener::Settings s;
  s.protocol = DMXProtocol::kArtNet;
  s.universe = 0x21;
  s.slotCount = 4;
  DMXListener listener(s);
  std::vector<int32_t> pressed;
  auto send = [&](uint16_t portAddress, uint8_t sequence, uint8_t level) {
    std::vector<uint8_t> slots = {0, level, 0, 0};
    std::vector<uint8_t> bytes(ArtDmxPacketSize(slots.size()));
    EncodeArtDmx(sequence, 0, portAddress, slots.data(), slots.size(), bytes.data());
    listener.Receive({bytes.data(), bytes.size(), false, {{10, 0, 0, 9}, 6454}}, 0, pressed);
  };
  send(0x21, 1, 0);
  send(0x22, 2, 255);
  send(0x21, 0, 255);  // sequence 0: no ordering check
  EXPECT_THAT(pressed, ElementsAre(2));
  send(0x21, 3, 0);
  send(0x21, 2, 255);  // out of order
  EXPECT_THAT(pressed, ElementsAre(2));
  EXPECT_EQ(listener.GetCounters().outOfOrder, 1u);
}

}  // namespace
}  // namespace tav
