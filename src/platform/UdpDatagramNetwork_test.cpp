// Real UDP on the loopback interface: our sender to our receiver, and the
// whole control sending to the whole control's DMX listener. Ports are
// picked free for each test so parallel runs do not meet.

#include "platform/UdpDatagramNetwork.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <functional>

#include "platform/SystemClock.h"
#include "platform/TimerfdDeadlineTimer.h"
#include "ports/testing/RecordingMessageLog.h"
#include "suite/channelio/ChannelIOControl.h"
#include "suite/channelio/E131Packet.h"
#include "support/testing/Failure.h"

namespace tav {
namespace {

using ::testing::ElementsAre;

uint16_t FreePort() {
  int fd = ::socket(AF_INET, SOCK_DGRAM, 0);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  ::bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof address);
  socklen_t length = sizeof address;
  ::getsockname(fd, reinterpret_cast<sockaddr*>(&address), &length);
  ::close(fd);
  return ntohs(address.sin_port);
}

// Runs the loop until `done` holds or two seconds pass.
bool RunUntil(EventLoop& loop, const std::function<bool()>& done) {
  auto end = std::chrono::steady_clock::now() + std::chrono::seconds(2);
  while (!done() && std::chrono::steady_clock::now() < end)
    loop.RunFor(std::chrono::milliseconds(5));
  return done();
}

TEST(UdpDatagramNetwork, ABatchArrivesWholeAndInOrder) {
  EventLoop loop;
  UdpDatagramNetwork network(loop);
  uint16_t port = FreePort();
  std::vector<std::vector<uint8_t>> received;
  auto receiver =
      network.OpenReceiver("", port, std::nullopt, [&](std::span<const ReceivedDatagram> batch) {
        for (const auto& d : batch) {
          EXPECT_FALSE(d.truncated);
          EXPECT_EQ(d.source.address[0], 127);
          received.emplace_back(d.data, d.data + d.size);
        }
      });
  auto sender = network.OpenSender("lo", 1);
  std::vector<std::vector<uint8_t>> payloads;
  std::vector<OutgoingDatagram> batch;
  for (uint8_t i = 0; i < 100; ++i) payloads.push_back(std::vector<uint8_t>(600, i));
  for (auto& p : payloads) batch.push_back({p.data(), p.size(), {{127, 0, 0, 1}, port}});
  SendResult result = sender->Send(batch);
  EXPECT_EQ(result.sent, 100u);
  EXPECT_EQ(result.dropped, 0u);
  ASSERT_TRUE(RunUntil(loop, [&] { return received.size() == 100; }));
  for (uint8_t i = 0; i < 100; ++i) EXPECT_EQ(received[i][0], i);
}

TEST(UdpDatagramNetwork, OversizedDatagramsArriveMarkedTruncated) {
  EventLoop loop;
  UdpDatagramNetwork network(loop);
  uint16_t port = FreePort();
  std::vector<ReceivedDatagram> seen;
  auto receiver =
      network.OpenReceiver("", port, std::nullopt, [&](std::span<const ReceivedDatagram> batch) {
        seen.insert(seen.end(), batch.begin(), batch.end());
      });
  auto sender = network.OpenSender("", 1);
  std::vector<uint8_t> big(4000, 1);
  OutgoingDatagram d{big.data(), big.size(), {{127, 0, 0, 1}, port}};
  sender->Send(std::span<const OutgoingDatagram>(&d, 1));
  ASSERT_TRUE(RunUntil(loop, [&] { return !seen.empty(); }));
  EXPECT_TRUE(seen[0].truncated);
}

TEST(UdpDatagramNetwork, UnknownInterfacesAndBusyPortsAreClearErrors) {
  EventLoop loop;
  UdpDatagramNetwork network(loop);
  auto failure = testing::FailureOf([&] { network.OpenSender("nosuch0", 1); });
  EXPECT_EQ(failure.description, "there is no network interface \"nosuch0\" with an IPv4 address");
  IPv4Endpoint endpoint;
  EXPECT_TRUE(network.Resolve("127.0.0.1:99", endpoint));
  EXPECT_EQ(endpoint, (IPv4Endpoint{{127, 0, 0, 1}, 99}));
  EXPECT_TRUE(network.Resolve("localhost", endpoint));
  EXPECT_EQ(endpoint.address[0], 127);
  EXPECT_FALSE(network.Resolve("localhost:70000", endpoint));
  auto sender = network.OpenSender("lo", 1);
  EXPECT_EQ(sender->CheckDestination({{127, 0, 0, 1}, 5568}), "");
  EXPECT_EQ(sender->BroadcastAddress(6454), (IPv4Endpoint{{255, 255, 255, 255}, 6454}));
}

// Two controls on one loop: A sends universe 9 to B's DMX listener.
class LoopbackControls : public ::testing::Test {
 protected:
  LoopbackControls()
      : network(loop), timerA(loop), timerB(loop), a(Ports(timerA)), b(Ports(timerB)) {}

  ChannelIOPorts Ports(DeadlineTimer& timer) {
    ChannelIOPorts ports;
    ports.clock = &clock;
    ports.timer = &timer;
    ports.network = &network;
    ports.log = &log;
    return ports;
  }

  void SetUp() override {
    port = FreePort();
    NetworkPreferences sending;
    DMXUniversePrefs universe;
    universe.SetUniverse(9);
    universe.SetInterface("lo");
    universe.SetDestination("239.255.0.9:" + std::to_string(port));
    universe.SetSize(16);
    sending.AddDMXUniverse(universe);
    a.ApplyNetworkPreferences(sending);
    a.SetupClient(false, "A", true);

    NetworkPreferences listening;
    listening.Listener().SetEnabled(true);
    listening.Listener().SetUniverse(9);
    listening.Listener().SetInterface("lo");
    listening.Listener().SetPort(port);
    listening.Listener().SetNetwork(3);
    listening.Listener().SetUnit(1);
    b.ApplyNetworkPreferences(listening);
    b.SetupClient(false, "B", true);
    b.SetOnInput([this](const ChannelInputEvent& e) { inputs.push_back(e.inputNumber); });
    ASSERT_TRUE(b.ListenerIsOpen()) << ::testing::PrintToString(log.lines);

    raw = network.OpenReceiver("lo", port, IPv4Endpoint{{239, 255, 0, 9}, port},
                               [this](std::span<const ReceivedDatagram> batch) {
                                 for (const auto& d : batch) {
                                   E131DataView view;
                                   if (ParseE131(d.data, d.size, view) == E131Parse::kData) {
                                     sequences.push_back(view.sequence);
                                     firstSlots.push_back(view.slots[0]);
                                   }
                                 }
                               });
    sender = network.OpenSender("lo", 1);
  }

  // A frame from A, due a few milliseconds from now.
  void Frame(uint8_t slot1, uint8_t slot2 = 0) {
    std::vector<uint8_t> levels = {slot1, slot2};
    uint32_t due = clock.TickCount() + 3;
    a.OutputDMXLevels(9, 1, 2, levels.data(), due);
    a.SendAccumulated(due);
    size_t before = firstSlots.size();
    ASSERT_TRUE(RunUntil(loop, [&] { return firstSlots.size() > before; }));
  }

  // A crafted packet from another source, to the universe's group (unicast
  // would reach only one of the sockets sharing the port).
  void Crafted(uint8_t sequence, uint8_t level, uint8_t priority = 100, uint8_t options = 0) {
    E131DataFields f;
    f.cid = {5, 5, 5, 5, 5, 5, 5, 5, 5, 5, 5, 5, 5, 5, 5, 5};
    f.universe = 9;
    f.sequence = sequence;
    f.priority = priority;
    f.options = options;
    std::vector<uint8_t> slots(4, 0);
    slots[3] = level;
    std::vector<uint8_t> bytes(E131DataPacketSize(slots.size()));
    EncodeE131Data(f, slots.data(), slots.size(), bytes.data());
    OutgoingDatagram d{bytes.data(), bytes.size(), {{239, 255, 0, 9}, port}};
    sender->Send(std::span<const OutgoingDatagram>(&d, 1));
    uint64_t before = Counted();
    ASSERT_TRUE(RunUntil(loop, [&] { return Counted() > before; }));
  }
  uint64_t Counted() {
    auto c = b.Statistics().listener;
    return c.accepted + c.ignored + c.outOfOrder + c.terminated + c.malformed;
  }

  EventLoop loop;
  SystemClock clock;
  UdpDatagramNetwork network;
  TimerfdDeadlineTimer timerA;
  TimerfdDeadlineTimer timerB;
  RecordingMessageLog log;
  ChannelIOControl a;
  ChannelIOControl b;
  uint16_t port = 0;
  std::unique_ptr<DatagramReceiver> raw;
  std::unique_ptr<DatagramSender> sender;
  std::vector<uint8_t> sequences;
  std::vector<uint8_t> firstSlots;
  std::vector<int32_t> inputs;
};

TEST_F(LoopbackControls, LevelsAndSequenceNumbersArriveAsSent) {
  for (uint8_t level : {10, 20, 30, 40}) Frame(level);
  EXPECT_THAT(firstSlots, ElementsAre(10, 20, 30, 40));
  EXPECT_THAT(sequences, ElementsAre(0, 1, 2, 3));
  EXPECT_EQ(b.Statistics().listener.accepted, 4u);
}

TEST_F(LoopbackControls, ASlotRisingOnTheSenderFiresTheRegisteredInput) {
  b.RegisterInput(3, 1, 2, "Button");
  Frame(0, 0);
  Frame(0, 255);
  Frame(0, 0);
  Frame(255, 255);
  EXPECT_THAT(inputs, ElementsAre(2, 2));  // slot 1 is not registered
}

TEST_F(LoopbackControls, CraftedPacketsMeetTheReceiverRules) {
  b.RegisterInput(3, 1, 4, "Crafted");
  Crafted(50, 0);
  Crafted(51, 255);
  EXPECT_THAT(inputs, ElementsAre(4));
  Crafted(52, 0);
  Crafted(45, 255);  // out of order
  Crafted(53, 255, 100, kE131OptionPreview);
  Crafted(54, 255, 201);
  EXPECT_THAT(inputs, ElementsAre(4));
  auto counters = b.Statistics().listener;
  EXPECT_EQ(counters.outOfOrder, 1u);
  EXPECT_EQ(counters.ignored, 2u);
  Crafted(55, 255, 100, kE131OptionTerminated);
  EXPECT_EQ(b.Statistics().listener.terminated, 1u);
  Crafted(56, 255);  // a new stream: its first levels are a baseline
  EXPECT_THAT(inputs, ElementsAre(4));
}

TEST_F(LoopbackControls, ReleaseSendsTerminatedPacketsTheListenerHonours) {
  Frame(1);
  a.ReleaseClient();
  ASSERT_TRUE(RunUntil(loop, [&] { return b.Statistics().listener.terminated == 1; }));
  EXPECT_EQ(firstSlots.size(), 4u);  // the frame and three terminated packets
}

TEST(TimerfdDeadlineTimer, FiresAtItsTickAndNotBefore) {
  EventLoop loop;
  SystemClock clock;
  TimerfdDeadlineTimer timer(loop);
  std::vector<uint32_t> fired;
  timer.SetOnDeadline([&] { fired.push_back(clock.TickCount()); });
  uint32_t due = clock.TickCount() + 20;
  timer.SetDeadline(due);
  ASSERT_TRUE(RunUntil(loop, [&] { return !fired.empty(); }));
  EXPECT_GE(static_cast<int32_t>(fired[0] - due), 0);
  // A deadline in the past fires at once; a cancelled one never.
  timer.SetDeadline(clock.TickCount() - 50);
  ASSERT_TRUE(RunUntil(loop, [&] { return fired.size() == 2; }));
  timer.SetDeadline(clock.TickCount() + 10);
  timer.Cancel();
  loop.RunFor(std::chrono::milliseconds(30));
  EXPECT_EQ(fired.size(), 2u);
}

}  // namespace
}  // namespace tav
