// Whole shows on virtual time: what starts and stops when, in which order,
// with which log lines, as the sections, the gates and the show switches
// decide.

#include "show/ShowPlayer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "show/TriggerFunctions.h"
#include "show/testing/ShowRig.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;

// One DMX slot on for the whole length.
SequenceData Lights(int32_t slot, int64_t lengthMs, const std::string& media = "") {
  SequenceData data;
  data.lengthMs = lengthMs;
  data.media = media;
  data.channels.push_back({"lamp", {kFamilyDMX, 1, 0, slot}, {{0, 0, kEffectSet, 100, 100, 0}}});
  return data;
}

// The verbs of a whole-show case; a table-driven test makes one per row.
class ShowBench {
 public:
  void Write(const std::string& name, int64_t lengthMs, const std::string& media = "") {
    rig.WriteSequence(name, Lights(++m_slot, lengthMs, media));
  }
  void Play(const ShowParts& parts, const std::string& file = "xmas.tsh") {
    if (!rig.player) {
      rig.Start();
      rig.timeline.Clear();  // the networks opened; other tests look at that
    }
    rig.player->SetNextShow(rig.MakeShow(file, parts));
  }
  // "<ms> <file>" of every sequence start.
  std::vector<std::string> Starts() const { return Events("log 1 Starting <"); }
  std::vector<std::string> Ends() const { return Events("log 1 Ending <"); }
  std::vector<std::string> Events(const std::string& prefix) const {
    std::vector<std::string> out;
    for (const auto& e : rig.timeline.Entries()) {
      if (e.text.compare(0, prefix.size(), prefix) != 0) continue;
      std::string file = e.text.substr(prefix.size());
      file.pop_back();  // '>'
      out.push_back(std::to_string(e.atMs) + " " + file);
    }
    return out;
  }
  // The log lines (level and text), without times.
  std::vector<std::string> LogLines() const { return rig.timeline.Texts("log "); }
  bool Logged(const std::string& text) const {
    for (const auto& line : LogLines()) {
      if (line.find(text) != std::string::npos) return true;
    }
    return false;
  }

  ShowRig rig;
  int32_t m_slot = 0;
};

class ShowTest : public ::testing::Test, public ShowBench {};

// ---- Startup types and the startup trigger ---------------------------------

TEST_F(ShowTest, StartupTypesDecideWhatWaitsForTheTrigger) {
  struct Case {
    int32_t startupType;
    bool withTrigger;
    std::vector<std::string> startsBeforeTrigger;
  };
  const Case cases[] = {
      {0, false, {"1 bg.tseq", "2 intro.tseq", "1003 main.tseq"}},
      {0, true, {"1 bg.tseq", "2 intro.tseq", "1003 main.tseq"}},  // type 0 never waits
      {1, true, {}},
      {2, true, {"1 bg.tseq"}},
      {7, true, {"1 bg.tseq", "2 intro.tseq", "1003 main.tseq"}},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.startupType);
    ShowBench t;
    t.Write("bg.tseq", 60'000);
    t.Write("intro.tseq", 1000);
    t.Write("main.tseq", 60'000);
    ShowParts parts;
    parts.background = {"bg.tseq"};
    parts.startup = {"intro.tseq"};
    parts.main = {"main.tseq"};
    parts.startupType = c.startupType;
    if (c.withTrigger) parts.startupTrigger = NewTrigger(2, 5, 1, "door");
    t.Play(parts);
    t.rig.Advance(5000);
    EXPECT_EQ(t.Starts(), c.startsBeforeTrigger);
    bool waits = c.withTrigger && (c.startupType == 1 || c.startupType == 2);
    EXPECT_EQ(t.Logged("Registering startup trigger"), c.withTrigger && c.startupType != 0);
    if (!waits) continue;
    EXPECT_THAT(t.rig.cio->RegisteredInputs(), ElementsAre("2/5/1"));
    t.rig.timeline.Clear();
    t.rig.Press(2, 5, 1, "door");
    t.rig.Advance(1500);
    // The trigger releases what waited; the startup trigger is not watched
    // again.
    std::vector<std::string> expected;
    if (c.startupType == 1) expected.push_back("5000 bg.tseq");
    expected.insert(expected.end(), {"5001 intro.tseq", "6002 main.tseq"});
    EXPECT_EQ(t.Starts(), expected);
    EXPECT_THAT(t.LogLines(), ::testing::IsSupersetOf(
                                  {"log 1 Startup trigger detected", "log 1 Clearing triggers"}));
    EXPECT_THAT(t.rig.cio->RegisteredInputs(), IsEmpty());
  }
}

TEST_F(ShowTest, AShowThatNeverGetsItsTriggerPlaysNothingAndSkipsItsShutdown) {
  Write("bg.tseq", 60'000);
  Write("main.tseq", 60'000);
  Write("bye.tseq", 1000);
  ShowParts parts;
  parts.background = {"bg.tseq"};
  parts.main = {"main.tseq"};
  parts.shutdown = {"bye.tseq"};
  parts.startupType = 1;
  parts.startupTrigger = NewTrigger(2, 5, 1, "door");
  Play(parts);
  rig.At(10'000, [&] { rig.player->SetNextShow(nullptr); });
  rig.Advance(12'000);
  EXPECT_THAT(Starts(), IsEmpty());
  EXPECT_THAT(rig.timeline.TimedTexts("log 1"),
              ElementsAre("1 log 1 Starting show: xmas.tsh", "1 log 1 Registering startup trigger",
                          "10000 log 1 Clearing triggers",
                          "10000 log 1 Current show is entering shutdown mode",
                          "10000 log 1 Finished show: xmas.tsh"));
  EXPECT_EQ(rig.player->CurrentShow(), nullptr);
}

TEST_F(ShowTest, AnEmptyStartupGoesStraightToMainMusicalAndTriggersOnTheFirstTick) {
  Write("main.tseq", 60'000);
  Write("song.tseq", 60'000, "song.mp3");
  Write("bell.tseq", 1000);
  ShowParts parts;
  parts.main = {"main.tseq"};
  parts.musical = {"song.tseq"};
  parts.groups = {rig.Group(false, false, NewTrigger(1, 1, 3, "bell"), {"bell.tseq"})};
  Play(parts);
  rig.Advance(100);
  EXPECT_THAT(rig.timeline.TimedTexts("log 1 Registering"),
              ElementsAre("1 log 1 Registering interactive triggers"));
  EXPECT_EQ(Starts(), (std::vector<std::string>{"2 main.tseq", "2 song.tseq"}));
}

// ---- Main ------------------------------------------------------------------

TEST_F(ShowTest, MainPlaysOneAtATimeInOrderAndCycles) {
  Write("a.tseq", 1000);
  Write("b.tseq", 500);
  ShowParts parts;
  parts.main = {"a.tseq", "b.tseq"};
  Play(parts);
  rig.Advance(4000);
  // Each ends on the tick its timeline reaches its length; the next is
  // queued then and starts on the following tick.
  EXPECT_EQ(Starts(), (std::vector<std::string>{"2 a.tseq", "1003 b.tseq", "1504 a.tseq",
                                                "2505 b.tseq", "3006 a.tseq"}));
}

TEST_F(ShowTest, MainAllAtOnceStartsTogetherAndLoops) {
  Write("a.tseq", 1000);
  Write("b.tseq", 500);
  ShowParts parts;
  parts.main = {"a.tseq", "b.tseq"};
  parts.animationType = 2;
  Play(parts);
  rig.Advance(4000);
  EXPECT_EQ(Starts(), (std::vector<std::string>{"2 a.tseq", "2 b.tseq"}));
  EXPECT_THAT(Ends(), IsEmpty());
  // Looping: the slot was set again at each round of b (every 500 ms).
  EXPECT_EQ(rig.cio->CountOf("OutputEffect"), 4u + 8u);
}

// ---- Musical ---------------------------------------------------------------

TEST_F(ShowTest, MusicalPiecesAreFollowedByTheirCleanUpAndThePause) {
  Write("one.tseq", 2000, "one.mp3");
  Write("two.tseq", 1000, "two.mp3");
  Write("sweep.tseq", 300);
  rig.media.Script("one.mp3", {2.0, "audio", {}, {}});
  rig.media.Script("two.mp3", {1.0, "audio", {}, {}});
  ShowParts parts;
  parts.musical = {"one.tseq", "two.tseq"};
  parts.cleanUp = "sweep.tseq";
  parts.delay = 3;
  Play(parts);
  rig.Advance(12'000);
  // The pause ends when the seconds clock reaches its whole-second end:
  // begun at 18:00:02.304, plus 3, rounded, is 18:00:05.
  EXPECT_EQ(Starts(),
            (std::vector<std::string>{"2 one.tseq", "2003 sweep.tseq", "5002 two.tseq",
                                      "6003 sweep.tseq", "9002 one.tseq", "11003 sweep.tseq"}));
  EXPECT_THAT(rig.timeline.TimedTexts("log 1 Delaying"),
              ElementsAre("2304 log 1 Delaying between Musical sequences for 3 seconds",
                          "6304 log 1 Delaying between Musical sequences for 3 seconds",
                          "11304 log 1 Delaying between Musical sequences for 3 seconds"));
  EXPECT_THAT(rig.timeline.Texts("media OpenMedia"),
              ElementsAre("media OpenMedia(one.mp3)", "media OpenMedia(two.mp3)",
                          "media OpenMedia(one.mp3)"));
}

TEST_F(ShowTest, NoPauseWhenTheDelayIsZeroOrNegative) {
  for (int32_t delay : {0, -5}) {
    SCOPED_TRACE(delay);
    ShowBench t;
    t.Write("one.tseq", 1000);
    ShowParts parts;
    parts.musical = {"one.tseq"};
    parts.delay = delay;
    t.Play(parts);
    t.rig.Advance(3500);
    EXPECT_EQ(t.Starts(), (std::vector<std::string>{"2 one.tseq", "1005 one.tseq", "2008 one.tseq",
                                                    "3011 one.tseq"}));
    EXPECT_FALSE(t.Logged("Delaying"));
  }
}

TEST_F(ShowTest, APauseEndingPastMidnightIsNeverReached) {
  // From 23:59:50, a 3 s piece ends at 23:59:53. A pause of 5 s ends at
  // 23:59:58; one of 10 s would end at 86403 s, which the clock never shows.
  for (auto [delay, restarts] : {std::pair{5, true}, std::pair{10, false}}) {
    SCOPED_TRACE(delay);
    ShowBench t;
    t.rig.clock->SetNow(DateTime::FromParts(2024, 12, 24, 23, 59, 50));
    t.Write("one.tseq", 3000);
    ShowParts parts;
    parts.musical = {"one.tseq"};
    parts.delay = delay;
    t.Play(parts);
    t.rig.Advance(60'000);
    auto starts = t.Starts();
    if (restarts) {
      ASSERT_GE(starts.size(), 3u);
      EXPECT_EQ(std::vector<std::string>(starts.begin(), starts.begin() + 3),
                (std::vector<std::string>{"2 one.tseq", "8002 one.tseq", "16002 one.tseq"}));
    } else {
      EXPECT_EQ(starts, std::vector<std::string>{"2 one.tseq"});
    }
  }
}

TEST_F(ShowTest, ShuffleWithOnePieceRepeatsIt) {
  Write("only.tseq", 1000);
  ShowParts parts;
  parts.musical = {"only.tseq"};
  parts.musicalType = 2;
  Play(parts);
  rig.Advance(2500);
  EXPECT_EQ(Starts(),
            (std::vector<std::string>{"2 only.tseq", "1005 only.tseq", "2008 only.tseq"}));
}

TEST_F(ShowTest, ShuffleWithoutReplacementPlaysEveryPieceBeforeARepeatAndNeverBackToBack) {
  Write("m1.tseq", 1000);
  Write("m2.tseq", 1000);
  Write("m3.tseq", 1000);
  // Draws: m1, m2, m3 empty the pool; after the refill 0.9 would pick m3
  // again, back to back, so it is drawn again (0.0: m1).
  std::vector<double> draws{0.0, 0.0, 0.0, 0.9, 0.0, 0.5, 0.0};
  size_t next = 0;
  rig.random = [&] { return draws.at(next++); };
  ShowParts parts;
  parts.musical = {"m1.tseq", "m2.tseq", "m3.tseq"};
  parts.musicalType = 2;
  Play(parts);
  rig.Advance(5500);
  EXPECT_EQ(Starts(), (std::vector<std::string>{"2 m1.tseq", "1005 m2.tseq", "2008 m3.tseq",
                                                "3011 m1.tseq", "4014 m3.tseq", "5017 m2.tseq"}));
  EXPECT_EQ(next, 7u);
}

TEST_F(ShowTest, AMusicalPieceThatFailsToStartIsFollowedAtOnceByTheNext) {
  rig.WriteFile("bad.tseq", "{ not a sequence");
  Write("good.tseq", 1000);
  Write("sweep.tseq", 300);
  ShowParts parts;
  parts.musical = {"bad.tseq", "good.tseq"};
  parts.cleanUp = "sweep.tseq";
  parts.delay = 30;
  Play(parts);
  rig.Advance(1000);
  EXPECT_EQ(Starts(), (std::vector<std::string>{"3 good.tseq"}));
  auto errors = rig.timeline.TimedTexts("log 3");
  ASSERT_EQ(errors.size(), 1u);
  EXPECT_THAT(errors[0], HasSubstr("2 log 3 ERROR WITH SEQUENCE ("));
  EXPECT_THAT(errors[0], HasSubstr("bad.tseq"));
  // The next time round it is not tried again: its error stands.
  rig.Advance(40'000);
  EXPECT_EQ(rig.timeline.Texts("log 1 Loading sequence: bad.tseq").size(), 1u);
}

// ---- Switching shows -------------------------------------------------------

TEST_F(ShowTest, WindingDownLetsTheMusicalPieceFinishWhileMainGoesOn) {
  Write("main.tseq", 1000);
  Write("song.tseq", 5000, "song.mp3");
  Write("bye.tseq", 500);
  rig.media.Script("song.mp3", {5.0, "audio", {}, {}});
  ShowParts parts;
  parts.main = {"main.tseq"};
  parts.musical = {"song.tseq"};
  parts.shutdown = {"bye.tseq"};
  Play(parts);
  rig.At(2500, [&] { rig.player->SetNextShow(nullptr); });
  rig.Advance(8000);
  EXPECT_EQ(Starts(), (std::vector<std::string>{"2 main.tseq", "2 song.tseq", "1003 main.tseq",
                                                "2004 main.tseq", "3005 main.tseq",
                                                "4006 main.tseq", "5003 bye.tseq"}));
  EXPECT_THAT(rig.timeline.TimedTexts("log 1 Stopping"),
              ElementsAre("5002 log 1 Stopping <main.tseq>"));
  EXPECT_THAT(rig.timeline.TimedTexts("log 1 Finished"),
              ElementsAre("5503 log 1 Finished show: xmas.tsh"));
}

TEST_F(ShowTest, TheSameShowOverAChangedRangeRunsOnUndisturbed) {
  Write("main.tseq", 60'000);
  ShowParts parts;
  parts.main = {"main.tseq"};
  Play(parts);
  rig.Advance(1000);
  rig.timeline.Clear();
  DateTime from = DateTime::FromParts(2024, 12, 24, 18, 0, 0);
  // Offered again as it is: nothing at all.
  rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts, from, 240));
  rig.Advance(1000);
  EXPECT_THAT(rig.timeline.Entries(), IsEmpty());
  // A longer range: the running show takes it, and plays on.
  rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts, from, 300));
  rig.Advance(1000);
  EXPECT_THAT(rig.timeline.Texts(), ElementsAre("log 1 Current show's time range has changed"));
  EXPECT_EQ(rig.player->CurrentShow()->Monitoring()->Range()->EndTime(), from.AddSeconds(300 * 60));
  EXPECT_EQ(rig.player->NextShow(), nullptr);
}

TEST_F(ShowTest, OtherOffersWindTheShowDown) {
  struct Case {
    std::string name;
    std::string file;
    int32_t scheduleType;
    int startMinutes;
    bool otherContents;
    std::vector<std::string> lines;
  };
  const std::vector<std::string> shutdown{"log 1 Current show is entering shutdown mode",
                                          "log 1 Stopping <main.tseq>"};
  std::vector<std::string> changed{"log 1 Current show's contents have changed"};
  changed.insert(changed.end(), shutdown.begin(), shutdown.end());
  const Case cases[] = {
      {"other contents", "xmas.tsh", 1, 0, true, changed},
      {"other file", "later.tsh", 1, 0, false, shutdown},
      {"other schedule", "xmas.tsh", 2, 0, false, shutdown},
      {"starts after the current one ends", "xmas.tsh", 1, 240, false, shutdown},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    ShowBench t;
    t.Write("main.tseq", 60'000);
    t.Write("other.tseq", 60'000);
    ShowParts parts;
    parts.main = {"main.tseq"};
    t.Play(parts);
    t.rig.Advance(1000);
    t.rig.timeline.Clear();
    ShowParts offered = parts;
    if (c.otherContents) offered.main = {"other.tseq"};
    DateTime from = DateTime::FromParts(2024, 12, 24, 18, 0, 0).AddSeconds(c.startMinutes * 60);
    t.rig.player->SetNextShow(t.rig.MakeShow(c.file, offered, from, 240, c.scheduleType));
    t.rig.Advance(1);
    auto lines = t.rig.timeline.Texts("log 1");
    lines.resize(std::min(lines.size(), c.lines.size()));
    EXPECT_EQ(lines, c.lines);
  }
}

TEST_F(ShowTest, ANextShowWrittenTwiceDuringShutdownWindsDownOnceAndTheLastOneStarts) {
  Write("main.tseq", 60'000);
  Write("bye.tseq", 2000);
  Write("b.tseq", 60'000);
  Write("c.tseq", 60'000);
  ShowParts parts;
  parts.main = {"main.tseq"};
  parts.shutdown = {"bye.tseq"};
  Play(parts);
  ShowParts b, c;
  b.main = {"b.tseq"};
  c.main = {"c.tseq"};
  rig.At(1000, [&] { rig.player->SetNextShow(rig.MakeShow("b.tsh", b)); });
  rig.At(1500, [&] { rig.player->SetNextShow(rig.MakeShow("c.tsh", c)); });
  rig.Advance(5000);
  EXPECT_EQ(rig.timeline.Texts("log 1 Current show is entering").size(), 1u);
  EXPECT_EQ(Starts(), (std::vector<std::string>{"2 main.tseq", "1001 bye.tseq", "3003 c.tseq"}));
  EXPECT_EQ(rig.player->CurrentShow()->Monitoring()->Filename(), "c.tsh");
}

TEST_F(ShowTest, AnEmptyNextShowLeavesTheEngineIdleWithItsTimerOff) {
  Write("main.tseq", 60'000);
  ShowParts parts;
  parts.main = {"main.tseq"};
  Play(parts);
  rig.At(1000, [&] { rig.player->SetNextShow(nullptr); });
  rig.Advance(3000);
  EXPECT_EQ(rig.player->CurrentShow(), nullptr);
  EXPECT_FALSE(rig.tmrShowPlayer->Enabled());
  EXPECT_EQ(rig.host.RestartChecks(), 2);
  uint64_t ticks = rig.timers.TicksFired("tmrShowPlayer");
  rig.Advance(60'000);
  EXPECT_EQ(rig.timers.TicksFired("tmrShowPlayer"), ticks);
}

// ---- Media -----------------------------------------------------------------

TEST_F(ShowTest, ASequenceWhoseMediaStopsEndsOnTheSameTick) {
  Write("song.tseq", 10'000, "song.mp3");
  rig.media.Script("song.mp3", {10.0, "audio", {}, 4.321});
  ShowParts parts;
  parts.musical = {"song.tseq"};
  parts.delay = 100;
  Play(parts);
  rig.Advance(6000);
  EXPECT_EQ(Ends(), (std::vector<std::string>{"4323 song.tseq"}));
}

TEST_F(ShowTest, TheMusicStopsWithItsLightsWhenTheShowEnds) {
  Write("song.tseq", 10'000, "song.mp3");
  rig.media.Script("song.mp3", {60.0, "audio", {}, {}});
  ShowParts parts;
  parts.musical = {"song.tseq"};
  Play(parts);
  rig.Advance(1000);
  // The show is replaced by one with contents of its own: the musical piece
  // finishes first, as its sequence is 10 s long; the media plays on past
  // it and is stopped when the sequence ends.
  rig.player->SetNextShow(nullptr);
  rig.Advance(15'000);
  EXPECT_THAT(rig.timeline.TimedTexts("media Stop"), ElementsAre("10002 media Stop()"));
  EXPECT_EQ(rig.media.PlayState(), kMediaStopped);
}

// ---- Failures --------------------------------------------------------------

TEST_F(ShowTest, AFailingOutputIsReportedOnceAndTheShowGoesOn) {
  SequenceData data;
  data.lengthMs = 1000;
  data.channels.push_back({"lamp",
                           {kFamilyDMX, 1, 0, 1},
                           {{0, 0, kEffectSet, 100, 100, 0}, {500, 0, kEffectOff, 0, 0, 0}}});
  rig.WriteSequence("a.tseq", data);
  ShowParts parts;
  parts.main = {"a.tseq"};
  Play(parts);
  rig.cio->FailNext("OutputEffect", 8010, "network down");
  rig.Advance(2500);
  EXPECT_THAT(rig.timeline.TimedTexts("log 3"),
              ElementsAre("2 log 3 ServicePlayingSequence Error: network down <a.tseq>"));
  // The failed set is lost; the rest of the sequence plays, and Main goes on.
  // (An event is handed over 5 ms before it is due.)
  EXPECT_THAT(rig.timeline.TimedTexts("cio OutputEffect"),
              ElementsAre("2 cio OutputEffect(7, 1, 0, 1, lamp, 1, 0, 100, 100, 0) failed @2",
                          "497 cio OutputEffect(7, 1, 0, 1, lamp, 0, 0, 0, 0, 0) @502",
                          "1003 cio OutputEffect(7, 1, 0, 1, lamp, 1, 0, 100, 100, 0) @1003",
                          "1498 cio OutputEffect(7, 1, 0, 1, lamp, 0, 0, 0, 0, 0) @1503",
                          "2004 cio OutputEffect(7, 1, 0, 1, lamp, 1, 0, 100, 100, 0) @2004",
                          "2499 cio OutputEffect(7, 1, 0, 1, lamp, 0, 0, 0, 0, 0) @2504"));
}

TEST_F(ShowTest, ASequenceFileThatDoesNotExistIsReportedAndTheSectionGoesOn) {
  Write("ok.tseq", 1000);
  ShowParts parts;
  parts.main = {"missing.tseq", "ok.tseq"};
  Play(parts);
  rig.Advance(1500);
  EXPECT_THAT(rig.timeline.Texts("log 1 Checking"),
              ElementsAre("log 1 Checking Q7 sequence: missing.tseq"));
  EXPECT_THAT(rig.timeline.Texts("host playback"),
              ElementsAre("host playback file for missing.tseq: none"));
  EXPECT_THAT(Starts(), ::testing::Contains(::testing::HasSubstr("ok.tseq")));
}

TEST_F(ShowTest, AMediaFileThatCannotBePlayedIsReportedAndItsPieceEnds) {
  Write("song.tseq", 10'000, "song.mp3");
  rig.media.Script("song.mp3", {10.0, "audio", {"File not found", "No decoder"}, {}});
  ShowParts parts;
  parts.musical = {"song.tseq"};
  parts.delay = 60;
  Play(parts);
  rig.Advance(100);
  EXPECT_THAT(rig.timeline.TimedTexts("log"),
              ElementsAre("1 log 1 Starting show: xmas.tsh", "2 log 1 Loading sequence: song.tseq",
                          "2 log 1 Starting <song.tseq>",
                          "2 log 3 WINDOWS MEDIA PLAYER ERROR (Error playing media file: File not "
                          "found / No decoder):  <song.tseq>",
                          "3 log 1 Ending <song.tseq>",
                          "4 log 1 Delaying between Musical sequences for 60 seconds"));
}

}  // namespace
}  // namespace tav
