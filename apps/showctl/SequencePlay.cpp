// showctl sequence play FILE: the sequence's events go to the control as
// the show engine hands them over (effects, DMX and TAV level blocks, then
// "send what has been accumulated"); the control sends each frame on its
// deadline. Between frames the command sleeps until the sequence's next
// event is due, so playing costs a few wake-ups per frame and nothing more.

#include <fmt/format.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <iostream>
#include <memory>
#include <optional>

#include "CommandRegistry.h"
#include "SequencePlay.h"
#include "SettingsStore.h"
#include "UserData.h"
#include "config/NetworkPreferences.h"
#include "platform/AsioTimerService.h"
#include "platform/EventLoop.h"
#include "platform/FileRegistryStore.h"
#include "platform/LocalChannelIO.h"
#include "platform/LocalFileSystem.h"
#include "platform/PlatformPaths.h"
#include "platform/Realtime.h"
#include "platform/SystemClock.h"
#include "suite/channelio/ChannelIOControl.h"
#include "suite/channelio/LevelViewDriver.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/PlayEvent.h"
#include "support/Error.h"

namespace tav::showctl {
namespace {

constexpr uint32_t kPumpMs = 50;

struct PlayOptions {
  std::string file;
  bool loop = false;
  double seconds = 0;
  std::string view;
  bool ascii = false;
  bool compact = false;
  int realtime = 0;
  int lookahead = -1;
  bool quiet = false;
};

// Log lines of the control go to standard error, information only when
// asked for.
class StderrLog : public MessageLog {
 public:
  explicit StderrLog(bool quiet) : m_quiet(quiet) {}
  void LogMessage(int32_t level, const std::string& text, const SequenceIdentity*) override {
    if (level <= 0 || (m_quiet && level < 2)) return;
    std::cerr << "showctl: "
              << (level >= 3   ? "error: "
                  : level == 2 ? "warning: "
                               : "")
              << text << "\n";
  }

 private:
  bool m_quiet;
};

int TerminalWidth() {
  winsize size{};
  if (::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 20) return size.ws_col;
  return 80;
}

void Dispatch(ChannelIO& control, const PlayEvent& e) {
  if (e.playEventType == kPlayEventEffect) {
    control.OutputEffect(e.devType, e.lNetwork, e.byteUnit, e.lCircuit, e.szChannelName,
                         e.effectType, e.lDuration, e.lStartIntensity, e.lEndIntensity, e.lPriority,
                         e.dueTick);
  } else if (e.playEventType == kPlayEventLevels && e.devType == kFamilyDMX) {
    control.OutputDMXLevels(e.lNetwork, e.nIntensityBlobStartAddress, e.nIntensityBlobCount,
                            e.byteIntensityBlob.data(), e.dueTick);
  } else if (e.playEventType == kPlayEventLevels && e.devType == kFamilyTAV) {
    control.OutputTAVLevels(e.lNetwork, e.byteUnit, e.nIntensityBlobStartAddress,
                            e.nIntensityBlobCount, e.byteIntensityBlob.data(), e.dueTick);
  }
}

bool AnySerialNetwork(const NetworkPreferences& prefs) {
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    if (!prefs.TAVNetwork(i).Port().empty()) return true;
  }
  return !prefs.X10Port().empty() || !prefs.FennickPort().empty();
}

// Opens the serial networks as the show engine does: every TAV network with
// a port, X10 and Fennick when the sequence uses them. A network that cannot
// open stays off; the others play.
void OpenSerialNetworks(ChannelIO& control, const NetworkPreferences& prefs,
                        const Sequence& sequence, MessageLog& log) {
  auto open = [&log](const std::string& what, const std::function<void()>& action) {
    try {
      action();
    } catch (const Error& e) {
      log.LogMessage(2, what + ": " + e.Description() + "; it stays off");
    }
  };
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const TAVNetworkPreferences& tav = prefs.TAVNetwork(i);
    if (tav.Port().empty()) continue;
    open("TAV network " + std::to_string(i + 1) + " on " + tav.Port(), [&] {
      control.SetTAVNetworkSpeed(i, tav.Speed());
      control.SetTAVNetworkOldMCP(i, tav.OldMCP());
      control.SetTAVNetworkEnhanced(i, tav.Enhanced());
      control.SetTAVNetworkPort(i, tav.Port());
    });
  }
  if (sequence.UsesX10() && !prefs.X10Port().empty()) {
    open("X10 network on " + prefs.X10Port(), [&] { control.OpenX10Network(prefs.X10Port()); });
  }
  if (sequence.UsesFennick() && !prefs.FennickPort().empty()) {
    open("Fennick network on " + prefs.FennickPort(),
         [&] { control.OpenFennickNetwork(prefs.FennickPort()); });
  }
}

std::string Summary(const ChannelIOStatistics& s, double seconds) {
  return fmt::format("{:.1f} s, {} frames, {} late (worst {} ms), {} packets sent, {} dropped",
                     seconds, s.frames, s.framesLate, s.maxLatenessMs, s.packetsSent,
                     s.packetsDropped);
}

int Play(const PlayOptions& o, const std::string& folder) {
  EventLoop loop;
  auto clock = std::make_shared<SystemClock>();
  std::string registryFile = RegistryFilePath();
  FileRegistryStore store = OpenSettingsStore("");
  NetworkPreferences prefs;
  prefs.InitFromRegistry(store);
  for (const auto& problem : prefs.Problems())
    std::cerr << "showctl: network preferences: " << problem << "\n";

  std::vector<UniverseSpan> spans;
  std::vector<int32_t> configured;
  for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
    const DMXUniversePrefs& u = prefs.DMXUniverse(i);
    if (!u.Enabled() || u.StartChannel() < 1 || u.Size() < 1 || u.Size() > 512) continue;
    spans.push_back({u.Universe(), static_cast<uint32_t>(u.StartChannel() - 1),
                     static_cast<uint32_t>(u.Size())});
    configured.push_back(u.Universe());
  }
  if (spans.empty() && !AnySerialNetwork(prefs)) {
    throw CommandFailed("no DMX universe is set up in the network preferences (" + registryFile +
                        "); docs/outputs.md shows how to add one");
  }

  LevelViewSelection selection;
  if (!o.view.empty() && o.view != "all") {
    std::string error;
    if (!ParseLevelViewSelection(o.view, selection, error)) throw CommandFailed("--view: " + error);
  } else {
    selection.universes = configured;
  }

  if (o.realtime > 0) {
    std::string refused = RequestRealtimePriority(o.realtime);
    if (!refused.empty())
      std::cerr << "showctl: warning: real-time priority refused (" << refused
                << "); playing at normal priority\n";
  }

  StderrLog log(o.quiet);
  AsioTimerService timers(loop);
  LocalChannelIO channelIO(loop, *clock, timers, log, store);
  ChannelIOControl& control = *channelIO.Control();
  control.ApplyNetworkPreferences(prefs);
  control.SetupClient(true, "showctl sequence play", true);

  auto fs = LocalFileSystem();
  PathResolver::FolderLookup folders = PathResolver::DefaultFolders(UserDataFolder());
  if (!folder.empty()) folders = [folder](int32_t) { return folder; };
  auto resolver = std::make_shared<PathResolver>(fs, folders);
  FileSequenceLibrary library(clock, fs, resolver, UniverseMap::FromSpans(spans));
  std::shared_ptr<Sequence> sequence = library.CreateSequence();
  sequence->SetKeepAlive([&control] { control.KeepAlive(); });
  sequence->LoadFile(o.file);
  OpenSerialNetworks(control, prefs, *sequence, log);
  sequence->SetLoopAtEnd(o.loop);
  sequence->SetLightsOffAtEnd(true);
  // Events are handed over one frame ahead: the pump after each frame then
  // prepares the next one, and the frame timer's wake-up is the only one.
  int32_t frameMs = 1000 / std::clamp(prefs.RefreshRate(), 1, 1000);
  const SequenceInfo& info = sequence->Info();
  if (info.format == "fseq" && info.frameCount > 0)
    frameMs = static_cast<int32_t>(info.lengthMs / static_cast<int64_t>(info.frameCount));
  sequence->SetLookaheadMs(o.lookahead >= 0 ? o.lookahead : std::clamp(frameMs, 5, 1000));

  std::unique_ptr<LevelViewDriver> view;
  uint32_t started = clock->TickCount();
  auto elapsed = [&] { return static_cast<uint32_t>(clock->TickCount() - started) / 1000.0; };
  if (!o.view.empty()) {
    LevelViewOptions options;
    options.width = TerminalWidth();
    options.unicode = !o.ascii;
    options.compact = o.compact;
    std::fputs("\x1b[2J", stdout);
    view = std::make_unique<LevelViewDriver>(control.Levels(), selection, options, 200,
                                             [](const std::vector<std::string>& lines) {
                                               std::string screen = "\x1b[H";
                                               for (const auto& line : lines)
                                                 screen += line + "\x1b[K\n";
                                               screen += "\x1b[J";
                                               std::fwrite(screen.data(), 1, screen.size(), stdout);
                                               std::fflush(stdout);
                                             });
  }

  TimerfdDeadlineTimer pumpTimer(loop);
  bool stopping = false;
  bool pumping = false;
  std::optional<uint32_t> sealedUpTo;
  uint32_t limitMs = o.seconds > 0 ? static_cast<uint32_t>(o.seconds * 1000) : 0;
  std::function<void()> pump = [&] {
    // Loading a block of the file may keep the outputs alive, which may
    // send a frame, whose observer pumps: not again inside a pump.
    if (pumping) return;
    pumping = true;
    struct Done {
      bool& flag;
      ~Done() { flag = false; }
    } done{pumping};
    if (!stopping && limitMs && clock->TickCount() - started >= limitMs) {
      stopping = true;
      sequence->StopPlay();
    }
    // At most 50 ms at a time, as the show engine's pump: a sequence that
    // cannot be read as fast as it plays must not hold the loop (or pile
    // frames up) for ever.
    PlayEvent event;
    bool any = false;
    uint32_t last = 0;
    uint32_t began = clock->TickCount();
    bool more = false;
    while (sequence->GetEvent(event)) {
      Dispatch(control, event);
      any = true;
      last = event.dueTick;
      if (clock->TickCount() - began > kPumpMs) {
        more = true;
        break;
      }
    }
    if (any) {
      control.SendAccumulated(last);
      sealedUpTo = last;
    }
    std::optional<int64_t> due =
        more ? std::optional<int64_t>(0) : sequence->MillisecondsUntilDue();
    if (!due) {
      loop.Stop();
      return;
    }
    int64_t in = *due;
    uint32_t next = clock->TickCount() + static_cast<uint32_t>(std::min<int64_t>(in, 60000));
    if (!stopping && limitMs && static_cast<int32_t>(next - (started + limitMs)) > 0)
      next = started + limitMs;
    // A frame still to leave by then wakes the loop anyway, and its observer
    // pumps: one wake-up per frame instead of two.
    if (sealedUpTo && static_cast<int32_t>(*sealedUpTo - clock->TickCount()) > 0 &&
        static_cast<int32_t>(next - *sealedUpTo) >= 0) {
      pumpTimer.Cancel();
      return;
    }
    pumpTimer.SetDeadline(next);
  };
  pumpTimer.SetOnDeadline(pump);
  control.SetOnFrameSent([&](uint32_t tick) {
    if (view) view->OnFrame(tick, o.file + "  " + Summary(control.Statistics(), elapsed()));
    // Right after a frame left: prepare the next while the loop is awake.
    if (!stopping) pump();
  });

  int signals = 0;
  auto onSignal = [&](int) {
    if (++signals > 1) {
      loop.Stop();
      return;
    }
    stopping = true;
    sequence->StopPlay();
    pump();
  };
  loop.OnSignal(SIGINT, onSignal);
  loop.OnSignal(SIGTERM, onSignal);

  sequence->InitializeForPlay(false);
  sequence->StartPlay();
  started = clock->TickCount();
  pump();
  loop.Run();

  control.ReleaseClient();
  FinishWriting(store);  // a new source identifier, if one was made
  ChannelIOStatistics stats = control.Statistics();
  if (view) view->DrawNow(o.file + "  " + Summary(stats, elapsed()));
  if (!o.quiet)
    std::cerr << "showctl: played " << o.file << ": " << Summary(stats, elapsed()) << "\n";
  return 0;
}

}  // namespace

void AddSequencePlayCommand(CLI::App* group, const std::string* folder) {
  auto o = std::make_shared<PlayOptions>();
  auto* play = group->add_subcommand(
      "play",
      "Play a sequence (plain, FSEQ or compressed export) through the lighting outputs of the "
      "network preferences, sending each frame on its deadline; Ctrl-C stops it with the "
      "lights off");
  play->add_option("FILE", o->file, "The sequence to play")->required();
  play->add_flag("--loop", o->loop, "Start again at the end, on the beat");
  play->add_option("--seconds", o->seconds, "Stop (lights off) after this many seconds")
      ->check(CLI::PositiveNumber);
  play->add_option("--view", o->view,
                   "Draw the levels in the terminal: \"all\" (the configured universes) or a "
                   "list such as 1,2,5-8,t1.3 (TAV network 1 unit 3)");
  play->add_flag("--ascii", o->ascii, "Draw the view with ASCII characters only");
  play->add_flag("--compact", o->compact, "One line per universe in the view");
  play->add_option("--realtime", o->realtime,
                   "Keep the frame deadlines at SCHED_FIFO with this priority (1-99; needs "
                   "CAP_SYS_NICE)")
      ->check(CLI::Range(1, 99));
  play->add_option("--lookahead", o->lookahead,
                   "Hand events to the outputs this many milliseconds before they are due "
                   "(default: one frame)")
      ->check(CLI::Range(0, 1000));
  play->add_flag("--quiet", o->quiet, "Print warnings and errors only");
  play->callback([o, folder] {
    int code = Play(*o, folder ? *folder : std::string());
    if (code != 0) throw CommandFailed("playing failed", code);
  });
}

}  // namespace tav::showctl
