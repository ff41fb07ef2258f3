#include "Simulation.h"

#include <algorithm>
#include <chrono>
#include <memory>
#include <set>
#include <thread>
#include <utility>
#include <vector>

#include "ReadOnlyStores.h"
#include "SimulatedMediaPlayer.h"
#include "Surroundings.h"
#include "config/MemoryRegistryStore.h"
#include "config/NetworkPreferences.h"
#include "host/HostLog.h"
#include "host/frmMonitor.h"
#include "platform/LocalFileSystem.h"
#include "platform/LocalTextFiles.h"
#include "ports/ManualClock.h"
#include "ports/VirtualTimerService.h"
#include "schedule/MonitoredShowEvent.h"
#include "schedule/ScheduleLookup.h"
#include "schedule/TimeRange.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/NetworkUniverseMap.h"
#include "suite/seqlib/PathResolver.h"
#include "support/Error.h"

namespace tav::simulation {
namespace {

constexpr const char* kShowStarting = "Starting show: ";
constexpr const char* kShowFinished = "Finished show: ";
constexpr const char* kShowWindingDown = "Current show is entering shutdown mode";

// How much virtual time one step of a run covers: as fast as possible, a
// minute at a time (the loop looks between steps whether the player ended);
// paced, a tenth of a real second.
constexpr uint64_t kFastStepMs = 60'000;
constexpr auto kPacedStep = std::chrono::milliseconds(100);
// Decoded FSEQ blocks kept between the plays of a sequence.
constexpr size_t kFseqBlockCacheBytes = size_t{256} << 20;

const char* SourceWord(ShowSource source) {
  switch (source) {
    case ShowSource::kOnDemand:
      return "on demand";
    case ShowSource::kYear:
      return "year";
    case ShowSource::kWeek:
      return "week";
    case ShowSource::kNothing:
      break;
  }
  return "";
}

bool StartsWith(const std::string& text, std::string_view prefix) {
  return text.compare(0, prefix.size(), prefix) == 0;
}

// Everything the form is built from, and the timeline it fills.
class Run {
 public:
  explicit Run(const SimulationSetup& setup)
      : m_setup(setup),
        m_clock(std::make_shared<ManualClock>(setup.from)),
        m_files(m_disk),
        m_fileSystem(std::make_shared<ReadOnlyFileSystem>(LocalFileSystem())),
        m_outputs(std::make_shared<SimulatedOutputs>()),
        m_media(*m_clock, m_timers, m_fileSystem,
                [this](const std::string& path, const MediaLength& length) {
                  MediaOpened(path, length);
                }),
        m_shell(std::make_shared<SkippedShellCommands>([this](const std::string& commandLine) {
          Note("shell command not run: " + commandLine);
        })) {
    m_clock->Follow(m_timers);
    m_registry.Document() = setup.settings;
  }

  SimulationReport Go() {
    Settings settings(m_registry, m_setup.pathDefaults);
    m_userData = settings.UserDataPath();
    if (!m_userData.empty() && m_userData.back() != '/') m_userData += '/';
    auto resolver = std::make_shared<PathResolver>(
        m_fileSystem, PathResolver::DefaultFolders(settings.UserDataPath()));
    NetworkPreferences prefs;
    try {
      prefs.InitFromRegistry(m_registry);
    } catch (const Error&) {
      // The engine reads them again and reports what is wrong.
    }
    auto files = std::make_shared<FileSequenceLibrary>(m_clock, m_fileSystem, resolver,
                                                       UniverseMapOf(prefs));
    // A looping sequence plays hundreds of times in a simulated evening:
    // inflate each block once. The files are only read here.
    files->SetFseqBlockCache(std::make_shared<FseqBlockCache>(kFseqBlockCacheBytes));
    auto library = std::make_shared<ExportSkippingLibrary>(
        files, [this](const std::string& path) { Note("compressed export not written: " + path); });
    HostServices services{
        .timers = m_timers,
        .clock = *m_clock,
        .registry = m_registry,
        .pathDefaults = m_setup.pathDefaults,
        .trayLink = m_link,
        .files = m_files,
        .cio = m_outputs,
        .media = m_media,
        .memory = std::make_shared<SteadyMemory>(),
        .library = library,
        .fileSystem = m_fileSystem,
        .resolver = resolver,
        .shellCommands = m_shell,
        // The form logs the message box's text as an error line too.
        .messageBox = [](const std::string&) {},
        .onUnloaded = [] {},
        .networkPreferencesApplied =
            [files](const NetworkPreferences& applied) {
              files->SetUniverseMap(UniverseMapOf(applied));
            },
    };
    frmMonitor form(std::move(services));
    m_form = &form;
    form.SetObserver({
        .onLog = [this](int32_t level, const std::string& text,
                        const SequenceIdentity* seqInfo) { Logged(level, text, seqInfo); },
        .onSequence = [this](const SequenceIdentity& seqInfo,
                             bool started) { SequenceNotice(seqInfo, started); },
    });
    form.Form_Load(m_setup.onDemandOnly ? frmMonitor::kOnDemandOnlySwitch : "");
    if (!m_setup.onDemandShow.empty()) RequestOnDemand(form);

    const uint64_t totalMs =
        static_cast<uint64_t>(std::max<int64_t>(m_setup.to.SecondsSince(m_setup.from), 0)) * 1000;
    RunUntil(form, totalMs);
    if (form.Unloaded() && m_timers.NowMs() < totalMs) m_report.endedEarlyAt = m_clock->Now();
    StillRunning();
    form.Form_Unload();
    m_form = nullptr;
    m_report.outputs = m_outputs->Counts();
    return std::move(m_report);
  }

 private:
  void RunUntil(frmMonitor& form, uint64_t totalMs) {
    auto realNext = std::chrono::steady_clock::now();
    while (m_timers.NowMs() < totalMs && !form.Unloaded()) {
      uint64_t step = kFastStepMs;
      if (m_setup.speed > 0) {
        step = static_cast<uint64_t>(m_setup.speed *
                                     std::chrono::duration<double, std::milli>(kPacedStep).count());
        realNext += kPacedStep;
        std::this_thread::sleep_until(realNext);
      }
      step = std::clamp<uint64_t>(step, 1, totalMs - m_timers.NowMs());
      try {
        m_timers.Advance(step);
      } catch (const std::exception& e) {
        // The player catches its own failures; one that escapes a timer
        // would have ended the real program.
        Add(EventKind::kError, std::string("the player stopped: ") + e.what());
        m_report.endedEarlyAt = m_clock->Now();
        return;
      }
    }
  }

  void RequestOnDemand(frmMonitor& form) {
    auto range = std::make_shared<TimeRange>();
    range->SetStartTime(m_setup.from);
    range->SetEndTime(m_setup.to);
    MonitoredShowEvent event;
    event.SetFilename(m_setup.onDemandShow);
    event.SetRange(range);
    event.SetScheduleType(kScheduleTypeOnDemand);
    form.ShowOnDemand(event.Serialize());
  }

  void Logged(int32_t level, const std::string& text, const SequenceIdentity* seqInfo) {
    if (level >= 3) {
      Add(EventKind::kError, ComposeLogText(text, seqInfo));
    } else if (level == 2) {
      Add(EventKind::kWarning, ComposeLogText(text, seqInfo));
    } else if (StartsWith(text, kShowStarting)) {
      ShowStarted(text.substr(std::string_view(kShowStarting).size()));
    } else if (StartsWith(text, kShowFinished)) {
      std::string file = text.substr(std::string_view(kShowFinished).size());
      Add(EventKind::kShowEnd, file, file);
      m_currentShow.clear();
    } else if (text == kShowWindingDown) {
      Add(EventKind::kShowWindingDown, m_currentShow, m_currentShow);
    } else if (m_setup.withInformation) {
      // Sequence starts and ends have lines of their own already.
      if (seqInfo && (text == "Starting" || text == "Ending")) return;
      Add(EventKind::kInfo, ComposeLogText(text, seqInfo));
    }
  }

  void ShowStarted(const std::string& file) {
    m_currentShow = file;
    TimelineEvent event;
    event.kind = EventKind::kShowStart;
    event.text = file;
    event.file = file;
    if (m_form) {
      const ShowDecision& decision = m_form->LastShowDecision();
      event.source = SourceWord(decision.Source);
      event.reason = decision.Reason;
    }
    Add(std::move(event));
  }

  void SequenceNotice(const SequenceIdentity& seqInfo, bool started) {
    std::string section = PlayTypeName(seqInfo.PlayType());
    std::string file = seqInfo.Filename();
    auto running = std::make_pair(section, file);
    if (started) {
      m_running.push_back(running);
    } else if (auto it = std::find(m_running.begin(), m_running.end(), running);
               it != m_running.end()) {
      m_running.erase(it);
    }
    TimelineEvent event;
    event.kind = started ? EventKind::kSequenceStart : EventKind::kSequenceStop;
    event.text = section + ": " + file;
    event.file = file;
    event.section = section;
    Add(std::move(event));
  }

  void MediaOpened(const std::string& path, const MediaLength& length) {
    // A file's length is the same each time it plays.
    if (!m_mediaSeen.insert(path).second) return;
    switch (length.found) {
      case MediaLength::Found::kSeconds:
        Note("media " + path + " plays " + LengthText(length.seconds) + " (from its " +
             length.source + ")");
        break;
      case MediaLength::Found::kUnknown:
        Note("media " + path + ": length not measured (" + length.source +
             "); the sequence's length decides");
        break;
      case MediaLength::Found::kMissing:
      case MediaLength::Found::kUnreadable:
        // The player reports the failure itself, as an error.
        break;
    }
  }

  void StillRunning() {
    if (!m_currentShow.empty()) {
      Add(EventKind::kEnd, "show still running: " + m_currentShow, m_currentShow);
    }
    for (const auto& [section, file] : m_running) {
      Add(EventKind::kEnd, "sequence still running: " + section + ": " + file, file);
    }
  }

  void Note(const std::string& text) { Add(EventKind::kNote, text); }

  void Add(EventKind kind, std::string text, std::string file = "") {
    TimelineEvent event;
    event.kind = kind;
    event.text = std::move(text);
    event.file = std::move(file);
    Add(std::move(event));
  }

  // Files in the user data folder are named from there ("Sequences/a.tseq").
  std::string Short(std::string text) const {
    if (m_userData.size() <= 1) return text;
    for (size_t at; (at = text.find(m_userData)) != std::string::npos;) {
      text.erase(at, m_userData.size());
    }
    return text;
  }

  void Add(TimelineEvent event) {
    event.at = m_clock->Now();
    event.text = Short(std::move(event.text));
    event.file = Short(std::move(event.file));
    TimelineEvent copy = m_setup.onEvent ? event : TimelineEvent{};
    if (m_report.timeline.Add(std::move(event)) && m_setup.onEvent) m_setup.onEvent(copy);
  }

  const SimulationSetup& m_setup;
  VirtualTimerService m_timers;
  std::shared_ptr<ManualClock> m_clock;
  MemoryRegistryStore m_registry;
  LocalTextFiles m_disk;
  SnapshotTextFiles m_files;
  std::shared_ptr<ReadOnlyFileSystem> m_fileSystem;
  std::shared_ptr<SimulatedOutputs> m_outputs;
  SimulatedMediaPlayer m_media;
  NoTrayLink m_link;
  std::shared_ptr<SkippedShellCommands> m_shell;
  frmMonitor* m_form = nullptr;

  SimulationReport m_report;
  std::string m_userData;
  std::set<std::string> m_mediaSeen;
  std::string m_currentShow;
  std::vector<std::pair<std::string, std::string>> m_running;  // (section, file)
};

}  // namespace

SimulationReport Simulate(const SimulationSetup& setup) {
  return Run(setup).Go();
}

}  // namespace tav::simulation
