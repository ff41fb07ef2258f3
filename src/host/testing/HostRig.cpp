#include "host/testing/HostRig.h"

#include <algorithm>

#include "host/Msg.h"
#include "platform/LocalFileSystem.h"
#include "platform/LocalTextFiles.h"
#include "show/ShowPlayer.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/PathResolver.h"

namespace tav {
namespace {

std::string PlaylistText(const std::string& head, const std::vector<std::string>& names,
                         const std::string& tail) {
  std::string entries;
  for (const std::string& name : names) entries += (entries.empty() ? "(" : ",") + name;
  if (!entries.empty()) entries += ")";
  return "(" + head + "," + entries + "," + tail + ")";
}

int32_t WeekSeconds(DateTime t) {
  return t.DayOfWeek() * 86400 + t.SecondOfDay();
}

}  // namespace

std::string HostRig::ShowText(const ShowSections& s) {
  return "(" + PlaylistText("0,1,2,0,", s.startup, "T,F,F") + "," +
         PlaylistText("0,1,2,0,", s.shutdown, "T,F,F") + "," +
         PlaylistText("1,0,1,0,", s.main, "T,F,F") + "," +
         PlaylistText("0,1,2,0,", s.musical, "T,F,F") + ",," +
         PlaylistText("2,0,1,0,", {}, "F,F,F") + "," + s.groups + ", 0,,F)";
}

HostRig::HostRig(DateTime startTime)
    : start(startTime),
      folder("tav-host"),
      clock(std::make_shared<ManualClock>(startTime, 5'000'000)),
      cio(std::make_shared<RecordingChannelIO>()),
      media(*clock, timers),
      memory(std::make_shared<FixedProcessMemory>(20 * 1024 * 1024)),
      shell(std::make_shared<RecordingShellCommandManager>()),
      m_files(std::make_unique<LocalTextFiles>()) {
  clock->Follow(timers);
  cio->SetRecordLevels(false);
  // Exports would write files beside the sequences; the tests do not need them.
  Settings(registry, PathDefaults{folder.Path(), folder.Path(), '/'})
      .Set(settings::kUseCompressedSequences, false);
}

HostRig::~HostRig() {
  form.reset();
}

std::string HostRig::Write(const std::string& relative, const std::string& bytes) {
  return folder.Write(relative, bytes);
}

void HostRig::WriteSequence(const std::string& name, int32_t ms) {
  Write("Sequences/" + name, R"({"tessavar_sequence": 1, "length_ms": )" + std::to_string(ms) +
                                 R"(, "channels": [{"dmx": {"universe": 1, "slot": 1},)"
                                 R"( "effects": [{"at": 0, "type": "set", "level": 100}]}]})");
}

void HostRig::WriteWeekSchedule(const std::vector<WeeklyShow>& shows) {
  std::string text;
  for (const WeeklyShow& show : shows) {
    text += (text.empty() ? "((" : ",(") + std::to_string(WeekSeconds(show.to)) + ",2,(, 0," +
            show.file + ")," + std::to_string(WeekSeconds(show.from)) + ")";
  }
  if (!text.empty()) text += ")";
  Write("weeksched.tsc", text + "\r\n");
}

void HostRig::Create() {
  auto fileSystem = LocalFileSystem();
  auto resolver =
      std::make_shared<PathResolver>(fileSystem, PathResolver::DefaultFolders(folder.Path()));
  HostServices services{
      .timers = timers,
      .clock = *clock,
      .registry = registry,
      .pathDefaults = PathDefaults{folder.Path(), folder.Path(), '/'},
      .trayLink = link,
      .files = *m_files,
      .cio = cio,
      .media = media,
      .memory = memory,
      .library = std::make_shared<FileSequenceLibrary>(clock, fileSystem, resolver),
      .fileSystem = fileSystem,
      .resolver = resolver,
      .shellCommands = shell,
      .messageBox = [this](const std::string& text) { messageBoxes.push_back(text); },
      .onUnloaded =
          [this] {
            ++unloads;
            unloadedAtMs = timers.NowMs();
          },
      .networkPreferencesApplied =
          [this](const NetworkPreferences&) { ++networkPreferencesApplied; },
  };
  form = std::make_unique<frmMonitor>(std::move(services));
  form->SetLogEcho([this](int32_t level, DateTime, const std::string& text) {
    std::string line = std::to_string(level) + " " + text;
    for (size_t at; (at = line.find(folder.Path())) != std::string::npos;) {
      line.erase(at, folder.Path().size());
    }
    m_lines.push_back(line);
  });
}

void HostRig::Load(const std::string& commandLine) {
  if (!form) Create();
  form->Form_Load(commandLine);
}

TrayLinkPair::Window& HostRig::ConnectTray() {
  TrayLinkPair::Window& window = link.Connect();
  window.Send(CopyDataFrame(window.Handle(), TypedMessageText(kMsgTrayIntroduction, "")));
  return window;
}

void HostRig::Request(int32_t type, const std::string& body, TrayLinkPair::Window* from) {
  if (!from) {
    if (!m_silentTray) m_silentTray = &link.Connect();
    from = m_silentTray;
  }
  from->Send(CopyDataFrame(from->Handle(), TypedMessageText(type, body)));
}

bool HostRig::Logged(const std::string& text) const {
  return CountLogged(text) > 0;
}

int HostRig::CountLogged(const std::string& text) const {
  return static_cast<int>(std::count_if(m_lines.begin(), m_lines.end(), [&](const std::string& l) {
    return l.size() > 2 && l.compare(2, std::string::npos, text) == 0;
  }));
}

bool HostRig::HasCurrentShow() const {
  return form && form->Engine() && form->Engine()->CurrentShow() != nullptr;
}

std::string HostRig::CurrentShowFile() const {
  if (!HasCurrentShow()) return "";
  return form->Engine()->CurrentShow()->Monitoring()->Filename();
}

}  // namespace tav
