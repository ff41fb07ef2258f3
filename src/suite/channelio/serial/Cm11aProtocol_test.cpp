#include "suite/channelio/serial/Cm11aProtocol.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <deque>

#include "suite/channelio/serial/testing/Cm11aModel.h"

namespace tav {
namespace {

using ::testing::ElementsAre;

const DateTime kWallClock = DateTime::FromParts(2024, 12, 24, 17, 45, 30);

// The protocol and an interface model on virtual time. Bytes each side
// writes reach the other from the harness's loop, as from the event loop.
class Cm11aHarness {
 public:
  explicit Cm11aHarness(Cm11aModelScript script = {}, Cm11aTiming timing = {})
      : protocol(timing, 1), model(std::move(script)) {
    protocol.SetWriter([this](std::span<const uint8_t> bytes) {
      if (online) toModel.emplace_back(bytes.begin(), bytes.end());
    });
    model.toHost = [this](const std::vector<uint8_t>& bytes) { toHost.push_back(bytes); };
    protocol.SetCommandSource([this] {
      std::vector<X10Transmission> next;
      if (!commands.empty()) {
        next = commands.front();
        commands.pop_front();
      }
      return next;
    });
    protocol.SetOnReceived([this](const X10Received& r) { received.push_back(r); });
    protocol.SetOnNotice([this](int32_t, const std::string& text) { notices.push_back(text); });
    protocol.SetTimeSource([] { return kWallClock; });
  }

  uint32_t Tick() const { return static_cast<uint32_t>(kTickBase + now); }

  void Command(std::vector<X10Transmission> command) {
    commands.push_back(std::move(command));
    protocol.Pump(Tick());
  }

  // Runs until `ms` have passed, delivering bytes and firing timeouts.
  void RunFor(uint64_t ms) {
    const uint64_t end = now + ms;
    for (;;) {
      while (!toModel.empty() || !toHost.empty()) {
        auto forModel = std::move(toModel);
        toModel.clear();
        for (const auto& bytes : forModel) model.FromHost(bytes, now);
        auto forHost = std::move(toHost);
        toHost.clear();
        for (const auto& bytes : forHost) protocol.OnBytes(bytes, Tick());
      }
      uint64_t next = end;
      if (auto deadline = protocol.Deadline()) {
        next = std::min<uint64_t>(next, now + static_cast<uint32_t>(*deadline - Tick()));
      }
      if (auto event = model.NextEventMs()) next = std::min(next, *event);
      now = std::max(now, next);
      protocol.OnTimer(Tick());
      model.Advance(now);
      if (now >= end && toModel.empty() && toHost.empty()) return;
    }
  }

  std::vector<std::string> Sent() const {
    std::vector<std::string> texts;
    for (const auto& t : model.Transmissions()) texts.push_back(t.Text());
    return texts;
  }

  static constexpr uint32_t kTickBase = 0xFFFFF000u;  // the tick wraps during the test
  Cm11aProtocol protocol;
  Cm11aModel model;
  bool online = true;
  uint64_t now = 0;
  std::deque<std::vector<X10Transmission>> commands;
  std::vector<std::vector<uint8_t>> toModel, toHost;
  std::vector<X10Received> received;
  std::vector<std::string> notices;
};

const std::vector<X10Transmission> kA1On = {X10Transmission::Address(1, 1),
                                            X10Transmission::Function(1, X10Function::kOn)};
const std::vector<X10Transmission> kA1Dim = {X10Transmission::Address(1, 1),
                                             X10Transmission::Function(1, X10Function::kDim, 11)};

// Whatever the interface does at whichever moment, both commands reach the
// power line exactly once, in order, and the host never confuses it.
TEST(Cm11aProtocol, CommandsGetThroughWhateverTheInterfaceDoes) {
  struct Case {
    const char* name;
    Cm11aModelScript script;
    int uploads;
    int clockSets;
  };
  auto script = [](auto setter) {
    Cm11aModelScript s;
    setter(s);
    return s;
  };
  const Case cases[] = {
      {"plain", {}, 0, 0},
      {"wrong checksum", script([](auto& s) {
         s.wrongChecksumAt = {1, 3};
       }),
       0, 0},
      {"silence", script([](auto& s) { s.silentAt = {2}; }), 0, 0},
      {"poll for a checksum", script([](auto& s) { s.pollInsteadOfChecksumAt = {1}; }), 1, 0},
      {"poll for ready", script([](auto& s) { s.pollInsteadOfReadyAt = {2}; }), 1, 0},
      {"clock for a checksum", script([](auto& s) { s.clockRequestInsteadOfChecksumAt = {3}; }), 0,
       1},
      {"clock for ready", script([](auto& s) { s.clockRequestInsteadOfReadyAt = {1}; }), 0, 1},
      {"everything", script([](auto& s) {
         s.pollInsteadOfChecksumAt = {1};
         s.wrongChecksumAt = {2, 6};
         s.clockRequestInsteadOfReadyAt = {3};
         s.pollInsteadOfReadyAt = {7};
       }),
       2, 1},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    Cm11aHarness h(c.script);
    h.Command(kA1On);
    h.Command(kA1Dim);
    h.RunFor(20000);
    EXPECT_THAT(h.Sent(), ElementsAre("A1", "A f2", "A1", "A f4 x11"));
    EXPECT_EQ(h.model.Lamp('A', 1), 11);
    EXPECT_EQ(h.model.ProtocolErrors(), 0);
    EXPECT_EQ(h.model.UploadsSent(), c.uploads);
    EXPECT_EQ(static_cast<int>(h.model.ClockSets().size()), c.clockSets);
    EXPECT_EQ(static_cast<int>(h.received.size()), c.uploads);  // each upload is "A1 A On"
    EXPECT_FALSE(h.protocol.Busy());
  }
}

TEST(Cm11aProtocol, ClockRequestIsAnsweredWithTheWallClock) {
  Cm11aHarness h;
  h.model.LosePower(0);
  h.RunFor(100);
  ASSERT_EQ(h.model.ClockSets().size(), 1u);
  EXPECT_EQ(h.model.ClockSets()[0], Cm11aSetClockMessage(kWallClock, 1));
  EXPECT_EQ(h.protocol.Counters().clockSets, 1u);
}

TEST(Cm11aProtocol, TrafficHeardOnThePowerLineIsUploadedAndDecoded) {
  Cm11aHarness h;
  h.model.Hear({0x04, 0x66, 0x6E, 0x63}, 0);  // A1 A2 A Off
  h.model.Hear({0x02, 0xE6, 0xE4, 50}, 0);    // B1 B Dim (amount 50)
  h.RunFor(100);
  ASSERT_EQ(h.received.size(), 3u);
  EXPECT_EQ(h.received[0], (X10Received{1, 1, X10Function::kOff, 0}));
  EXPECT_EQ(h.received[1], (X10Received{1, 2, X10Function::kOff, 0}));
  EXPECT_EQ(h.received[2], (X10Received{2, 1, X10Function::kDim, 50}));
  EXPECT_EQ(h.protocol.Counters().polls, 2u);
}

TEST(Cm11aProtocol, AChecksumThatLooksLikeAPollIsTakenAsTheChecksum) {
  // G1's address bytes (04 56) add up to 0x5A, the poll byte.
  Cm11aHarness h;
  h.Command({X10Transmission::Address(7, 1)});
  h.RunFor(2000);
  EXPECT_THAT(h.Sent(), ElementsAre("G1"));
  EXPECT_EQ(h.protocol.Counters().polls, 0u);
}

TEST(Cm11aProtocol, AnInterfaceThatKeepsFailingIsPausedAndReportedOnceEachWay) {
  Cm11aModelScript script;
  script.wrongChecksumAt = {1, 2, 3, 4, 5, 6, 7, 8};  // two rounds of four attempts
  Cm11aHarness h(script);
  h.Command(kA1On);
  h.RunFor(500);
  // Four attempts, then a pause of a second: nothing more meanwhile.
  EXPECT_EQ(h.model.Exchanges(), 4);
  ASSERT_EQ(h.notices.size(), 1u);
  EXPECT_THAT(h.notices[0], ::testing::HasSubstr("wrong checksum"));
  h.RunFor(1000);
  EXPECT_EQ(h.model.Exchanges(), 8);  // the second round, then a pause of two seconds
  h.RunFor(1000);
  EXPECT_EQ(h.model.Exchanges(), 8);
  h.RunFor(5000);
  EXPECT_THAT(h.Sent(), ElementsAre("A1", "A f2"));
  EXPECT_THAT(h.notices, ElementsAre(::testing::HasSubstr("wrong checksum"),
                                     "the X10 interface answers again"));
  EXPECT_EQ(h.protocol.Counters().wrongChecksums, 8u);
}

TEST(Cm11aProtocol, NothingIsSentWhileOfflineAndTheCommandStartsAgainAfter) {
  Cm11aHarness h;
  h.Command(kA1Dim);
  h.RunFor(300);  // the address is on the power line, the dim not yet
  EXPECT_THAT(h.Sent(), ElementsAre("A1"));
  h.online = false;
  h.protocol.SetOnline(false, h.Tick());
  h.RunFor(10000);
  EXPECT_THAT(h.Sent(), ElementsAre("A1"));
  h.online = true;
  h.protocol.SetOnline(true, h.Tick());
  h.RunFor(5000);
  EXPECT_THAT(h.Sent(), ElementsAre("A1", "A1", "A f4 x11"));
}

TEST(Cm11aProtocol, MacroNoticeAndStrayBytesAreSkipped) {
  Cm11aHarness h;
  h.toHost.push_back({0x5B, 0x01, 0x23, 0x55, 0xF3});
  h.RunFor(10);
  h.Command(kA1On);
  h.RunFor(2000);
  EXPECT_THAT(h.Sent(), ElementsAre("A1", "A f2"));
  EXPECT_THAT(h.notices, ElementsAre(::testing::HasSubstr("input filter failed")));
}

}  // namespace
}  // namespace tav
