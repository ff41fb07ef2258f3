// Playback on virtual time: the clock only moves when a test moves it.

#include "suite/seqlib/SequencePlayer.h"

#include <gtest/gtest.h>

#include "ports/testing/ManualClock.h"
#include "suite/seqlib/Sequence.h"
#include "suite/seqlib/testing/MemorySequenceLibrary.h"
#include "support/Error.h"

namespace tav {
namespace {

struct Got {
  int32_t kind;
  int64_t due;
  uint32_t dueTick;
  int32_t effect;
  int32_t start;
  int32_t duration;
  uint32_t firstLevel;

  friend bool operator==(const Got&, const Got&) = default;
};

std::ostream& operator<<(std::ostream& os, const Got& g) {
  return os << "{kind " << g.kind << " due " << g.due << " tick " << g.dueTick << " effect "
            << g.effect << " start " << g.start << " dur " << g.duration << " level "
            << g.firstLevel << "}";
}

// One channel with a set at 0, a fade at 100-300 and an off at 400; one DMX
// track of four 100 ms frames from 50 (levels 1, 2, 3, 4). Length 500.
SequenceData Sample() {
  SequenceData data;
  data.lengthMs = 500;
  data.channels.push_back({"Roof",
                           {kFamilyTAV, 1, 2, 3},
                           {{0, 0, kEffectSet, 40, 40, 0},
                            {100, 200, kEffectFade, 0, 100, 0},
                            {400, 0, kEffectOff, 0, 0, 0}}});
  data.tracks.push_back({kFamilyDMX, 1, 0, 1, 1, 50, 100, {1, 2, 3, 4}});
  return data;
}

class Playback : public ::testing::Test {
 protected:
  void SetUp() override {
    library.AddSequence("sample", Sample());
    sequence = library.CreateSequence();
    sequence->LoadFile("sample");
  }

  // Every event due now (within the lookahead).
  std::vector<Got> Drain() {
    std::vector<Got> got;
    PlayEvent e;
    while (sequence->GetEvent(e)) {
      got.push_back({e.playEventType, e.lDueTime, e.dueTick, e.effectType, e.lStartIntensity,
                     e.lDuration, e.byteIntensityBlob.empty() ? 999u : e.byteIntensityBlob[0]});
    }
    return got;
  }
  void Advance(uint32_t ms) { clock->AdvanceMilliseconds(ms); }

  std::shared_ptr<ManualClock> clock =
      std::make_shared<ManualClock>(DateTime::FromParts(2024, 12, 24), 1000);
  MemorySequenceLibrary library{clock};
  std::shared_ptr<Sequence> sequence;
};

TEST_F(Playback, EventsComeAtTheirTimesALittleEarlyWithTheirDueTick) {
  sequence->InitializeForPlay(false);
  sequence->StartPlay();
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStatePlaying);
  EXPECT_EQ(Drain(), (std::vector<Got>{{1, 0, 1000, kEffectSet, 40, 0, 999}}));
  Advance(44);
  EXPECT_TRUE(Drain().empty());
  Advance(1);  // 45: the frame due at 50 is within the 5 ms lookahead
  EXPECT_EQ(Drain(), (std::vector<Got>{{2, 50, 1050, 0, 0, 0, 1}}));
  Advance(55);  // 100
  EXPECT_EQ(Drain(), (std::vector<Got>{{1, 100, 1100, kEffectFade, 0, 200, 999}}));
  Advance(300);  // 400: late ticks still deliver everything, in order, with the old due ticks
  EXPECT_EQ(Drain(), (std::vector<Got>{{2, 150, 1150, 0, 0, 0, 2},
                                       {2, 250, 1250, 0, 0, 0, 3},
                                       {2, 350, 1350, 0, 0, 0, 4},
                                       {1, 400, 1400, kEffectOff, 0, 0, 999}}));
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStatePlaying);
  Advance(99);
  EXPECT_TRUE(Drain().empty());
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStatePlaying);
  Advance(1);  // 500: the end
  EXPECT_TRUE(Drain().empty());
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopped);
}

TEST_F(Playback, StopPassesThroughStoppingAndPutsTheLightsOutWhenAsked) {
  sequence->SetLightsOffAtEnd(true);
  sequence->InitializeForPlay(false);
  sequence->StartPlay();
  Drain();
  Advance(120);
  sequence->StopPlay();
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopping);
  auto off = Drain();
  ASSERT_EQ(off.size(), 2u);
  EXPECT_EQ(off[0], (Got{1, 120, 1120, kEffectOff, 0, 0, 999}));
  EXPECT_EQ(off[1], (Got{2, 120, 1120, 0, 0, 0, 0}));
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopped);
  sequence->StopPlay();  // stopping a stopped sequence changes nothing
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopped);
}

TEST_F(Playback, StopWithoutLightsOffStillPassesThroughStopping) {
  sequence->StartPlay();
  sequence->StopPlay();
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopping);
  EXPECT_TRUE(Drain().empty());
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopped);
}

TEST_F(Playback, ForceStopEndsAtOnce) {
  sequence->SetLightsOffAtEnd(true);
  sequence->StartPlay();
  sequence->StopPlay();
  sequence->ForceStop();
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopped);
  EXPECT_TRUE(Drain().empty());
}

TEST_F(Playback, TheNaturalEndPutsTheLightsOutWhenAsked) {
  sequence->SetLightsOffAtEnd(true);
  sequence->StartPlay();
  Advance(500);
  auto got = Drain();
  ASSERT_EQ(got.size(), 9u);  // 7 events and 2 lights-off
  EXPECT_EQ(got[7], (Got{1, 500, 1500, kEffectOff, 0, 0, 999}));
  EXPECT_EQ(got[8], (Got{2, 500, 1500, 0, 0, 0, 0}));
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStateStopped);
}

TEST_F(Playback, LoopingStartsAgainOnTheBeat) {
  sequence->SetLoopAtEnd(true);
  sequence->StartPlay();
  Advance(499);
  EXPECT_EQ(Drain().size(), 7u);
  Advance(3);  // 502: the second round began at tick 1500
  auto got = Drain();
  ASSERT_EQ(got.size(), 1u);
  EXPECT_EQ(got[0], (Got{1, 0, 1500, kEffectSet, 40, 0, 999}));
  Advance(48);  // 550
  EXPECT_EQ(Drain(), (std::vector<Got>{{2, 50, 1550, 0, 0, 0, 1}}));
  EXPECT_EQ(sequence->SequencePlayState(), SequencePlayer::kStatePlaying);
}

TEST_F(Playback, MusicDriftIsFollowedWithoutRepeats) {
  sequence->InitializeForPlay(true);
  sequence->InitMusicSync(0);
  sequence->StartPlay();
  EXPECT_EQ(Drain().size(), 1u);
  // The media runs 10% slow: at tick +100 it reports 90.
  Advance(100);
  sequence->SyncToMusic(90);
  EXPECT_EQ(Drain(), (std::vector<Got>{{2, 50, 1060, 0, 0, 0, 1}}));  // late, so due in the past
  EXPECT_TRUE(Drain().empty());  // the fade at 100 waits for the music
  Advance(5);
  EXPECT_EQ(Drain(), (std::vector<Got>{{1, 100, 1110, kEffectFade, 0, 200, 999}}));
  Advance(100);
  sequence->SyncToMusic(185);  // 195 expected: drift again, no seek
  EXPECT_EQ(Drain(), (std::vector<Got>{{2, 150, 1170, 0, 0, 0, 2}}));
  EXPECT_EQ(sequence->Position(), 185);
}

TEST_F(Playback, AMusicJumpForwardResumesWhatIsUnderWay) {
  sequence->InitializeForPlay(true);
  sequence->StartPlay();
  sequence->SyncToMusic(0);
  Drain();
  Advance(10);
  sequence->SyncToMusic(280);  // near the end of the fade
  auto got = Drain();
  ASSERT_EQ(got.size(), 2u);
  EXPECT_EQ(got[0], (Got{1, 280, 1010, kEffectFade, 90, 20, 999}));  // the rest of the fade
  EXPECT_EQ(got[1], (Got{2, 280, 1010, 0, 0, 0, 3}));                // the frame on show
  Advance(65);
  EXPECT_EQ(Drain(), (std::vector<Got>{{2, 350, 1080, 0, 0, 0, 4}}));
}

TEST_F(Playback, AMusicJumpBackwardPlaysThePartAgain) {
  sequence->InitializeForPlay(true);
  sequence->StartPlay();
  sequence->SyncToMusic(0);
  Advance(450);
  sequence->SyncToMusic(450);
  EXPECT_EQ(Drain().size(), 7u);
  Advance(1);
  sequence->SyncToMusic(60);  // the listener went back
  auto got = Drain();
  ASSERT_EQ(got.size(), 2u);
  EXPECT_EQ(got[0], (Got{1, 60, 1451, kEffectSet, 40, 0, 999}));  // the level it had at 60
  EXPECT_EQ(got[1], (Got{2, 60, 1451, 0, 0, 0, 1}));
  Advance(40);
  EXPECT_EQ(Drain(), (std::vector<Got>{{1, 100, 1491, kEffectFade, 0, 200, 999}}));
}

TEST_F(Playback, WithMediaTheSequenceWaitsForTheMusicButNotForEver) {
  sequence->InitializeForPlay(true);
  sequence->StartPlay();
  Drain();
  Advance(1000);
  EXPECT_EQ(sequence->Position(), 0);
  EXPECT_TRUE(Drain().empty());
  Advance(SequencePlayer::kMusicWaitMs - 1000 + 50);
  EXPECT_EQ(sequence->Position(), 50);
  EXPECT_EQ(Drain().size(), 1u);
}

TEST_F(Playback, SurvivesTheTickWrapping) {
  clock->SetTickCount(0xFFFFFFF0u);
  sequence->StartPlay();
  Drain();
  Advance(50);
  auto got = Drain();
  ASSERT_EQ(got.size(), 1u);
  EXPECT_EQ(got[0].due, 50);
  EXPECT_EQ(got[0].dueTick, 0xFFFFFFF0u + 50u);
}

TEST_F(Playback, LookaheadIsAdjustable) {
  sequence->SetLookaheadMs(20);
  sequence->StartPlay();
  Drain();
  Advance(30);
  EXPECT_EQ(Drain().size(), 1u);  // the frame at 50
}

// The due-time query must name exactly the moments at which GetEvent has
// something to do: walking the clock one millisecond at a time, nothing
// happens while it says "later", and something does when it says "now".
class DueTime : public Playback {
 protected:
  // Walks `ms` milliseconds; returns how many moments had work.
  int Walk(int ms) {
    int busy = 0;
    for (int t = 0; t < ms; ++t) {
      std::optional<int64_t> due = sequence->MillisecondsUntilDue();
      int32_t stateBefore = sequence->SequencePlayState();
      bool happened = !Drain().empty() || sequence->SequencePlayState() != stateBefore;
      if (!due) {
        EXPECT_EQ(stateBefore, SequencePlayer::kStateStopped) << "at +" << t;
        EXPECT_FALSE(happened) << "at +" << t;
      } else {
        EXPECT_EQ(happened, *due == 0) << "at +" << t << " due in " << *due;
      }
      busy += happened;
      Advance(1);
    }
    return busy;
  }
};

TEST_F(DueTime, NamesEveryEventAndTheEnd) {
  sequence->SetLightsOffAtEnd(true);
  sequence->StartPlay();
  // 7 moments with events (0, 45, 95, 145, 245, 345, 395) and the end at 500.
  EXPECT_EQ(Walk(600), 8);
  EXPECT_FALSE(sequence->MillisecondsUntilDue());
}

TEST_F(DueTime, FollowsLoopsAndStops) {
  sequence->SetLoopAtEnd(true);
  sequence->StartPlay();
  EXPECT_EQ(Walk(1200), 8 + 7 + 3);  // two rounds and the start of a third
  sequence->StopPlay();
  EXPECT_EQ(sequence->MillisecondsUntilDue(), 0);
  EXPECT_EQ(Walk(10), 1);
}

TEST_F(DueTime, CountsTheWaitForTheMusic) {
  sequence->InitializeForPlay(true);
  sequence->StartPlay();
  Drain();
  EXPECT_EQ(sequence->MillisecondsUntilDue(), SequencePlayer::kMusicWaitMs + 45);
  EXPECT_EQ(Walk(SequencePlayer::kMusicWaitMs + 100), 2);
  // Once the music reports, the timeline is the music's.
  sequence->SyncToMusic(300);
  EXPECT_EQ(Drain().size(), 2u);  // the rest of the fade and the frame at 300
  EXPECT_EQ(sequence->MillisecondsUntilDue(), 45);
}

TEST_F(DueTime, NothingIsDueBeforeALoadOrAfterTheEnd) {
  auto unloaded = library.CreateSequence();
  EXPECT_FALSE(unloaded->MillisecondsUntilDue());
  sequence->StartPlay();
  sequence->ForceStop();
  EXPECT_FALSE(sequence->MillisecondsUntilDue());
}

TEST(Sequence, DoesNothingBeforeALoad) {
  auto clock = std::make_shared<ManualClock>();
  Sequence sequence(clock, nullptr);
  sequence.InitializeForPlay(true);
  sequence.StartPlay();
  sequence.SyncToMusic(100);
  PlayEvent e;
  EXPECT_FALSE(sequence.GetEvent(e));
  EXPECT_EQ(sequence.SequencePlayState(), 0);
  EXPECT_FALSE(sequence.UsesTAV());
  EXPECT_EQ(sequence.MediaFilename(), "");
  EXPECT_FALSE(sequence.HasBeenExported());
  EXPECT_THROW(sequence.LoadFile("x"), Error);
}

TEST(Sequence, CompletesShellCommandsWithItsFolderAndNames) {
  auto clock = std::make_shared<ManualClock>();
  MemorySequenceLibrary library(clock);
  SequenceData data;
  data.media = "tune.ogg";
  data.shellCommand = "run-me";
  library.AddSequence("/shows/a.tseq", data);
  auto sequence = library.CreateSequence();
  sequence->LoadFile("/shows/a.tseq");
  EXPECT_EQ(sequence->ShellCommand(), "run-me");
  ShellCommand command{"run-me", "", {}};
  sequence->CompleteShellCommand(command);
  EXPECT_EQ(command.workingDirectory, "/shows");
  EXPECT_EQ(command.environment,
            (std::vector<std::pair<std::string, std::string>>{
                {"TAV_SEQUENCE_FILE", "/shows/a.tseq"}, {"TAV_MEDIA_FILE", "tune.ogg"}}));
}

}  // namespace
}  // namespace tav
