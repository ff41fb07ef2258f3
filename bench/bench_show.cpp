// Show engine figures, on virtual time (the engine's own cost, measured on
// the wall clock around its ticks; the I/O control is a counter):
//
// 1. A tick with nothing due (a show running, its sequence between two
//    frames): target under 1 microsecond.
// 2. 100 sequences of 512 DMX channels at 40 frames a second: the engine's
//    cost per frame (all 100 pumped to the control).
// 3. Show-timer wake-ups per second: one 40 fps sequence playing (target: at
//    most about 50, not 1,000), a show waiting for its trigger, and idle with
//    no show (target: none).
// 4. One virtual minute of the 40 fps show, ticking every millisecond
//    against waking when due: wall time spent.
//
// Exits non-zero when a target is missed. Run it from the release preset.

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>

#include "config/MemoryRegistryStore.h"
#include "config/Settings.h"
#include "platform/LocalFileSystem.h"
#include "ports/testing/FixedProcessMemory.h"
#include "ports/testing/ManualClock.h"
#include "ports/testing/VirtualTimerService.h"
#include "show/ShowFunctions.h"
#include "show/ShowPlayer.h"
#include "show/TriggerFunctions.h"
#include "show/testing/ScriptedMediaPlayer.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/PlainSequence.h"
#include "suite/shellcmd/testing/RecordingShellCommandManager.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

using Steady = std::chrono::steady_clock;

double NsSince(Steady::time_point start) {
  return std::chrono::duration<double, std::nano>(Steady::now() - start).count();
}

// Counts what it is handed and does nothing with it.
class CountingChannelIO : public ChannelIO {
 public:
  void SetupClient(bool, const std::string&, bool) override {}
  void ReleaseClient() override {}
  void SetLightsActive(bool) override {}
  void KeepAlive() override {}
  void SetTAVNetworkSpeed(int32_t, int32_t) override {}
  void SetTAVNetworkOldMCP(int32_t, bool) override {}
  void SetTAVNetworkEnhanced(int32_t, bool) override {}
  void SetTAVNetworkPort(int32_t, const std::string&) override {}
  void OpenX10Network(const std::string&) override {}
  void OpenFennickNetwork(const std::string&) override {}
  void ApplyNetworkPreferences(const NetworkPreferences&) override {}
  void RegisterInput(int32_t, int32_t, int32_t, const std::string&) override {}
  void ClearInputs() override {}
  void SetOnInput(std::function<void(const ChannelInputEvent&)>) override {}
  void OutputEffect(int32_t, int32_t, uint8_t, int32_t, const std::string&, int32_t, int32_t,
                    int32_t, int32_t, int32_t, uint32_t) override {
    ++events;
  }
  void OutputDMXLevels(int32_t, int32_t, int32_t count, const uint8_t* levels, uint32_t) override {
    ++events;
    checksum += levels[count - 1];
  }
  void OutputTAVLevels(int32_t, uint8_t, int32_t, int32_t, const uint8_t*, uint32_t) override {
    ++events;
  }
  void SendAccumulated(uint32_t) override { ++frames; }

  uint64_t events = 0;
  uint64_t frames = 0;
  uint64_t checksum = 0;
};

class QuietHost : public ShowPlayerHost {
 public:
  void LogMessage(int32_t, const std::string&, const SequenceIdentity*) override {}
  void SendSequenceStartToTAVTray(const SequenceIdentity&) override {}
  void SendSequenceStopToTAVTray(const SequenceIdentity&) override {}
  std::string CreatePlaybackFileIfNeeded(const std::string&) override { return ""; }
  void SendStatusToTAVTray(bool) override {}
  void ShutdownForRestartIfNecessary() override {}
};

// Levels for 512 slots of one universe, 40 frames a second, changing every
// frame.
SequenceData Universe(int32_t universe, int64_t lengthMs) {
  SequenceData data;
  data.lengthMs = lengthMs;
  LevelTrack track;
  track.family = kFamilyDMX;
  track.network = universe;
  track.count = 512;
  track.stepMs = 25;
  for (int64_t frame = 0; frame < lengthMs / 25; ++frame) {
    for (int32_t slot = 0; slot < 512; ++slot) {
      track.levels.push_back(static_cast<uint8_t>((frame * 13 + slot * 7 + universe) % 256));
    }
  }
  data.tracks.push_back(std::move(track));
  return data;
}

// An engine on virtual time with `sequences` looping Main sequences that all
// play at once, one universe each.
struct Bench {
  Bench(int sequences, ShowPlayer::Pacing pacing, bool waitForTrigger = false) {
    clock->Follow(timers);
    settings.Set(settings::kUseCompressedSequences, false);
    auto files = LocalFileSystem();
    auto resolver =
        std::make_shared<PathResolver>(files, [dir = folder.Path()](int32_t) { return dir; });
    auto library = std::make_shared<FileSequenceLibrary>(clock, files, resolver);
    ShowPlayerServices services;
    services.clock = clock.get();
    services.settings = &settings;
    services.registry = &registry;
    services.memory = std::make_shared<FixedProcessMemory>(64 * 1024 * 1024);
    services.sequences = {library, resolver, files, &host, nullptr, [] { return false; }};
    services.shellCommands = &shell;
    player = std::make_unique<ShowPlayer>(std::move(services));
    player->SetPacing(pacing);
    timer = timers.CreateTimer("tmrShowPlayer", 1, false, nullptr);
    player->InitControls(host, *timer, cio, media);

    auto main = std::make_shared<Playlist>();
    for (int i = 0; i < sequences; ++i) {
      std::string name = "u" + std::to_string(i + 1) + ".tseq";
      folder.Write(name, WritePlainSequence(Universe(i + 1, 10'000)));
      main->List().Add(folder / name);
    }
    auto none = [] { return std::make_shared<Playlist>(); };
    auto show = NewShow(none(), none(), main, none(), none(),
                        std::make_shared<InteractiveGroupList>(), waitForTrigger ? 1 : 0,
                        waitForTrigger ? NewTrigger(1, 1, 1, "go") : nullptr, false);
    show->Main()->SetAnimationType(2);
    player->SetNextShow(show);
  }

  uint64_t Ticks() const { return timers.TicksFired("tmrShowPlayer"); }

  VirtualTimerService timers;
  std::shared_ptr<ManualClock> clock =
      std::make_shared<ManualClock>(DateTime::FromParts(2024, 12, 24, 18, 0, 0));
  MemoryRegistryStore registry;
  Settings settings{registry, PathDefaults{"/nonexistent/", "/nonexistent/", '/'}};
  std::shared_ptr<CountingChannelIO> cio = std::make_shared<CountingChannelIO>();
  ScriptedMediaPlayer media{*clock, timers};
  RecordingShellCommandManager shell;
  QuietHost host;
  TempFolder folder{"tav-bench-show"};
  std::unique_ptr<Timer> timer;
  std::unique_ptr<ShowPlayer> player;
};

// Nanoseconds per call of the tick while nothing is due.
double IdleTickNs(int sequences, ShowPlayer::Pacing pacing) {
  Bench bench(sequences, pacing);
  bench.timers.Advance(30);  // started, first frame out, the next 20 ms away
  const int calls = 200'000;
  auto start = Steady::now();
  for (int i = 0; i < calls; ++i) bench.player->tmrShowPlayer_Timer();
  return NsSince(start) / calls;
}

}  // namespace
}  // namespace tav

int main() {
  using namespace tav;
  bool ok = true;

  double idleWake = IdleTickNs(1, ShowPlayer::Pacing::kWakeWhenDue);
  double idleEveryMs = IdleTickNs(1, ShowPlayer::Pacing::kEveryMillisecond);
  double idleHundred = IdleTickNs(100, ShowPlayer::Pacing::kWakeWhenDue);
  std::printf(
      "tick with nothing due, 1 sequence playing:    %7.0f ns (%7.0f ns without working out the "
      "next wake-up)\n",
      idleWake, idleEveryMs);
  std::printf("tick with nothing due, 100 sequences playing: %7.0f ns\n", idleHundred);
  if (idleWake >= 1000) {
    std::printf("  MISSED: target under 1 us\n");
    ok = false;
  }

  {
    Bench bench(100, ShowPlayer::Pacing::kWakeWhenDue);
    bench.timers.Advance(100);  // loaded and started
    const int frames = 400;     // 10 s: one whole round of every sequence
    uint64_t events = bench.cio->events;
    auto start = Steady::now();
    for (int i = 0; i < frames; ++i) bench.timers.Advance(25);
    double perFrameUs = NsSince(start) / frames / 1000.0;
    std::printf(
        "100 sequences x 512 channels at 40 fps:      %7.1f us per frame (%.0f level blocks a "
        "frame)\n",
        perFrameUs, static_cast<double>(bench.cio->events - events) / frames);
  }

  {
    Bench playing(1, ShowPlayer::Pacing::kWakeWhenDue);
    playing.timers.Advance(1000);
    uint64_t before = playing.Ticks();
    auto start = Steady::now();
    playing.timers.Advance(60'000);
    double wakeMs = NsSince(start) / 1e6;
    double perSecond = static_cast<double>(playing.Ticks() - before) / 60.0;

    Bench everyMs(1, ShowPlayer::Pacing::kEveryMillisecond);
    everyMs.timers.Advance(1000);
    uint64_t everyBefore = everyMs.Ticks();
    start = Steady::now();
    everyMs.timers.Advance(60'000);
    double everyMsMs = NsSince(start) / 1e6;
    double everyPerSecond = static_cast<double>(everyMs.Ticks() - everyBefore) / 60.0;

    Bench waiting(1, ShowPlayer::Pacing::kWakeWhenDue, true);
    waiting.timers.Advance(1000);
    uint64_t waitingBefore = waiting.Ticks();
    waiting.timers.Advance(60'000);

    Bench idle(0, ShowPlayer::Pacing::kWakeWhenDue);
    idle.player->SetNextShow(nullptr);
    idle.timers.Advance(1000);
    uint64_t idleBefore = idle.Ticks();
    idle.timers.Advance(60'000);

    std::printf(
        "show-timer wake-ups per second, one 40 fps sequence: %6.1f (every-millisecond ticking: "
        "%.1f)\n",
        perSecond, everyPerSecond);
    std::printf("show-timer wake-ups per second, waiting for a trigger: %4.1f\n",
                static_cast<double>(waiting.Ticks() - waitingBefore) / 60.0);
    std::printf("show-timer wake-ups per second, idle with no show:     %4.1f\n",
                static_cast<double>(idle.Ticks() - idleBefore) / 60.0);
    std::printf(
        "one virtual minute of the 40 fps show: %.1f ms waking when due, %.1f ms ticking every "
        "millisecond\n",
        wakeMs, everyMsMs);
    if (perSecond > 50) {
      std::printf("  MISSED: target at most about 50 wake-ups a second\n");
      ok = false;
    }
    if (idle.Ticks() != idleBefore) {
      std::printf("  MISSED: an idle engine must not wake\n");
      ok = false;
    }
  }
  return ok ? 0 : 1;
}
