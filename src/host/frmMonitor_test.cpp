#include "host/frmMonitor.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "config/LibRegistry.h"
#include "host/Msg.h"
#include "host/testing/HostRig.h"
#include "show/ShowPlayer.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;

constexpr int kSecond = 1000;

// A rig with one show, xmas.show (Startup hello, Main main, Shutdown bye),
// scheduled for the next hour, and optionally a second show, quiet.show.
class FormTest : public ::testing::Test {
 protected:
  FormTest() {
    rig.WriteSequence("hello.tseq", 2 * kSecond);
    rig.WriteSequence("main.tseq", 10 * kSecond);
    rig.WriteSequence("bye.tseq", 2 * kSecond);
    rig.WriteSequence("bell.tseq", 1 * kSecond);
    rig.WriteShow("xmas.show",
                  HostRig::ShowText({.startup = {"hello.tseq"},
                                     .main = {"main.tseq"},
                                     .shutdown = {"bye.tseq"},
                                     .groups = "(( 1,Door,F,T,F,Bell,((bell.tseq,( 1,button, 1, "
                                               "1))),T))"}));
    rig.WriteShow("quiet.show", HostRig::ShowText({.main = {"main.tseq"}}));
  }

  void ScheduleXmasForAnHour() {
    rig.WriteWeekSchedule({{"xmas.show", rig.start, rig.start.AddSeconds(3600)}});
  }
  // A serialised show on demand for `file` from `from` on (open-ended).
  static std::string OnDemand(const std::string& file, std::optional<DateTime> from = {}) {
    MonitoredShowEvent event;
    event.SetFilename(file);
    event.SetScheduleType(3);
    if (from) event.Range()->SetStartTime(*from);
    return event.Serialize();
  }
  bool PlayingShow(const std::string& file) { return rig.CurrentShowFile() == file; }

  HostRig rig;
};

TEST_F(FormTest, LoadsInOrderAndStartsNoShowDuringTheFirstFourSeconds) {
  ScheduleXmasForAnHour();
  rig.Load();
  EXPECT_THAT(std::vector<std::string>(rig.Lines().begin(), rig.Lines().begin() + 2),
              ElementsAre("1 Show Player starting", "1 Schedule loaded"));
  EXPECT_THAT(rig.cio->CallTexts({"SetupClient"}), ElementsAre(HasSubstr("Show Player")));
  EXPECT_TRUE(rig.form->tmCIODelay().Enabled());
  EXPECT_FALSE(rig.form->tmNextAction().Enabled());

  ASSERT_TRUE(rig.AdvanceUntil([&] { return rig.HasCurrentShow(); }, 10 * kSecond));
  // The start-up delay is 4 s; the first next-show step comes a second later.
  EXPECT_GE(rig.NowMs(), 5 * kSecond);
  EXPECT_LE(rig.NowMs(), 5 * kSecond + 2);
  EXPECT_TRUE(rig.form->Initialized());
  EXPECT_TRUE(rig.Logged("Show Player initialized"));
  EXPECT_TRUE(rig.Logged("Starting show: xmas.show"));
  EXPECT_TRUE(rig.form->ShowLoadedSinceStart());
  // The lights-active keep-alive runs every second from creation on.
  EXPECT_EQ(rig.cio->CountOf("SetLightsActive"), 5u);
}

TEST_F(FormTest, OnlyTheExactCommandLineMeansOnDemandOnly) {
  const struct {
    std::string commandLine;
    bool onDemandOnly;
  } cases[] = {
      {"/noschedule", true},  {"/noschedule ", false},  {" /noschedule", false},
      {"/NOSCHEDULE", false}, {"/noschedule x", false}, {"", false},
  };
  for (const auto& c : cases) {
    HostRig rig;
    rig.WriteSequence("main.tseq", 10 * kSecond);
    rig.WriteShow("xmas.show", HostRig::ShowText({.main = {"main.tseq"}}));
    rig.WriteWeekSchedule({{"xmas.show", rig.start, rig.start.AddSeconds(3600)}});
    rig.Load(c.commandLine);
    rig.Advance(10 * kSecond);
    EXPECT_EQ(rig.form->OnDemandOnly(), c.onDemandOnly) << "\"" << c.commandLine << "\"";
    EXPECT_EQ(rig.Logged("Show Player starting (for on demand shows)"), c.onDemandOnly);
    EXPECT_EQ(rig.HasCurrentShow(), !c.onDemandOnly) << "\"" << c.commandLine << "\"";
  }
}

TEST_F(FormTest, OnDemandOnlyIdlesUntilTheTrayTurnsTheSchedulesOn) {
  ScheduleXmasForAnHour();
  rig.Load("/noschedule");
  rig.Advance(30 * kSecond);
  EXPECT_FALSE(rig.HasCurrentShow());
  EXPECT_EQ(rig.cio->CountOf("OutputEffect"), 0u);

  rig.Request(kMsgLeaveOnDemandOnly);
  uint64_t asked = rig.NowMs();
  ASSERT_TRUE(rig.AdvanceUntil([&] { return PlayingShow("xmas.show"); }, 2 * kSecond));
  EXPECT_LE(rig.NowMs() - asked, 1001u);
}

TEST_F(FormTest, AShowOnDemandCountsOnlyOnceItsRangeHoldsTheTime) {
  ScheduleXmasForAnHour();
  rig.Load();
  rig.Advance(6 * kSecond);
  ASSERT_TRUE(PlayingShow("xmas.show"));

  rig.Request(kMsgShowOnDemand, OnDemand("quiet.show", rig.start.AddSeconds(60)));
  rig.Advance(1);
  EXPECT_TRUE(rig.Logged("Request for show on demand received: quiet.show"));
  rig.Advance(50 * kSecond);
  EXPECT_TRUE(PlayingShow("xmas.show")) << "the show on demand is not due before 18:01";
  EXPECT_EQ(rig.CountLogged("Current show is entering shutdown mode"), 0);

  ASSERT_TRUE(rig.AdvanceUntil([&] { return PlayingShow("quiet.show"); }, 30 * kSecond, 10));
  EXPECT_TRUE(rig.Logged("Finished show: xmas.show"));

  rig.Request(kMsgShowOnDemand, OnDemand(""));
  rig.Advance(1);
  EXPECT_TRUE(rig.Logged("Request to clear show on demand received"));
  EXPECT_EQ(rig.form->OnDemandEvent(), nullptr);
  ASSERT_TRUE(rig.AdvanceUntil([&] { return PlayingShow("xmas.show"); }, 30 * kSecond, 10));
}

TEST_F(FormTest, GracefulShutdownWithoutAShowUnloadsAtOnce) {
  rig.WriteWeekSchedule({});
  rig.Load();
  rig.Advance(6 * kSecond);
  rig.Request(kMsgGracefulShutdown);
  rig.Advance(1);
  EXPECT_EQ(rig.unloads, 1);
  EXPECT_EQ(rig.form->End(), HostEnd::kAsked);
  EXPECT_THAT(std::vector<std::string>(rig.Lines().end() - 2, rig.Lines().end()),
              ElementsAre("1 Graceful shutdown requested", "1 Show Player shutting down"));
  // The control is released last, after the video form went.
  EXPECT_EQ(rig.cio->Calls().back().method, "ReleaseClient");
  EXPECT_FALSE(rig.media.FormShown());
}

TEST_F(FormTest, GracefulShutdownLetsTheShowPlayItsShutdownSectionFirst) {
  ScheduleXmasForAnHour();
  rig.Load();
  ASSERT_TRUE(rig.AdvanceUntil(
      [&] { return rig.Logged("Starting Animation: Sequences/main.tseq"); }, 20 * kSecond));
  rig.form->RequestGracefulShutdown();  // what SIGTERM does
  rig.Advance(1);
  EXPECT_TRUE(rig.form->GracefulShutdownPending());
  EXPECT_EQ(rig.unloads, 0);

  ASSERT_TRUE(rig.AdvanceUntil([&] { return !rig.HasCurrentShow(); }, 30 * kSecond));
  uint64_t finished = rig.NowMs();
  EXPECT_TRUE(rig.Logged("Starting Shutdown: Sequences/bye.tseq"));
  EXPECT_TRUE(rig.Logged("Finished show: xmas.show"));
  ASSERT_TRUE(rig.AdvanceUntil([&] { return rig.unloads == 1; }, 1 * kSecond));
  EXPECT_LE(rig.unloadedAtMs - finished, 100u);
  // The next-show step stays idle meanwhile: the schedule's show is not
  // offered again.
  EXPECT_EQ(rig.CountLogged("Starting show: xmas.show"), 1);
}

TEST_F(FormTest, ImmediateShutdownDoesNotLetTheShowFinish) {
  ScheduleXmasForAnHour();
  rig.Load();
  rig.Advance(6 * kSecond);
  ASSERT_TRUE(rig.HasCurrentShow());
  rig.Request(kMsgImmediateShutdown);
  rig.Advance(2);
  EXPECT_EQ(rig.unloads, 1);
  EXPECT_TRUE(rig.Logged("Immediate shutdown requested"));
  EXPECT_FALSE(rig.Logged("Finished show: xmas.show"));
  EXPECT_FALSE(rig.Logged("Starting Shutdown: Sequences/bye.tseq"));
  EXPECT_EQ(rig.form->Engine(), nullptr);
}

TEST_F(FormTest, AnUnreadableShowFileIsLoggedAndTheRunningShowWindsDown) {
  ScheduleXmasForAnHour();
  rig.Load();
  rig.Advance(6 * kSecond);
  ASSERT_TRUE(PlayingShow("xmas.show"));
  rig.WriteShow("xmas.show", "(this is no show");
  rig.Advance(kSecond);
  EXPECT_TRUE(rig.Logged("Cannot read show file: xmas.show"));
  EXPECT_THAT(rig.Lines(), ::testing::Contains("3 Cannot read show file: xmas.show"));
  ASSERT_TRUE(rig.AdvanceUntil([&] { return !rig.HasCurrentShow(); }, 30 * kSecond));
  EXPECT_TRUE(rig.Logged("Finished show: xmas.show"));
  rig.Advance(5 * kSecond);
  EXPECT_FALSE(rig.HasCurrentShow());
}

TEST_F(FormTest, AMissingShowFileIsLoggedAndNoShowStarts) {
  rig.WriteWeekSchedule({{"gone.show", rig.start, rig.start.AddSeconds(3600)}});
  rig.Load();
  rig.Advance(7 * kSecond);
  EXPECT_FALSE(rig.HasCurrentShow());
  EXPECT_GE(rig.CountLogged("Cannot read show file: gone.show"), 2);
}

TEST_F(FormTest, GrownMemoryEndsAnIdlePlayerForARestartOnceTheStartIsFiveMinutesPast) {
  rig.WriteWeekSchedule({});
  rig.memory->Set(200 * 1024 * 1024);
  rig.Load();
  rig.Advance(299 * kSecond);
  EXPECT_EQ(rig.unloads, 0);
  ASSERT_TRUE(rig.AdvanceUntil([&] { return rig.unloads == 1; }, 3 * kSecond));
  EXPECT_EQ(rig.form->End(), HostEnd::kRestart);
  EXPECT_THAT(
      std::vector<std::string>(rig.Lines().end() - 2, rig.Lines().end()),
      ElementsAre("1 Show Player shutting down for restart", "1 Show Player shutting down"));
}

TEST_F(FormTest, AShowPlayedSinceTheStartEndsTheRestartSuppressionEarly) {
  rig.WriteWeekSchedule({{"quiet.show", rig.start, rig.start.AddSeconds(20)}});
  rig.memory->Set(200 * 1024 * 1024);
  rig.Load();
  ASSERT_TRUE(rig.AdvanceUntil([&] { return rig.unloads == 1; }, 60 * kSecond, 10));
  EXPECT_TRUE(rig.Logged("Finished show: quiet.show"));
  EXPECT_EQ(rig.form->End(), HostEnd::kRestart);
  EXPECT_LT(rig.NowMs(), 60u * kSecond);
}

TEST_F(FormTest, APortHeldByAnotherProgramGivesThe8005TextAndUnloads) {
  ScheduleXmasForAnHour();
  rig.cio->FailNext("SetupClient", kErrorPortAlreadyOpen, "The comm port is already open");
  rig.Load();
  EXPECT_THAT(rig.messageBoxes, ElementsAre(frmMonitor::kText8005));
  EXPECT_EQ(rig.unloads, 1);
  EXPECT_EQ(rig.form->End(), HostEnd::kShowsNotEnabled);
  EXPECT_TRUE(rig.Logged(frmMonitor::kText8005));
  rig.Advance(10 * kSecond);
  EXPECT_FALSE(rig.HasCurrentShow());
}

TEST_F(FormTest, AnyOtherLoadFailureGivesTheGenericTextAndTheLaterStepsStillRan) {
  rig.Write("weeksched.tsc", "((100,2,(, 0,a),50),(120,2,(, 0,b),60))\r\n");  // overlapping
  rig.Load();
  ASSERT_EQ(rig.messageBoxes.size(), 1u);
  EXPECT_EQ(rig.messageBoxes[0],
            "Shows cannot be enabled because of an error.Can't add event -- event "
            "conflict/Schedule.AddShowEvent");
  // Loading went on after the schedule failed: the engine was made and the
  // control's client set up before the failure was examined.
  EXPECT_EQ(rig.cio->CountOf("SetupClient"), 1u);
  EXPECT_EQ(rig.cio->Calls().back().method, "ReleaseClient");
  EXPECT_EQ(rig.form->End(), HostEnd::kShowsNotEnabled);
}

TEST_F(FormTest, TheLastFailureOfTheLoadIsTheOneExamined) {
  rig.Write("weeksched.tsc", "((100,2,(, 0,a),50),(120,2,(, 0,b),60))\r\n");
  rig.cio->FailNext("SetupClient", kErrorPortAlreadyOpen, "busy");
  rig.Load();
  EXPECT_THAT(rig.messageBoxes, ElementsAre(frmMonitor::kText8005));
}

TEST_F(FormTest, LogLinesGoToStandardErrorOnlyWhileNoTrayIsConnected) {
  rig.WriteWeekSchedule({});
  rig.Load();
  size_t before = rig.Lines().size();
  TrayLinkPair::Window& tray = rig.ConnectTray();
  rig.Advance(5 * kSecond);  // "Show Player initialized" goes to the tray only
  EXPECT_EQ(rig.Lines().size(), before);
  std::vector<std::string> texts;
  for (const TrayFrame& frame : tray.Received())
    texts.push_back(DecodeReceivedMessage(frame).Text());
  EXPECT_THAT(texts, ::testing::Contains(HasSubstr("Show Player initialized")));
  EXPECT_THAT(texts, ::testing::Contains(HasSubstr("Show Player starting")));  // held back

  tray.Close();
  rig.Request(kMsgReloadSchedules);
  rig.Advance(1);
  EXPECT_EQ(rig.Lines().back(), "1 Schedule loaded");
}

TEST_F(FormTest, ASimulatedInputFiresTheInteractiveGroupAsTheHardwareWould) {
  ScheduleXmasForAnHour();
  rig.Load();
  ASSERT_TRUE(rig.AdvanceUntil([&] { return rig.Logged("Registering interactive triggers"); },
                               20 * kSecond));
  rig.Request(kMsgSimulateInput, SimulatedInputText({1, 1, 2}));  // nobody listens to input 2
  rig.Advance(10);
  EXPECT_FALSE(rig.Logged("Starting Interactive: Sequences/bell.tseq"));
  rig.Request(kMsgSimulateInput, SimulatedInputText({1, 1, 1}));
  rig.Advance(10);
  EXPECT_TRUE(rig.Logged("Starting Interactive: Sequences/bell.tseq"));
}

TEST_F(FormTest, ANetworkSettingsChangeReachesTheEngine) {
  SetStringSetting(rig.registry, "Ver", "Network", "one");
  rig.WriteWeekSchedule({});
  rig.Load();
  rig.Advance(2 * kSecond);
  EXPECT_EQ(rig.networkPreferencesApplied, 1);
  SetStringSetting(rig.registry, "Ver", "Network", "two");
  rig.Advance(2 * kSecond);
  EXPECT_TRUE(rig.Logged("A Network Config Registry Change was detected"));
  EXPECT_TRUE(rig.Logged("No actual network changes detected"));
  // The composition root hears of it, to place FSEQ channels anew.
  EXPECT_EQ(rig.networkPreferencesApplied, 2);
}

TEST_F(FormTest, APlaybackFileIsLoggedWithWhatWasChosen) {
  rig.WriteWeekSchedule({});
  rig.Load();
  rig.WriteSequence("carol.tseq", kSecond);
  std::string chosen = rig.form->CreatePlaybackFileIfNeeded("carol.fseq");
  EXPECT_THAT(chosen, HasSubstr("carol.tseq"));
  EXPECT_EQ(rig.form->CreatePlaybackFileIfNeeded("nothing-like-it.fseq"), "");
  EXPECT_THAT(rig.Lines().back(), HasSubstr("3 Create playback file error: "));
}

}  // namespace
}  // namespace tav
