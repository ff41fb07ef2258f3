#include "Player.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <memory>

#include "ConsoleLog.h"
#include "SyncProbe.h"
#include "TerminalScreen.h"
#include "config/NetworkPreferences.h"
#include "config/Settings.h"
#include "host/frmMonitor.h"
#include "platform/AsioTimerService.h"
#include "platform/EventLoop.h"
#include "platform/FileRegistryStore.h"
#include "platform/InstanceLock.h"
#include "platform/LinuxProcessMemory.h"
#include "platform/LocalChannelIO.h"
#include "platform/LocalFileSystem.h"
#include "platform/LocalTextFiles.h"
#include "platform/PlatformPaths.h"
#include "platform/PosixFiles.h"
#include "platform/PosixProcessSpawner.h"
#include "platform/Realtime.h"
#include "platform/SystemClock.h"
#include "platform/UnixTrayLink.h"
#include "platform/media/MediaProcessPlayer.h"
#include "show/ShowPlayer.h"
#include "suite/channelio/ChannelIOControl.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/NetworkUniverseMap.h"
#include "suite/shellcmd/SpawningShellCommandManager.h"
#include "support/Error.h"

namespace tav::player {
namespace {

// The log of the parts built before the form (the control, the media
// player): their lines go to the form once it exists, to standard error
// before that.
class LogRelay : public MessageLog {
 public:
  LogRelay(ConsoleLog& console, const Clock& clock) : m_console(console), m_clock(clock) {}
  void Attach(MessageLog* target) { m_target = target; }
  void LogMessage(int32_t level, const std::string& szText,
                  const SequenceIdentity* seqInfo = nullptr) override {
    if (m_target) {
      m_target->LogMessage(level, szText, seqInfo);
    } else if (level > 0 && !szText.empty()) {
      m_console.Write(level, m_clock.Now(), szText);
    }
  }

 private:
  ConsoleLog& m_console;
  const Clock& m_clock;
  MessageLog* m_target = nullptr;
};

void Say(const std::string& text) {
  std::fprintf(stderr, "showplayer: %s\n", text.c_str());
}

int ExitStatusOf(HostEnd end) {
  switch (end) {
    case HostEnd::kShowsNotEnabled:
      return kExitShowsNotEnabled;
    case HostEnd::kRestart:
      return kExitRestart;
    default:
      return kExitEnded;
  }
}

}  // namespace

int RunPlayer(const PlayerOptions& options) {
  std::string socketPath = UnixTrayLink::DefaultSocketPath();
  InstanceLock lock(InstanceLock::PathForSocket(socketPath));
  if (!lock.Held()) {
    Say(lock.Problem());
    return lock.HeldElsewhere() ? kExitAnotherInstance : kExitShowsNotEnabled;
  }
  // A tray that goes away mid-write must not end the player.
  std::signal(SIGPIPE, SIG_IGN);

  EventLoop loop;
  frmMonitor* form = nullptr;
  int signalsSeen = 0;
  // Signals are taken from here on; one that comes while the form loads is
  // acted on as soon as the loop runs.
  auto onSignal = [&](int) {
    if (!form || form->Unloaded()) return;
    if (++signalsSeen == 1) {
      form->RequestGracefulShutdown();
    } else {
      form->ImmediateShutdown("Immediate shutdown requested");
    }
  };
  loop.OnSignal(SIGTERM, onSignal);
  loop.OnSignal(SIGINT, onSignal);

  ConsoleLog console(stderr);
  auto clock = std::make_shared<SystemClock>();
  LogRelay relay(console, *clock);
  AsioTimerService timers(loop);
  timers.SetFailureReporter([&](const std::string& timer, const std::string& what) {
    relay.LogMessage(3, timer + " Error: " + what);
  });
  FileRegistryStore registry(RegistryFilePath(), [&](const std::string& problem) {
    relay.LogMessage(2, "Settings file: " + problem);
  });
  PathDefaults pathDefaults = SystemPathDefaults();
  Settings settings(registry, pathDefaults);

  std::unique_ptr<UnixTrayLink> link;
  try {
    link = std::make_unique<UnixTrayLink>(loop, socketPath);
  } catch (const Error& e) {
    Say("cannot listen for the tray at " + socketPath + ": " + e.Description());
    return kExitShowsNotEnabled;
  }

  LocalTextFiles files;
  std::shared_ptr<FileSystem> fileSystem = LocalFileSystem();
  auto resolver = std::make_shared<PathResolver>(
      fileSystem, PathResolver::DefaultFolders(settings.UserDataPath()));
  // A crash or a power cut in the middle of writing a schedule or an
  // exported sequence leaves its temporary beside it; nobody else will ever
  // remove it. (The settings file's folder is cleaned by its store.)
  {
    std::string folders[] = {settings.UserDataPath(),
                             resolver->Folder(PathResolver::kKindSequence)};
    for (const std::string& folder : folders) {
      if (folder.empty()) continue;
      if (int removed = RemoveStaleTemporaries(folder); removed > 0) {
        relay.LogMessage(1, "Removed " + std::to_string(removed) +
                                " unfinished temporary file(s) from " + folder);
      }
    }
  }
  NetworkPreferences prefs;
  try {
    prefs.InitFromRegistry(registry);
  } catch (const Error&) {
    // The engine reads them again and reports what is wrong.
  }
  auto library =
      std::make_shared<FileSequenceLibrary>(clock, fileSystem, resolver, UniverseMapOf(prefs));
  auto memory = std::make_shared<LinuxProcessMemory>();
  auto shellCommands = std::make_shared<SpawningShellCommandManager>(
      std::make_shared<PosixProcessSpawner>(), timers);

  LocalChannelIO channelIO(loop, *clock, timers, relay, registry);
  const std::shared_ptr<ChannelIOControl>& control = channelIO.Control();

  // The music and video play in the media process, beside this program (or
  // as $TAV_MEDIA_HELPER says), started by the first media file and ended
  // after the idle limit without one. Without it the shows go on without
  // sound: it logs why, and each media file tries to start it again.
  MediaProcessPlayer media(loop, relay, MpvOutputs::FromSettings(settings),
                           MediaProcessPlayer::DefaultProgramPath(), MediaProcessTiming{});

  // Only the loop (timers, frames, the engine) runs at real-time priority;
  // media processes, started before or after, run at normal priority.
  if (options.realtimePriority > 0) {
    std::string refused = RequestRealtimePriority(options.realtimePriority);
    if (refused.empty()) {
      relay.LogMessage(1,
                       "Playing at real-time priority " + std::to_string(options.realtimePriority));
    } else {
      relay.LogMessage(2,
                       "Real-time priority refused (" + refused + "); playing at normal priority");
    }
  }

  HostServices services{
      .timers = timers,
      .clock = *clock,
      .registry = registry,
      .pathDefaults = pathDefaults,
      .trayLink = *link,
      .files = files,
      .cio = control,
      .media = media,
      .memory = memory,
      .library = library,
      .fileSystem = fileSystem,
      .resolver = resolver,
      .shellCommands = shellCommands,
      // With no tray connected the log line of the message box is on
      // standard error already.
      .messageBox =
          [&](const std::string& text) {
            if (form && form->TrayConnected()) console.Write(3, clock->Now(), text);
          },
      .onUnloaded = [&] { loop.Stop(); },
      .networkPreferencesApplied =
          [&](const NetworkPreferences& applied) {
            library->SetUniverseMap(UniverseMapOf(applied));
          },
  };
  frmMonitor monitor(std::move(services));
  form = &monitor;
  relay.Attach(&monitor);
  monitor.SetLogEcho([&](int32_t level, DateTime now, const std::string& text) {
    console.Write(level, now, text);
  });

  std::unique_ptr<TerminalScreen> screen;
  if (options.view) {
    LevelViewSelection selection;
    std::string error;
    if (!options.viewSpec.empty() && !ParseLevelViewSelection(options.viewSpec, selection, error)) {
      Say("--view=" + options.viewSpec + ": " + error);
      return kExitShowsNotEnabled;
    }
    if (selection.universes.empty() && selection.tavUnits.empty()) {
      for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
        if (prefs.DMXUniverse(i).Enabled())
          selection.universes.push_back(prefs.DMXUniverse(i).Universe());
      }
    }
    screen = std::make_unique<TerminalScreen>(
        control->Levels(), std::move(selection), console, *clock, timers, [&]() -> std::string {
          std::string show = "no show";
          if (ShowPlayer* engine = monitor.Engine(); engine && engine->CurrentShow()) {
            show = engine->CurrentShow()->Monitoring()->Filename();
          }
          return "showplayer  " + clock->Now().ToText() + "  " + show +
                 (signalsSeen ? "  (winding down; Ctrl-C again ends at once)"
                              : "  (Ctrl-C winds the show down and ends)");
        });
  }

  std::unique_ptr<SyncProbe> probe;
  if (const char* where = std::getenv("TAV_SYNC_PROBE")) {
    if (auto parsed = SyncProbe::Parse(where)) {
      probe = std::make_unique<SyncProbe>(control->Levels(), media, *parsed);
    } else {
      Say(std::string("TAV_SYNC_PROBE=") + where + " is not UNIVERSE:SLOT:PERIOD_MS; no probe");
    }
  }
  // The view and the probe look at the levels right after a frame went out.
  if (screen || probe) {
    control->SetOnFrameSent([&](uint32_t tick) {
      if (screen) screen->OnFrame(tick);
      if (probe) probe->OnFrame();
    });
  }

  monitor.Form_Load(options.commandLine);
  if (!monitor.Unloaded()) loop.Run();
  control->SetOnFrameSent(nullptr);
  if (screen) screen->Finish();
  if (probe) Say(probe->Report());
  return ExitStatusOf(monitor.End());
}

}  // namespace tav::player
