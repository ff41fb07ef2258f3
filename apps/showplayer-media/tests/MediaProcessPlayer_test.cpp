#include "platform/media/MediaProcessPlayer.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <vector>

#include "platform/media/testing/ToneWav.h"
#include "ports/testing/RecordingMessageLog.h"
#include "support/Error.h"
#include "support/testing/TempFolder.h"

// The player's side of the media process, driving the real media process
// (showplayer-media on libmpv, with the null outputs) and fake ones: shell
// scripts the tests write, speaking the protocol on descriptor 3, for what
// mpv cannot be made to do. The loop runs until what is awaited happens,
// bounded by a deadline far above the time it takes.

namespace tav {
namespace {

using namespace std::chrono_literals;
using SteadyClock = std::chrono::steady_clock;

constexpr int32_t kTransitioning = MediaProcessPlayer::kTransitioning;
constexpr const char* kSilent = "; playing on without sound";
const MpvOutputs kNullOutputs{"null", "", "null"};

class MediaProcessTest : public ::testing::Test {
 protected:
  void Make(const std::string& program = TAV_MEDIA_PROGRAM,
            const MpvOutputs& outputs = kNullOutputs, const MediaProcessTiming& timing = {}) {
    player.reset();
    player = std::make_unique<MediaProcessPlayer>(loop, log, outputs, program, timing);
    player->SetOnPlayStateChange([this](int32_t state) {
      EXPECT_FALSE(insideCall) << "PlayStateChange raised inside a call";
      states.push_back(state);
      events.push_back("state " + std::to_string(state));
      if (state == kTransitioning) positionSeen = 0;
      if (state == kMediaPlaying) typeWhenPlaying = player->CurrentMediaItemInfo("MediaType");
    });
    player->SetOnMediaError([this] {
      EXPECT_FALSE(insideCall) << "MediaError raised inside a call";
      ++mediaErrors;
      events.push_back("error");
    });
  }

  void Open(const std::string& path) {
    insideCall = true;
    player->OpenMedia(path);
    insideCall = false;
  }

  bool RunUntil(const std::function<bool()>& done, std::chrono::milliseconds limit = 10s) {
    auto deadline = SteadyClock::now() + limit;
    while (!done()) {
      if (SteadyClock::now() > deadline) return false;
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
  void Forget() {
    states.clear();
    events.clear();
    mediaErrors = 0;
    log.lines.clear();
  }

  // A fake media process: runs `before`, greets, then for each line it
  // reads runs `each` and answers pings, quits when told, and handles the
  // other commands with `cases` (shell case branches; $1 is the command's
  // word, $2 its first field; `say` writes a line to the player).
  std::string Fake(const std::string& name, const std::string& cases,
                   const std::string& before = "", const std::string& each = "") {
    std::string script = "#!/bin/sh\nset -f\nsay() { printf '%s\\n' \"$*\" >&3; }\n" + before +
                         "say hello 1 $$\n"
                         "while IFS= read -r line <&3; do\n"
                         "  set -- $line\n" +
                         each +
                         "  case \"$1\" in\n"
                         "    ping) say pong $2 ;;\n"
                         "    quit) exit 0 ;;\n" +
                         cases +
                         "\n  esac\n"
                         "done\n";
    std::string path = folder.Write(name, script);
    ::chmod(path.c_str(), 0755);
    return path;
  }

  TempFolder folder{"tav-mediaproc"};
  EventLoop loop;
  RecordingMessageLog log;
  std::unique_ptr<MediaProcessPlayer> player;
  bool insideCall = false;
  std::vector<int32_t> states;
  std::vector<std::string> events;
  std::string typeWhenPlaying;
  double positionSeen = 0;
  int mediaErrors = 0;
};

// The children of this test program, of all its threads.
std::vector<int64_t> Children() {
  std::vector<int64_t> children;
  for (const auto& task : std::filesystem::directory_iterator("/proc/self/task")) {
    std::ifstream in(task.path() / "children");
    for (int64_t child; in >> child;) children.push_back(child);
  }
  return children;
}

// Gone and reaped: a zombie would still take signal 0.
bool Reaped(int64_t processId) {
  return ::kill(static_cast<pid_t>(processId), 0) == -1 && errno == ESRCH;
}

// The real media process.

TEST_F(MediaProcessTest, TheMediaProcessRunsFromTheFirstPlayUntilItHasBeenIdleForTheLimit) {
  MediaProcessTiming timing;
  timing.idleLimit = 200ms;
  Make(TAV_MEDIA_PROGRAM, kNullOutputs, timing);
  loop.RunFor(20ms);
  EXPECT_EQ(player->ProcessId(), 0);
  EXPECT_TRUE(Children().empty()) << "a process started before any media file";

  // The tone outlasts the idle limit: a play is not idleness.
  std::string tone = folder.Write("tone.wav", ToneWav(0.5));
  int64_t before = 0;
  for (int round = 0; round < 2; ++round) {
    SCOPED_TRACE(round);
    Forget();
    Open(tone);  // queued while the new process loads libmpv
    int64_t started = player->ProcessId();
    EXPECT_NE(started, 0);
    EXPECT_NE(started, before);
    EXPECT_EQ(Children(), std::vector<int64_t>{started});
    ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
    EXPECT_EQ(states, (std::vector<int32_t>{kTransitioning, kMediaPlaying, kMediaStopped}));
    EXPECT_GT(positionSeen, 0.4);
    EXPECT_EQ(player->ProcessId(), started) << "ended while playing";

    auto stopped = SteadyClock::now();
    ASSERT_TRUE(RunUntil([&] { return Reaped(started); }, 5s));
    EXPECT_GE(SteadyClock::now() - stopped, 150ms) << "ended before the idle limit";
    EXPECT_EQ(player->ProcessId(), 0);
    EXPECT_TRUE(Children().empty());
    EXPECT_EQ(mediaErrors, 0);
    EXPECT_TRUE(log.lines.empty()) << "an idle end is not a failure";
    before = started;
  }
}

TEST_F(MediaProcessTest, PlaysAToneInTheMediaProcessAsMpvWould) {
  Make();
  std::string tone = folder.Write("tone.wav", ToneWav(0.8));
  Open(tone);
  EXPECT_EQ(player->PlayState(), kTransitioning);
  EXPECT_NE(player->ProcessId(), 0);
  EXPECT_NE(player->ProcessId(), ::getpid());

  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  EXPECT_EQ(typeWhenPlaying, "audio");
  double early = player->CurrentPosition();
  ASSERT_TRUE(RunUntil([&] { return player->CurrentPosition() > early + 0.3; }))
      << "the position does not advance";
  EXPECT_GT(player->LatestReport().clock.position, 0.0);
  EXPECT_NEAR(player->LatestReport().clock.end, 0.8, 0.01);

  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
  EXPECT_EQ(states, (std::vector<int32_t>{kTransitioning, kMediaPlaying, kMediaStopped}));
  EXPECT_GT(positionSeen, 0.7) << "stopped before the tone was heard to its end";
  EXPECT_EQ(player->CurrentPosition(), 0.0);
  EXPECT_EQ(player->CurrentMediaItemInfo("MediaType"), "audio");
  EXPECT_EQ(player->CurrentMediaItemInfo("SourceURL"), tone);
  EXPECT_EQ(mediaErrors, 0);
  EXPECT_EQ(player->ErrorCount(), 0);
  EXPECT_TRUE(log.lines.empty());
}

TEST_F(MediaProcessTest, AFileThatCannotBePlayedRaisesOneMediaErrorWithItsReason) {
  Make();
  struct Case {
    std::string path;
    std::string reason;
  };
  for (const Case& c :
       {Case{folder / "missing.wav", "file not found"},
        Case{folder.Write("notes.wav", "bulbs, cable ties\n"), "unrecognized file format"}}) {
    SCOPED_TRACE(c.path);
    Forget();
    Open(c.path);
    ASSERT_TRUE(RunUntil([&] { return mediaErrors > 0 && Saw(kMediaStopped); }));
    RunUntil([] { return false; }, 50ms);  // nothing more comes
    EXPECT_EQ(events, (std::vector<std::string>{"state 9", "error", "state 1"}));
    ASSERT_EQ(player->ErrorCount(), 1);
    EXPECT_EQ(player->ErrorDescription(0), "Cannot play \"" + c.path + "\": " + c.reason);
    player->ClearErrorQueue();
  }
  EXPECT_THROW(player->ErrorDescription(0), Error);
}

TEST_F(MediaProcessTest, OpenAndStopAreObeyedAtOnceAndWhatTheyOvertookIsNotReported) {
  Make();
  std::string bad = folder.Write("bad.wav", "not a sound");
  std::string tone = folder.Write("tone.wav", ToneWav(0.6));
  Open(bad);
  Open(tone);  // before the media process has even looked at the first
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  insideCall = true;
  player->Stop();
  insideCall = false;
  EXPECT_EQ(player->PlayState(), kMediaStopped);
  EXPECT_EQ(player->CurrentPosition(), 0.0);
  RunUntil([] { return false; }, 800ms);  // the tone would have ended by now
  EXPECT_EQ(states, (std::vector<int32_t>{kTransitioning, kMediaPlaying, kMediaStopped}));
  EXPECT_EQ(mediaErrors, 0) << "the overtaken file's failure was reported";
}

TEST_F(MediaProcessTest, ASoundDeviceThatCannotOpenIsSaidOnceInThePlayersLog) {
  Make(TAV_MEDIA_PROGRAM, {"alsa", "alsa/tav-no-such-device", "null"});
  std::string tone = folder.Write("tone.wav", ToneWav(0.3));
  for (int play = 0; play < 2; ++play) {
    states.clear();
    Open(tone);
    ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
    EXPECT_TRUE(Saw(kMediaPlaying));
  }
  EXPECT_EQ(mediaErrors, 0);
  EXPECT_EQ(log.lines, (std::vector<std::string>{
                           "2 Media: the sound device could not be opened (output alsa, device "
                           "alsa/tav-no-such-device); playing without sound"}));
}

TEST_F(MediaProcessTest, AMediaProcessKilledMidPlayLeavesThePlayRunningSilentlyToItsEnd) {
  Make();
  std::string tone = folder.Write("tone.wav", ToneWav(1.5));
  Open(tone);
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying) && player->CurrentPosition() > 0.2; }));
  int64_t first = player->ProcessId();
  ::kill(static_cast<pid_t>(first), SIGKILL);

  // RunUntil also watches that the position never goes back.
  ASSERT_TRUE(RunUntil([&] { return mediaErrors == 1 && !log.lines.empty(); }));
  EXPECT_EQ(player->PlayState(), kMediaPlaying);
  EXPECT_GT(player->CurrentPosition(), 0.2) << "the play started again";
  ASSERT_EQ(player->ErrorCount(), 1);
  EXPECT_EQ(player->ErrorDescription(0),
            "Cannot play \"" + tone + "\": the media process ended unexpectedly" + kSilent);
  EXPECT_EQ(log.lines, (std::vector<std::string>{
                           "3 Media: the media process ended unexpectedly (killed by signal 9 "
                           "(Killed)); the next media file starts a new one"}));
  EXPECT_EQ(player->ProcessId(), 0);

  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
  EXPECT_EQ(states, (std::vector<int32_t>{kTransitioning, kMediaPlaying, kMediaStopped}));
  EXPECT_GT(positionSeen, 1.4) << "stopped before the media's end";
  EXPECT_LE(positionSeen, 1.5) << "ran beyond the media's end";
  EXPECT_EQ(player->CurrentPosition(), 0.0);
  EXPECT_EQ(mediaErrors, 1);

  Forget();
  Open(tone);
  EXPECT_NE(player->ProcessId(), 0);
  EXPECT_NE(player->ProcessId(), first);
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  EXPECT_EQ(mediaErrors, 0);
}

TEST_F(MediaProcessTest, ThePlayerMayBeDestroyedFromItsOwnEvent) {
  Make();
  bool destroyed = false;
  player->SetOnPlayStateChange([&](int32_t state) {
    if (state != kMediaPlaying) return;
    player.reset();
    destroyed = true;
  });
  Open(folder.Write("tone.wav", ToneWav(1.0)));
  ASSERT_TRUE(RunUntil([&] { return destroyed; }));
  loop.RunFor(20ms);  // whatever was under way finds nobody
}

// Fake media processes.

TEST_F(MediaProcessTest, CommandsReachTheMediaProcessAsTheProtocolWritesThem) {
  std::string heard = folder / "heard";
  Make(
      Fake("recorder", "", "", "  [ \"$1\" = ping ] || printf '%s\\n' \"$line\" >>" + heard + "\n"),
      {"pulse", "my card", "gpu"});
  Open("/music/a b.mp3");
  player->ShowVideoForm(100, -50);
  player->SetFullScreen(true);
  player->HideVideoForm();
  player->Stop();
  RunUntil([&] {
    return folder.Exists("heard") && folder.Read("heard").find("stop") != std::string::npos;
  });
  player.reset();  // waits for the media process to quit
  EXPECT_EQ(folder.Read("heard"),
            "outputs pulse my%20card gpu\n"
            "open 1 /music/a%20b.mp3\n"
            "show 100 -50\n"
            "fullscreen 1\n"
            "hide\n"
            "stop 2\n"
            "quit\n");
}

TEST_F(MediaProcessTest, ThePositionRunsOnFromTheMonotonicStampAndReportsOfOlderPlaysAreIgnored) {
  auto stamp = SteadyClock::now();
  std::string ns = std::to_string(
      std::chrono::duration_cast<std::chrono::nanoseconds>(stamp.time_since_epoch()).count());
  // Play 1 runs from 10 s at `stamp`; play 2 ends at 20.05 s. Each open is
  // first answered with reports of the play before it.
  Make(Fake("clock",
            "    open) old=$(($2 - 1))\n"
            "      say state $old 3; say media $old video; say clock $old 50 " +
                ns +
                " 0 1\n"
                "      if [ $2 = 1 ]; then say media 1 audio; say clock 1 10 " +
                ns +
                " 0 1\n"
                "      else say media 2 video; say clock 2 20 " +
                ns +
                " 20.05 1; fi\n"
                "      say state $2 3 ;;"));
  Open("/a.mp3");
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  auto before = SteadyClock::now();
  double position = player->CurrentPosition();
  auto after = SteadyClock::now();
  auto runOn = [&](SteadyClock::time_point t) {
    return std::chrono::duration<double>(std::min<SteadyClock::duration>(t - stamp, 1s)).count();
  };
  EXPECT_GE(position, 10 + runOn(before));
  EXPECT_LE(position, 10 + runOn(after));
  EXPECT_EQ(typeWhenPlaying, "audio");
  EXPECT_EQ(player->LatestReport().clock.position, 10);
  EXPECT_EQ(player->LatestReport().clock.at, stamp);

  Forget();
  Open("/b.mp4");
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  RunUntil([] { return false; }, 60ms);
  EXPECT_EQ(player->CurrentPosition(), 20.05) << "beyond the media's end";
  EXPECT_EQ(typeWhenPlaying, "video");
  EXPECT_EQ(states, (std::vector<int32_t>{kTransitioning, kMediaPlaying}));
}

TEST_F(MediaProcessTest, OnlyAnUnbrokenStretchWithoutPlayEndsTheMediaProcess) {
  MediaProcessTiming timing;
  timing.idleLimit = 200ms;
  Make(Fake("idle", "    open) say state $2 3 ;;\n    stop) ;;"), kNullOutputs, timing);
  Open("/a.mp3");
  int64_t first = player->ProcessId();
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  player->Stop();
  RunUntil([] { return false; }, 120ms);
  Open("/b.mp3");  // within the limit: the same process plays it
  RunUntil([] { return false; }, 150ms);
  EXPECT_EQ(player->ProcessId(), first) << "the idle time before the play was counted";
  player->Stop();
  RunUntil([] { return false; }, 120ms);
  EXPECT_EQ(player->ProcessId(), first) << "the idle time before the play was counted";
  ASSERT_TRUE(RunUntil([&] { return Reaped(first); }, 5s));
  EXPECT_TRUE(log.lines.empty());
}

TEST_F(MediaProcessTest, AMediaErrorCarriesItsQueueAndComesBeforeTheStoppedState) {
  Make(Fake("failing",
            "    open) say state $2 9; say error one%20reason; say error two\n"
            "      say mediaerror $2 1; say state $2 1 ;;"));
  Open("/a.mp3");
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaStopped); }));
  RunUntil([] { return false; }, 30ms);
  EXPECT_EQ(events, (std::vector<std::string>{"state 9", "error", "state 1"}));
  ASSERT_EQ(player->ErrorCount(), 2);
  EXPECT_EQ(player->ErrorDescription(0), "one reason");
  EXPECT_EQ(player->ErrorDescription(1), "two");
}

TEST_F(MediaProcessTest, AMediaProcessThatSaysWhatCannotBeReadIsEnded) {
  struct Case {
    std::string saysOnOpen;
    std::string logged;
    std::string queued;
  };
  const Case cases[] = {
      {"state $2 banana",
       "sent what cannot be read (\"state\" with a bad number \"banana\") and was ended",
       "the media process ended unexpectedly"},
      {"sing $2", "sent what cannot be read (unknown message \"sing\") and was ended",
       "the media process ended unexpectedly"},
      {"open $2 /x", "sent a command (\"open\") and was ended",
       "the media process ended unexpectedly"},
      {"hello 1 1", "sent \"hello\" twice and was ended", "the media process ended unexpectedly"},
      {"failed mpv%20cannot%20start", "cannot play: mpv cannot start", "mpv cannot start"},
  };
  int n = 0;
  for (const Case& c : cases) {
    SCOPED_TRACE(c.saysOnOpen);
    Make(Fake("bad" + std::to_string(++n), "    open) say " + c.saysOnOpen + " ;;"));
    Forget();
    Open("/a.mp3");
    ASSERT_TRUE(RunUntil([&] { return mediaErrors > 0 && !log.lines.empty(); }));
    EXPECT_EQ(player->PlayState(), kMediaPlaying);
    EXPECT_EQ(log.lines, std::vector<std::string>{"3 Media: the media process " + c.logged +
                                                  "; the next media file starts a new one"});
    ASSERT_EQ(player->ErrorCount(), 1);
    EXPECT_EQ(player->ErrorDescription(0), "Cannot play \"/a.mp3\": " + c.queued + kSilent);
  }
}

TEST_F(MediaProcessTest, AMediaProcessThatStopsAnsweringIsEndedAndTheNextOpenStartsAFreshOne) {
  // The first one greets, then hangs; the one after it plays.
  std::string program = Fake("hangs-once", "    open) say state $2 3 ;;",
                             "if [ ! -e " + folder / "hung" + " ]; then touch " + folder / "hung" +
                                 "; say hello 1 $$; exec sleep 30; fi\n");
  MediaProcessTiming timing;
  timing.pingInterval = 50ms;
  timing.answerBound = 300ms;
  Make(program, kNullOutputs, timing);
  auto opened = SteadyClock::now();
  Open("/a.mp3");
  ASSERT_TRUE(RunUntil([&] { return mediaErrors == 1; }));
  EXPECT_GE(SteadyClock::now() - opened, 250ms) << "ended before the bound";
  EXPECT_EQ(player->PlayState(), kMediaPlaying);
  EXPECT_EQ(log.lines, (std::vector<std::string>{"3 Media: the media process did not answer "
                                                 "within 300 ms and was ended; the next media "
                                                 "file starts a new one"}));
  Forget();
  Open("/b.mp3");
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  RunUntil([] { return false; }, 200ms);  // pings answered: it stays
  EXPECT_EQ(player->PlayState(), kMediaPlaying);
  EXPECT_TRUE(log.lines.empty());
}

TEST_F(MediaProcessTest, AMediaProcessThatDiesAtOnceIsStartedAgainOnlyAfterABackOff) {
  std::string starts = folder / "starts";
  std::string program = folder.Write("dies", "#!/bin/sh\necho x >>" + starts + "\nexit 1\n");
  ::chmod(program.c_str(), 0755);
  MediaProcessTiming timing;
  timing.firstBackOff = 400ms;
  Make(program, kNullOutputs, timing);
  std::string died =
      "3 Media: the media process ended unexpectedly (exited with status 1); the next media file "
      "starts a new one";
  Open("/a.mp3");
  ASSERT_TRUE(RunUntil([&] { return mediaErrors == 1 && log.lines.size() == 1; }));
  Open("/b.mp3");  // the second start follows at once
  ASSERT_TRUE(RunUntil([&] { return mediaErrors == 2 && log.lines.size() == 2; }));
  Open("/b.mp3");  // the third waits
  ASSERT_TRUE(RunUntil([&] { return mediaErrors == 3; }));
  EXPECT_EQ(player->ErrorDescription(2),
            "Cannot play \"/b.mp3\": the media process keeps ending unexpectedly; it is tried "
            "again in 1 s" +
                std::string(kSilent));
  EXPECT_EQ(folder.Read("starts"), "x\nx\n");

  RunUntil([] { return false; }, 450ms);
  Open("/c.mp3");
  ASSERT_TRUE(RunUntil([&] { return mediaErrors == 4 && log.lines.size() == 3; }));
  EXPECT_EQ(folder.Read("starts"), "x\nx\nx\n");
  EXPECT_EQ(log.lines, (std::vector<std::string>{died, died, died}));
}

TEST_F(MediaProcessTest, WithoutItsProgramEachFilePlaysSilentlyUntilTheProgramIsThere) {
  std::string program = folder / "showplayer-media";
  Make(program);
  EXPECT_TRUE(log.lines.empty()) << "looked for before any media file";
  for (std::string file : {"/a.mp3", "/b.mp3"}) {
    SCOPED_TRACE(file);
    Forget();
    Open(file);
    EXPECT_EQ(player->PlayState(), kMediaPlaying);
    ASSERT_TRUE(RunUntil([&] { return player->CurrentPosition() > 0.05; }));
    EXPECT_EQ(events, (std::vector<std::string>{"state 9", "error", "state 3"}));
    ASSERT_EQ(player->ErrorCount(), 1);
    EXPECT_EQ(player->ErrorDescription(0), "Cannot play \"" + file +
                                               "\": cannot start the media process " + program +
                                               ": No such file or directory" + kSilent);
    player->Stop();
    player->ClearErrorQueue();
    EXPECT_EQ(player->CurrentPosition(), 0.0);
    if (file == "/a.mp3") {
      EXPECT_EQ(log.lines, std::vector<std::string>{
                               "3 Media: cannot start the media process " + program +
                               ": No such file or directory; music and video play without sound "
                               "until it starts, and each media file tries again"});
    } else {
      EXPECT_TRUE(log.lines.empty()) << "said again for each file";
    }
  }

  Fake("showplayer-media", "    open) say state $2 3 ;;");
  Forget();
  Open("/b.mp3");
  EXPECT_NE(player->ProcessId(), 0);
  ASSERT_TRUE(RunUntil([&] { return Saw(kMediaPlaying); }));
  EXPECT_EQ(mediaErrors, 0);
}

}  // namespace
}  // namespace tav
