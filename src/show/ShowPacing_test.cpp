// The engine sleeps until something can happen instead of ticking every
// millisecond. Nothing a show does may differ: the same show, run both ways
// on virtual time, must leave the same record, line for line and
// millisecond for millisecond.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>

#include "show/ShowPlayer.h"
#include "show/TriggerFunctions.h"
#include "show/testing/ShowRig.h"

namespace tav {
namespace {

// Levels for `count` DMX slots at 40 frames a second, changing every frame.
SequenceData Frames(int32_t universe, int32_t firstSlot, int32_t count, int64_t lengthMs,
                    const std::string& media = "") {
  SequenceData data;
  data.lengthMs = lengthMs;
  data.media = media;
  LevelTrack track;
  track.family = kFamilyDMX;
  track.network = universe;
  track.firstAddress = firstSlot;
  track.count = count;
  track.stepMs = 25;
  for (int64_t frame = 0; frame < lengthMs / 25; ++frame) {
    for (int32_t slot = 0; slot < count; ++slot) {
      track.levels.push_back(static_cast<uint8_t>((frame * 7 + slot * 3) % 256));
    }
  }
  data.tracks.push_back(track);
  return data;
}

// A few effects at odd moments, on several families.
SequenceData Effects(int32_t circuit, int32_t lengthMs, const std::string& media = "") {
  SequenceData data;
  data.lengthMs = lengthMs;
  data.media = media;
  data.channels.push_back({"roof",
                           {kFamilyTAV, 1, 2, circuit},
                           {{0, 0, kEffectSet, 100, 100, 0},
                            {lengthMs / 3, lengthMs / 3, kEffectFade, 100, 10, 0},
                            {lengthMs - 7, 0, kEffectOff, 0, 0, 0}}});
  data.channels.push_back(
      {"flood", {kFamilyDMX, 4, 0, circuit}, {{lengthMs / 2 + 3, 500, kEffectFade, 0, 80, 0}}});
  return data;
}

std::vector<std::string> RunShow(ShowPlayer::Pacing pacing, uint64_t* ticks) {
  ShowRig rig;
  rig.host.SetRecordTrace(true);
  rig.WriteSequence("bg.tseq", Frames(1, 1, 8, 1500));
  rig.WriteSequence("intro.tseq", Effects(1, 1200));
  rig.CopyTestData("fseq/v2_zstd.fseq", "tree.fseq");  // 10 s, 3 universes
  rig.WriteSequence("arch.tseq", Effects(2, 2600));
  rig.WriteSequence("song1.tseq", Frames(2, 1, 4, 3000, "song1.mp3"));
  rig.WriteSequence("song2.tseq", Effects(3, 2500, "song2.mp3"));
  rig.WriteSequence("broken.tseq", Effects(4, 2000, "broken.mp3"));
  rig.WriteSequence("sweep.tseq", Effects(5, 700));
  rig.WriteSequence("juke1.tseq", Effects(6, 1500));
  rig.WriteSequence("juke2.tseq", Effects(7, 1500));
  rig.WriteSequence("board.tseq", Effects(8, 4000, "board.mp3"));
  rig.WriteSequence("bye.tseq", Frames(3, 1, 2, 800));
  rig.WriteSequence("next.tseq", Effects(9, 900));
  rig.media.Script("song1.mp3", {3.0, "audio", {}, {}});
  rig.media.Script("song2.mp3", {2.5, "video", {}, 1.7});  // stops early
  rig.media.Script("broken.mp3", {2.0, "audio", {"Cannot decode"}, {}});
  rig.media.Script("board.mp3", {4.0, "audio", {}, {}});
  rig.Start(pacing);

  ShowParts parts;
  parts.background = {"bg.tseq"};
  parts.startup = {"intro.tseq"};
  parts.main = {"tree.fseq", "arch.tseq"};
  parts.musical = {"song1.tseq", "broken.tseq", "song2.tseq"};
  parts.musicalType = 2;
  parts.delay = 1;
  parts.cleanUp = "sweep.tseq";
  parts.lightsOffAtEnd = true;
  parts.groups = {
      rig.Group(false, false, NewTrigger(1, 1, 1, "juke"), {"juke1.tseq", "juke2.tseq"}),
      rig.Group(false, true, NewTrigger(1, 1, 2, "board"), {"board.tseq"})};
  parts.shutdown = {"bye.tseq"};
  auto show = rig.MakeShow("xmas.tsh", parts);
  rig.At(500, [&] { rig.player->SetNextShow(show); });
  // The host offers the same show every second; then with a longer range.
  for (uint64_t t = 1500; t < 20'000; t += 1000) {
    rig.At(t, [&] { rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts)); });
  }
  rig.At(20'000, [&] {
    rig.player->SetNextShow(
        rig.MakeShow("xmas.tsh", parts, DateTime::FromParts(2024, 12, 24, 18, 0, 0), 300));
  });
  for (uint64_t t : {4'321u, 6'007u, 6'500u, 9'876u, 12'345u, 12'346u}) {
    rig.At(t, [&] { rig.Press(1, 1, 1, "juke"); });
  }
  for (uint64_t t : {7'777u, 8'888u, 15'003u}) {
    rig.At(t, [&] { rig.Press(1, 1, 2, "board"); });
  }
  rig.At(11'111, [&] { rig.Press(3, 3, 3, "unknown"); });
  ShowParts nextParts;
  nextParts.main = {"next.tseq"};
  rig.At(24'000, [&] { rig.player->SetNextShow(rig.MakeShow("later.tsh", nextParts)); });
  rig.At(26'500, [&] { rig.player->SetNextShow(nullptr); });
  rig.Advance(40'000);
  *ticks = rig.timers.TicksFired("tmrShowPlayer");
  return rig.timeline.Lines();
}

TEST(ShowPacing, WakingWhenDueDoesExactlyWhatTickingEveryMillisecondDoes) {
  uint64_t everyMsTicks = 0, wakeTicks = 0;
  std::vector<std::string> everyMs = RunShow(ShowPlayer::Pacing::kEveryMillisecond, &everyMsTicks);
  std::vector<std::string> wake = RunShow(ShowPlayer::Pacing::kWakeWhenDue, &wakeTicks);

  // The show really played: every section, the media error, the triggers,
  // the shutdown, the next show and the idle end.
  auto has = [&](const std::string& text) {
    return std::any_of(everyMs.begin(), everyMs.end(), [&](const std::string& line) {
      return line.find(text) != std::string::npos;
    });
  };
  for (const char* text :
       {"log 1 Starting <intro.tseq>", "log 1 Starting <tree.fseq>", "log 1 Starting <song1.tseq>",
        "log 3 WINDOWS MEDIA PLAYER ERROR (Error playing media file: Cannot decode):  "
        "<broken.tseq>",
        "log 1 Starting <sweep.tseq>", "log 1 Delaying between Musical sequences for 1 seconds",
        "log 1 Starting <juke2.tseq>", "log 1 Starting <board.tseq>",
        "log 1 Trigger detected: unknown", "log 1 Current show's time range has changed",
        "log 1 Starting <bye.tseq>", "log 1 Finished show: xmas.tsh",
        "log 1 Starting show: later.tsh", "log 1 Finished show: later.tsh", "log 0 No current show",
        "media ShowVideoForm(0, 0)"}) {
    EXPECT_TRUE(has(text)) << text;
  }

  ASSERT_FALSE(everyMs.empty());
  size_t common = std::min(everyMs.size(), wake.size());
  size_t first = std::mismatch(everyMs.begin(), everyMs.begin() + common, wake.begin()).first -
                 everyMs.begin();
  if (first < common || everyMs.size() != wake.size()) {
    std::string context;
    for (size_t i = first >= 5 ? first - 5 : 0; i < std::min(first + 5, common); ++i) {
      context += "\n  " + everyMs[i] + "    |    " + wake[i];
    }
    ADD_FAILURE() << "records part at line " << first << " of " << everyMs.size() << " / "
                  << wake.size() << " (every ms | wake when due):" << context;
  }
  if (std::getenv("TAV_DUMP_SHOW")) {
    for (const auto& line : wake) std::printf("%s\n", line.c_str());
  }
  RecordProperty("TicksEveryMillisecond", std::to_string(everyMsTicks));
  RecordProperty("TicksWakeWhenDue", std::to_string(wakeTicks));
  EXPECT_LT(wakeTicks * 5, everyMsTicks);
}

TEST(ShowPacing, AnIdleEngineNeverWakesAndTicksOnceForEachOfferOfNoShow) {
  ShowRig rig;
  rig.Start();
  rig.Advance(60'000);
  EXPECT_EQ(rig.timers.TicksFired("tmrShowPlayer"), 0u);
  // The host offers "no show" every second: one tick each, which finds no
  // show, asks for the restart check and switches the timer off again.
  for (uint64_t t = 1000; t <= 10'000; t += 1000) {
    rig.At(t, [&] { rig.player->SetNextShow(nullptr); });
  }
  rig.Advance(60'000);
  EXPECT_EQ(rig.timers.TicksFired("tmrShowPlayer"), 10u);
  EXPECT_EQ(rig.host.RestartChecks(), 10);
}

TEST(ShowPacing, OneSequenceAtFortyFramesASecondWakesTheEngineOncePerFrame) {
  ShowRig rig;
  rig.WriteSequence("frames.tseq", Frames(1, 1, 16, 60'000));
  rig.Start();
  ShowParts parts;
  parts.main = {"frames.tseq"};
  rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts));
  rig.Advance(1000);
  uint64_t before = rig.timers.TicksFired("tmrShowPlayer");
  rig.Advance(10'000);
  uint64_t perSecond = (rig.timers.TicksFired("tmrShowPlayer") - before) / 10;
  EXPECT_GE(perSecond, 40u);
  EXPECT_LE(perSecond, 41u);
}

TEST(ShowPacing, AShowWaitingForItsTriggerWakesOnceASecond) {
  ShowRig rig;
  rig.WriteSequence("main.tseq", Frames(1, 1, 1, 1000));
  rig.Start();
  ShowParts parts;
  parts.main = {"main.tseq"};
  parts.startupType = 1;
  parts.startupTrigger = NewTrigger(1, 1, 1, "go");
  rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts));
  rig.Advance(1000);
  uint64_t before = rig.timers.TicksFired("tmrShowPlayer");
  rig.Advance(60'000);
  EXPECT_EQ(rig.timers.TicksFired("tmrShowPlayer") - before, 60u);
  // A press wakes it at once.
  rig.At(500, [&] { rig.Press(1, 1, 1, "go"); });
  rig.Advance(501);
  EXPECT_THAT(rig.timeline.TimedTexts("log 1 Starting <"),
              ::testing::ElementsAre("61501 log 1 Starting <main.tseq>"));
}

}  // namespace
}  // namespace tav
