#include "host/HostLog.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "host/Msg.h"
#include "host/testing/TrayLinkPair.h"
#include "ports/testing/ManualClock.h"

namespace tav {
namespace {

struct FakeSequence : SequenceIdentity {
  int32_t playType = 1;
  std::string filename = "Intro.tsq";
  bool failing = false;
  int32_t PlayType() const override { return playType; }
  std::string Filename() const override {
    if (failing) throw std::runtime_error("no file name");
    return filename;
  }
  int32_t Section() const override { return 1; }
};

TEST(PlayTypeName, NamesTheSectionsAndBracketsAnyOtherNumber) {
  const char* names[] = {"Null",      "Background", "Interactive", "Startup",
                         "Animation", "Musical",    "Cleanup",     "Shutdown"};
  for (int32_t i = 0; i < 8; ++i) EXPECT_EQ(PlayTypeName(i), names[i]);
  EXPECT_EQ(PlayTypeName(8), "(8)");
  EXPECT_EQ(PlayTypeName(9), "(9)");
  EXPECT_EQ(PlayTypeName(-1), "(-1)");
}

TEST(ComposeLogLine, TimeOfDayTextAndTheSequenceWhenGiven) {
  DateTime at = DateTime::FromParts(2024, 12, 24, 8, 5, 9);
  FakeSequence seq;
  EXPECT_EQ(ComposeLogLine(at, "Show Player starting", nullptr), "08:05:09: Show Player starting");
  EXPECT_EQ(ComposeLogLine(at, "Starting", &seq), "08:05:09: Starting Background: Intro.tsq");
  seq.playType = 9;
  EXPECT_EQ(ComposeLogLine(at, "Stopping", &seq), "08:05:09: Stopping (9): Intro.tsq");
}

class HostLogTest : public ::testing::Test {
 protected:
  HostLogTest()
      : clock(DateTime::FromParts(2024, 12, 24, 18, 0, 0)), outbox(link), log(clock, outbox) {}

  // The texts of the log messages a window received, in order.
  std::vector<std::string> LogTexts(const TrayLinkPair::Window& window) {
    std::vector<std::string> texts;
    for (const auto& frame : window.Received()) {
      TAVMessage m = DecodeReceivedMessage(frame);
      EXPECT_EQ(m.MessageType(), kMsgLogText);
      texts.push_back(m.Text());
    }
    return texts;
  }

  ManualClock clock;
  TrayLinkPair link;
  TrayOutbox outbox;
  HostLog log;
};

TEST_F(HostLogTest, WithoutATrayLinesAreHeldBackInOrder) {
  log.LogMessage(1, "Show Player starting");
  clock.AdvanceMilliseconds(2000);
  log.LogMessage(3, "Cannot read show file: x.tss");
  EXPECT_EQ(log.Pending().Text(),
            "18:00:00: Show Player starting\r\n18:00:02: Cannot read show file: x.tss");
}

TEST_F(HostLogTest, WithATrayTheHeldBackTextGoesFirstAsOneMessageThenTheLine) {
  log.LogMessage(1, "a");
  log.LogMessage(2, "b");
  auto& tray = link.Connect();
  outbox.Retarget(tray.Handle());
  log.LogMessage(1, "c");
  EXPECT_EQ(LogTexts(tray),
            (std::vector<std::string>{"18:00:00: a\r\n18:00:00: b", "18:00:00: c"}));
  EXPECT_TRUE(log.Pending().IsEmpty());
  log.LogMessage(1, "d");
  EXPECT_EQ(LogTexts(tray).back(), "18:00:00: d");
  EXPECT_EQ(tray.Received().size(), 3u);
}

TEST_F(HostLogTest, TraceLinesNeverReachTheTrayNorFlushTheBuffer) {
  log.LogMessage(0, "No current show");
  EXPECT_TRUE(log.Pending().IsEmpty());
  log.LogMessage(1, "held");
  auto& tray = link.Connect();
  outbox.Retarget(tray.Handle());
  log.LogMessage(0, "Starting next show");
  log.LogMessage(-5, "Queueing");
  EXPECT_TRUE(tray.Received().empty());
  EXPECT_EQ(log.Pending().Text(), "18:00:00: held");
}

TEST_F(HostLogTest, AnEmptyTextLogsNothingEvenWithASequence) {
  FakeSequence seq;
  log.LogMessage(1, "", &seq);
  log.LogMessage(3, "");
  EXPECT_TRUE(log.Pending().IsEmpty());
}

TEST_F(HostLogTest, ASequenceThatFailsToAnswerEndsTheLineSilently) {
  FakeSequence seq;
  seq.failing = true;
  EXPECT_NO_THROW(log.LogMessage(1, "Starting", &seq));
  EXPECT_TRUE(log.Pending().IsEmpty());
}

TEST_F(HostLogTest, LinesToAVanishedTrayAreLostWithoutFailing) {
  auto& tray = link.Connect();
  outbox.Retarget(tray.Handle());
  tray.Close();
  EXPECT_NO_THROW(log.LogMessage(1, "gone"));
  EXPECT_TRUE(log.Pending().IsEmpty());
  EXPECT_TRUE(tray.Received().empty());
}

TEST_F(HostLogTest, EchoSeesEveryLineButTraceWithItsLevelAndWithoutTheTime) {
  std::vector<std::string> echoed;
  log.SetEcho([&](int32_t level, DateTime now, const std::string& text) {
    echoed.push_back(std::to_string(level) + " " + now.ToText() + " " + text);
  });
  FakeSequence seq;
  log.LogMessage(0, "Queueing", &seq);
  log.LogMessage(1, "Starting", &seq);
  auto& tray = link.Connect();
  outbox.Retarget(tray.Handle());
  log.LogMessage(3, "Cannot read show file: x");
  EXPECT_EQ(echoed,
            (std::vector<std::string>{"1 2024-12-24 18:00:00 Starting Background: Intro.tsq",
                                      "3 2024-12-24 18:00:00 Cannot read show file: x"}));
}

}  // namespace
}  // namespace tav
