#include "platform/media/MpvMediaPlayer.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "platform/media/testing/ToneWav.h"
#include "ports/testing/RecordingMessageLog.h"
#include "support/Error.h"
#include "support/testing/TempFolder.h"

// The real libmpv on the real event loop, with the null audio and video
// outputs, playing media the tests make themselves. The loop runs until what
// is awaited happens, bounded by a deadline far above the second or so it
// takes; the checks are on what happened and in which order.

namespace tav {
namespace {

using namespace std::chrono_literals;

class MpvMediaPlayerTest : public ::testing::Test {
 protected:
  void SetUp() override { Make({"null", "", "null"}); }

  void Make(const MpvOutputs& outputs) {
    player.reset();
    player = std::make_unique<MpvMediaPlayer>(loop, log, outputs);
    player->SetOnPlayStateChange([this](int32_t state) {
      EXPECT_FALSE(insideCall) << "PlayStateChange raised inside a call";
      states.push_back(state);
      if (state == MpvMediaPlayer::kTransitioning) positionSeen = 0;  // a new play
      if (state == kMediaPlaying) typeWhenPlaying = player->CurrentMediaItemInfo("MediaType");
      if (state == kMediaStopped) lastPositionPlaying = positionSeen;
    });
    player->SetOnMediaError([this] {
      EXPECT_FALSE(insideCall) << "MediaError raised inside a call";
      EXPECT_EQ(player->PlayState(), kMediaStopped);
      ++mediaErrors;
    });
  }

  void Open(const std::string& path) {
    insideCall = true;
    player->OpenMedia(path);
    insideCall = false;
  }

  // Runs the loop until `done` holds; false when the deadline passed first.
  bool RunUntil(const std::function<bool()>& done, std::chrono::seconds limit = 10s) {
    auto deadline = std::chrono::steady_clock::now() + limit;
    while (!done()) {
      if (std::chrono::steady_clock::now() > deadline) return false;
      loop.RunFor(2ms);
      if (player && player->PlayState() == kMediaPlaying) {
        double position = player->CurrentPosition();
        EXPECT_GE(position, positionSeen) << "the position went back";
        positionSeen = position;
      }
    }
    return true;
  }
  bool Saw(int32_t state) const {
    return std::find(states.begin(), states.end(), state) != states.end();
  }

  TempFolder folder{"tav-mpv"};
  EventLoop loop;
  RecordingMessageLog log;
  std::unique_ptr<MpvMediaPlayer> player;
  bool insideCall = false;
  std::vector<int32_t> states;
  std::string typeWhenPlaying;
  double positionSeen = 0;
  double lastPositionPlaying = -1;
  int mediaErrors = 0;
};

TEST_F(MpvMediaPlayerTest, PlaysAToneUntilItsLastSoundThenStops) {
  std::string tone = folder.Write("tone.wav", ToneWav(1.0));
  Open(tone);
  EXPECT_EQ(player->PlayState(), MpvMediaPlayer::kTransitioning);
  EXPECT_EQ(player->CurrentMediaItemInfo("SourceURL"), tone);

  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  EXPECT_EQ(typeWhenPlaying, "audio");
  double early = player->CurrentPosition();
  ASSERT_TRUE(RunUntil([&] { return player->CurrentPosition() > early + 0.3; }))
      << "the position does not advance";

  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
  EXPECT_EQ(states,
            (std::vector<int32_t>{MpvMediaPlayer::kTransitioning, kMediaPlaying, kMediaStopped}));
  // Stopped when the tone has been heard to its end, not when mpv has read
  // the file to its end (a fraction of a second before).
  EXPECT_GT(lastPositionPlaying, 0.9);
  EXPECT_EQ(player->PlayState(), kMediaStopped);
  EXPECT_EQ(player->CurrentPosition(), 0.0);
  EXPECT_EQ(player->CurrentMediaItemInfo("MediaType"), "audio");
  EXPECT_EQ(player->ErrorCount(), 0);
  EXPECT_EQ(mediaErrors, 0);
  EXPECT_TRUE(log.lines.empty());
}

TEST_F(MpvMediaPlayerTest, AFileThatCannotBePlayedRaisesMediaErrorWithItsReasonQueued) {
  struct Case {
    std::string name;
    std::string content;  // empty: the file does not exist
    std::string reason;
  };
  for (const Case& c :
       {Case{"missing.wav", "", "file not found"},
        Case{"notes.wav", "shopping list: bulbs, cable ties\n", "unrecognized file format"}}) {
    SCOPED_TRACE(c.name);
    std::string path = c.content.empty() ? folder / c.name : folder.Write(c.name, c.content);
    states.clear();
    mediaErrors = 0;
    Open(path);
    ASSERT_TRUE(RunUntil([&] { return mediaErrors > 0 && Saw(kMediaStopped); }));
    EXPECT_EQ(mediaErrors, 1);
    EXPECT_EQ(states, (std::vector<int32_t>{MpvMediaPlayer::kTransitioning, kMediaStopped}));
    ASSERT_EQ(player->ErrorCount(), 1);
    EXPECT_EQ(player->ErrorDescription(0), "Cannot play \"" + path + "\": " + c.reason);
    player->ClearErrorQueue();
    EXPECT_EQ(player->ErrorCount(), 0);
  }
  try {
    player->ErrorDescription(0);
    FAIL() << "no error outside the queue";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), errors::kSubscriptOutOfRange);
  }
}

TEST_F(MpvMediaPlayerTest, StopIsImmediateAndTheStoppedPlaySaysNothingMore) {
  std::string tone = folder.Write("tone.wav", ToneWav(0.5));
  Open(tone);
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  insideCall = true;
  player->Stop();
  insideCall = false;
  EXPECT_EQ(player->PlayState(), kMediaStopped);
  EXPECT_EQ(player->CurrentPosition(), 0.0);
  // Long enough for the tone to have ended had it gone on.
  RunUntil([] { return false; }, 1s);
  EXPECT_EQ(states,
            (std::vector<int32_t>{MpvMediaPlayer::kTransitioning, kMediaPlaying, kMediaStopped}));
  EXPECT_EQ(mediaErrors, 0);
}

TEST_F(MpvMediaPlayerTest, OpeningAgainReplacesWhatPlaysAndPlaysTheNewFile) {
  std::string bad = folder.Write("bad.wav", "not a sound");
  std::string tone = folder.Write("tone.wav", ToneWav(0.5));
  Open(bad);
  Open(tone);  // before mpv has even looked at the first
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  Open(tone);  // the same file again, while it plays
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
  EXPECT_EQ(states,
            (std::vector<int32_t>{MpvMediaPlayer::kTransitioning, kMediaPlaying,
                                  MpvMediaPlayer::kTransitioning, kMediaPlaying, kMediaStopped}));
  EXPECT_GT(lastPositionPlaying, 0.4) << "the second play ended early";
  EXPECT_EQ(mediaErrors, 0) << "the replaced file's failure was reported";
  EXPECT_EQ(player->ErrorCount(), 0);
}

TEST_F(MpvMediaPlayerTest, AStateChangeOvertakenByStopOrOpenIsNotRaised) {
  std::string tone = folder.Write("tone.wav", ToneWav(0.3));
  Open(tone);
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  player->Stop();  // its stopped state is overtaken before it is raised
  Open(tone);
  ASSERT_TRUE(RunUntil([&] { return states.size() >= 4 && states.back() == kMediaStopped; }));
  // The media process tells the play each change concerns by when it is
  // raised: a stale one would be reported against the newer play.
  EXPECT_EQ(states,
            (std::vector<int32_t>{MpvMediaPlayer::kTransitioning, kMediaPlaying,
                                  MpvMediaPlayer::kTransitioning, kMediaPlaying, kMediaStopped}));
}

TEST_F(MpvMediaPlayerTest, TheClockIsHandedOnAsItChanges) {
  std::vector<MediaClock::Snapshot> seen;
  player->SetOnClockChange([&](const MediaClock& clock) { seen.push_back(clock.Take()); });
  Open(folder.Write("tone.wav", ToneWav(0.5)));
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
  ASSERT_GE(seen.size(), 3u);
  EXPECT_NEAR(seen.front().end, 0.5, 0.01) << "the length comes first, before playing";
  EXPECT_FALSE(seen.front().running);
  EXPECT_TRUE(seen.back().running);
  EXPECT_GT(seen.back().position, 0.0);
  for (size_t i = 1; i < seen.size(); ++i) {
    EXPECT_GE(seen[i].at, seen[i - 1].at);
    EXPECT_GE(seen[i].position, seen[i - 1].position);
  }
}

TEST_F(MpvMediaPlayerTest, AVideoIsVideoAndShowingItWithoutVideoOutputDoesNothing) {
  EXPECT_FALSE(player->HasVideoOutput());
  player->ShowVideoForm(100, 50);
  player->SetFullScreen(true);
  Open("av://lavfi:testsrc=duration=0.4:size=64x48:rate=25");
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
  EXPECT_EQ(typeWhenPlaying, "video");
  player->HideVideoForm();
  EXPECT_EQ(mediaErrors, 0);
}

TEST_F(MpvMediaPlayerTest, ASoundDeviceThatCannotOpenFallsBackToNoSoundWithOneLine) {
  Make({"alsa", "alsa/tav-no-such-device", "null"});
  std::string tone = folder.Write("tone.wav", ToneWav(0.3));
  for (int play = 0; play < 2; ++play) {
    states.clear();
    Open(tone);
    ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
    EXPECT_TRUE(Saw(kMediaPlaying));
  }
  EXPECT_EQ(mediaErrors, 0);
  EXPECT_TRUE(player->FellBackToNullAudio());
  EXPECT_EQ(log.lines, (std::vector<std::string>{
                           "2 Media: the sound device could not be opened (output alsa, device "
                           "alsa/tav-no-such-device); playing without sound"}));
}

TEST_F(MpvMediaPlayerTest, ThePlayerMayBeDestroyedFromItsOwnEvent) {
  std::string tone = folder.Write("tone.wav", ToneWav(1.0));
  bool destroyed = false;
  player->SetOnPlayStateChange([&](int32_t state) {
    if (state != kMediaPlaying) return;
    player.reset();
    destroyed = true;
  });
  Open(tone);
  ASSERT_TRUE(RunUntil([&] { return destroyed; }));
  loop.RunFor(50ms);  // whatever mpv had posted finds nobody
}

TEST_F(MpvMediaPlayerTest, ThePlayerMayBeDestroyedAtAnyMomentOfALoad) {
  std::string tone = folder.Write("tone.wav", ToneWav(1.0));
  for (auto delay : {0ms, 2ms, 5ms, 10ms, 20ms, 40ms}) {
    Make({"null", "", "null"});
    Open(tone);
    loop.RunFor(delay);
    player.reset();  // must neither hang (mpv waiting for us) nor touch freed memory
  }
  loop.RunFor(20ms);
}

}  // namespace
}  // namespace tav
