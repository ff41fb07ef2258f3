#include "host/TrayMessaging.h"

#include <gtest/gtest.h>

#include "host/Msg.h"
#include "host/testing/TrayLinkPair.h"
#include "ports/testing/ManualClock.h"
#include "ports/testing/VirtualTimerService.h"
#include "support/Error.h"

namespace tav {
namespace {

using namespace std::string_literals;

std::shared_ptr<MonitoredShowEvent> Event(const std::string& file, int32_t scheduleType = 1) {
  auto event = std::make_shared<MonitoredShowEvent>();
  event->SetFilename(file);
  event->Range()->SetStartTime(DateTime::FromParts(2024, 12, 24, 18, 0, 0));
  event->Range()->SetEndTime(DateTime::FromParts(2024, 12, 24, 22, 0, 0));
  event->SetScheduleType(scheduleType);
  return event;
}

// Records what the tray asked for; answers the status questions from fields.
struct FakeHost : TrayHost {
  std::vector<std::string> calls;
  bool initialized = true;
  bool failReload = false;
  std::shared_ptr<MonitoredShowEvent> scheduled, running, next;

  void ImmediateShutdown(const std::string& szReason) override {
    calls.push_back("ImmediateShutdown:" + szReason);
  }
  void GracefulShutdown() override { calls.push_back("GracefulShutdown"); }
  void LoadSchedules() override {
    if (failReload) throw Error(53, "YearSchedule.Load", "File not found");
    calls.push_back("LoadSchedules");
  }
  void ShowOnDemand(const std::string& szSerialized) override {
    calls.push_back("ShowOnDemand:" + szSerialized);
  }
  void SetOnDemandOnly(bool value) override {
    calls.push_back(value ? "SetOnDemandOnly:true" : "SetOnDemandOnly:false");
  }
  void SimulateInput(int32_t network, int32_t unitId, int32_t inputNumber) override {
    calls.push_back("SimulateInput:" + std::to_string(network) + "," + std::to_string(unitId) +
                    "," + std::to_string(inputNumber));
  }
  bool Initialized() const override { return initialized; }
  std::shared_ptr<MonitoredShowEvent> CurrentShowEvent(DateTime) override { return scheduled; }
  std::shared_ptr<MonitoredShowEvent> RunningShowEvent() override { return running; }
  std::shared_ptr<MonitoredShowEvent> NextShowEvent(const std::shared_ptr<MonitoredShowEvent>&,
                                                    DateTime) override {
    return next;
  }
};

struct FakeSequence : SequenceIdentity {
  int32_t PlayType() const override { return 5; }
  std::string Filename() const override { return "Carol (long).tsq"; }
  int32_t Section() const override { return 4; }
};

class TrayMessagingTest : public ::testing::Test {
 protected:
  TrayMessagingTest()
      : clock(DateTime::FromParts(2024, 12, 24, 18, 30, 0)),
        outbox(link),
        log(clock, outbox),
        messaging(outbox, log, host, timers, clock) {
    clock.Follow(timers);
    link.SetOnFrame([this](const TrayFrame& f) { messaging.m_FormHook_AfterMessage(f); });
  }

  void Send(TrayLinkPair::Window& window, int32_t type, const std::string& body = "") {
    window.Send(CopyDataFrame(window.Handle(), TypedMessageText(type, body)));
  }
  // What a window received, as "type:body", and forgets it.
  std::vector<std::string> Take(TrayLinkPair::Window& window) {
    std::vector<std::string> texts;
    for (const auto& frame : window.Received()) {
      EXPECT_EQ(frame.senderHwnd, link.OwnHandle());
      EXPECT_EQ(frame.dwData, 3u);
      TAVMessage m = DecodeReceivedMessage(frame);
      texts.push_back(std::to_string(m.MessageType()) + ":" + m.Text());
    }
    window.ClearReceived();
    return texts;
  }
  // Introduces `window` as the tray and forgets what that sent.
  void Introduce(TrayLinkPair::Window& window) {
    Send(window, kMsgTrayIntroduction);
    timers.Advance(1);
    window.ClearReceived();
  }

  VirtualTimerService timers;
  ManualClock clock;
  TrayLinkPair link{500};
  TrayOutbox outbox;
  HostLog log;
  FakeHost host;
  TrayMessaging messaging;
};

TEST_F(TrayMessagingTest, TheReceiveHandlerOnlyQueuesTheTimerActs) {
  auto& tray = link.Connect();
  Send(tray, kMsgReloadSchedules);
  EXPECT_TRUE(host.calls.empty());
  EXPECT_EQ(messaging.MessageQueue().Count(), 1);
  EXPECT_TRUE(messaging.tmrTAVMsgQueue().Enabled());
  EXPECT_EQ(messaging.tmrTAVMsgQueue().Interval(), 1u);
  EXPECT_EQ(messaging.LastMessageTime(), DateTime::FromParts(2024, 12, 24, 18, 30, 0));

  timers.Advance(1);
  EXPECT_EQ(host.calls, (std::vector<std::string>{"LoadSchedules"}));
  EXPECT_EQ(messaging.MessageQueue().Count(), 0);
  EXPECT_FALSE(messaging.tmrTAVMsgQueue().Enabled());
}

TEST_F(TrayMessagingTest, EachRequestTypeReachesTheHostAndEveryOtherTypeIsIgnored) {
  const struct {
    int32_t type;
    std::string body;
    std::vector<std::string> calls;
  } cases[] = {
      {1, "ignored", {"ImmediateShutdown:Immediate shutdown requested"}},
      {5, "ignored", {"LoadSchedules"}},
      {8, "", {"GracefulShutdown"}},
      {9, "(Xmas,(F,,F,), 3,F)", {"ShowOnDemand:(Xmas,(F,,F,), 3,F)"}},
      {9, "", {"ShowOnDemand:"}},
      {11, "", {"SetOnDemandOnly:false"}},
      {20, "( 2, 5, 12)", {"SimulateInput:2,5,12"}},
  };
  auto& tray = link.Connect();
  for (const auto& c : cases) {
    host.calls.clear();
    Send(tray, c.type, c.body);
    timers.Advance(1);
    EXPECT_EQ(host.calls, c.calls) << "type " << c.type;
  }
  host.calls.clear();
  for (int32_t type : {0, 3, 4, 6, 7, 10, 12, 13, 14, 15, 19, 21, 99}) Send(tray, type, "body");
  tray.Send(TrayFrame{0, 3, "\0"s});  // an empty text: type 0
  tray.Send(TrayFrame{0, 3, "-1\0"s});
  EXPECT_EQ(messaging.MessageQueue().Count(), 15);
  timers.Advance(1);
  EXPECT_TRUE(host.calls.empty());
  EXPECT_EQ(messaging.MessageQueue().Count(), 0);
  EXPECT_FALSE(messaging.tmrTAVMsgQueue().Enabled());
  EXPECT_TRUE(tray.Received().empty());
}

TEST_F(TrayMessagingTest, ImmediateShutdownLeavesTheRestOfABurstQueued) {
  auto& tray = link.Connect();
  Send(tray, kMsgReloadSchedules);
  Send(tray, kMsgImmediateShutdown);
  Send(tray, kMsgGracefulShutdown);
  Send(tray, kMsgShowOnDemand, "x");
  timers.Advance(1);
  EXPECT_EQ(host.calls, (std::vector<std::string>{
                            "LoadSchedules", "ImmediateShutdown:Immediate shutdown requested"}));
  EXPECT_EQ(messaging.MessageQueue().Count(), 2);
  EXPECT_TRUE(messaging.tmrTAVMsgQueue().Enabled());
}

TEST_F(TrayMessagingTest, IntroductionFlushesTheLogAnnouncesReadinessAndSendsTheStatus) {
  host.scheduled = Event("Xmas");
  host.next = Event("NewYear", 2);
  log.LogMessage(1, "Show Player starting");
  log.LogMessage(1, "Schedule loaded");
  auto& tray = link.Connect();
  Send(tray, kMsgTrayIntroduction, "ignored");
  timers.Advance(1);
  EXPECT_EQ(messaging.TrayWindow(), tray.Handle());
  EXPECT_TRUE(messaging.ReadyAnnounced());
  EXPECT_EQ(Take(tray), (std::vector<std::string>{
                            "7:18:30:00: Show Player starting\r\n18:30:00: Schedule loaded",
                            "10:",
                            "4:" + host.next->Serialize(),
                            "3:" + host.scheduled->Serialize(),
                        }));
  EXPECT_TRUE(log.Pending().IsEmpty());
}

TEST_F(TrayMessagingTest, TheSameTrayAgainOnlyGetsTheStatusAgain) {
  host.scheduled = Event("Xmas");
  auto& tray = link.Connect();
  Introduce(tray);
  Send(tray, kMsgTrayIntroduction);
  timers.Advance(1);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{"4:", "3:" + host.scheduled->Serialize()}));
}

TEST_F(TrayMessagingTest, ReadinessWaitsForInitialisationAndIsAnnouncedOnce) {
  host.initialized = false;
  auto& first = link.Connect();
  Send(first, kMsgTrayIntroduction);
  timers.Advance(1);
  EXPECT_FALSE(messaging.ReadyAnnounced());
  EXPECT_EQ(Take(first), (std::vector<std::string>{"4:", "3:"}));

  host.initialized = true;
  messaging.AnnounceReadiness();
  messaging.AnnounceReadiness();
  EXPECT_EQ(Take(first), (std::vector<std::string>{"10:"}));

  // A new tray is told the status and the held-back log, not readiness again.
  auto& second = link.Connect();
  Send(second, kMsgTrayIntroduction);
  timers.Advance(1);
  EXPECT_EQ(messaging.TrayWindow(), second.Handle());
  EXPECT_EQ(Take(second), (std::vector<std::string>{"4:", "3:"}));
  EXPECT_TRUE(first.Received().empty());
}

TEST_F(TrayMessagingTest, ReadinessIsNotAnnouncedToNoTray) {
  messaging.AnnounceReadiness();
  EXPECT_FALSE(messaging.ReadyAnnounced());
}

TEST_F(TrayMessagingTest, AFailingRequestIsLoggedAndTheRestIsDrainedOnTheNextTick) {
  host.failReload = true;
  auto& tray = link.Connect();
  Send(tray, kMsgReloadSchedules);
  Send(tray, kMsgGracefulShutdown);
  timers.Advance(1);
  EXPECT_EQ(log.Pending().Text(), "18:30:00: tmrTAVMsgQueue_Timer Error: File not found");
  EXPECT_TRUE(host.calls.empty());
  EXPECT_TRUE(messaging.tmrTAVMsgQueue().Enabled());
  EXPECT_EQ(messaging.MessageQueue().Count(), 1);
  timers.Advance(1);
  EXPECT_EQ(host.calls, (std::vector<std::string>{"GracefulShutdown"}));
  EXPECT_FALSE(messaging.tmrTAVMsgQueue().Enabled());
}

TEST_F(TrayMessagingTest, AMalformedSimulatedInputIsLoggedAndTheRestStillReachesTheHost) {
  auto& tray = link.Connect();
  Send(tray, kMsgSimulateInput, "( 2, 5)");
  Send(tray, kMsgSimulateInput, "( 2,five, 12)");
  Send(tray, kMsgSimulateInput, "( 2, 5, 12)");
  timers.Advance(3);
  EXPECT_EQ(log.Pending().Text(),
            "18:30:00: tmrTAVMsgQueue_Timer Error: Unexpected number of fields in simulated "
            "input: 2\r\n"
            "18:30:00: tmrTAVMsgQueue_Timer Error: Type mismatch");
  EXPECT_EQ(host.calls, (std::vector<std::string>{"SimulateInput:2,5,12"}));
  EXPECT_FALSE(messaging.tmrTAVMsgQueue().Enabled());
}

TEST_F(TrayMessagingTest, ATextWithoutAZeroByteIsLoggedAndDropped) {
  auto& tray = link.Connect();
  tray.Send(TrayFrame{0, 3, "05reload"});
  EXPECT_EQ(log.Pending().Text(),
            "18:30:00: m_FormHook_AfterMessage Error: Invalid procedure call or argument");
  EXPECT_EQ(messaging.MessageQueue().Count(), 0);
  EXPECT_FALSE(messaging.tmrTAVMsgQueue().Enabled());
}

TEST_F(TrayMessagingTest, StatusIsSentOnlyWhenCurrentOrNextChanged) {
  auto& tray = link.Connect();
  messaging.SendStatusToTAVTray(false);  // no tray yet
  host.scheduled = Event("Xmas");
  Introduce(tray);

  messaging.SendStatusToTAVTray(false);
  EXPECT_TRUE(Take(tray).empty());

  // An equal but different object is no change.
  host.scheduled = Event("Xmas");
  messaging.SendStatusToTAVTray(false);
  EXPECT_TRUE(Take(tray).empty());

  host.next = Event("NewYear");
  messaging.SendStatusToTAVTray(false);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{"4:" + host.next->Serialize(),
                                                  "3:" + host.scheduled->Serialize()}));

  // A running show's event stands for the scheduled one.
  host.running = Event("OnDemand", 3);
  messaging.SendStatusToTAVTray(false);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{"4:" + host.next->Serialize(),
                                                  "3:" + host.running->Serialize()}));

  // The engine marks its running show as shutting down in place.
  host.running->SetShuttingDown(true);
  messaging.SendStatusToTAVTray(false);
  EXPECT_EQ(Take(tray).at(1), "3:" + host.running->Serialize());

  host.running = nullptr;
  host.scheduled = nullptr;
  host.next = nullptr;
  messaging.SendStatusToTAVTray(false);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{"4:", "3:"}));
  messaging.SendStatusToTAVTray(false);
  EXPECT_TRUE(Take(tray).empty());

  messaging.SendStatusToTAVTray(true);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{"4:", "3:"}));
}

TEST_F(TrayMessagingTest, AnEmptyEventIsNotTheSameAsNoEvent) {
  auto& tray = link.Connect();
  Introduce(tray);  // sent: none, none
  host.scheduled = std::make_shared<MonitoredShowEvent>();
  messaging.SendStatusToTAVTray(false);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{"4:", "3:" + host.scheduled->Serialize()}));
  host.scheduled = nullptr;
  messaging.SendStatusToTAVTray(false);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{"4:", "3:"}));
}

TEST_F(TrayMessagingTest, SequenceStartsAndStopsCarryFileSectionAndTime) {
  FakeSequence seq;
  messaging.SendSequenceStartToTAVTray(seq);  // no tray: lost, nothing fails
  auto& tray = link.Connect();
  Introduce(tray);
  messaging.SendSequenceStartToTAVTray(seq);
  timers.Advance(3000);
  messaging.SendSequenceStopToTAVTray(seq);
  EXPECT_EQ(Take(tray), (std::vector<std::string>{
                            "13:(Carol *Olong*C.tsq, 4,2024-12-24 18:30:00)",
                            "14:(Carol *Olong*C.tsq, 4,2024-12-24 18:30:03)",
                        }));
}

}  // namespace
}  // namespace tav
