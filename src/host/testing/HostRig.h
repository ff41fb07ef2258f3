#pragma once
// The host form on virtual time, with everything it is built from: a
// virtual timer service and a clock that follows it, an in-memory settings
// store, the in-process tray link, the recording I/O control, the scripted
// media player, a memory probe, a recording shell-command manager, and the
// real file adapters on a user data folder of the test's own (schedules,
// show files and plain sequences are real files there). The form's log
// lines, message boxes and unload are recorded.
//
//   HostRig rig;
//   rig.WriteSequence("main.tseq", 10'000);
//   rig.WriteShow("xmas.show", HostRig::ShowText({.main = {"main.tseq"}}));
//   rig.WriteWeekSchedule({{"xmas.show", rig.start, rig.start.AddSeconds(3600)}});
//   rig.Load();
//   rig.Advance(6'000);
//   EXPECT_TRUE(rig.Logged("Starting show: xmas.show"));

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "config/MemoryRegistryStore.h"
#include "host/frmMonitor.h"
#include "host/testing/TrayLinkPair.h"
#include "ports/testing/FixedProcessMemory.h"
#include "ports/testing/ManualClock.h"
#include "ports/testing/VirtualTimerService.h"
#include "show/testing/ScriptedMediaPlayer.h"
#include "suite/channelio/testing/RecordingChannelIO.h"
#include "suite/shellcmd/testing/RecordingShellCommandManager.h"
#include "support/testing/TempFolder.h"

namespace tav {

class HostRig {
 public:
  // A show of a week schedule, from `from` to `to` (week times are taken
  // from the two moments).
  struct WeeklyShow {
    std::string file;
    DateTime from;
    DateTime to;
  };
  // The sections of a show file, by sequence name (in Sequences/).
  struct ShowSections {
    std::vector<std::string> startup = {};
    std::vector<std::string> main = {};
    std::vector<std::string> musical = {};
    std::vector<std::string> shutdown = {};
    // The interactive groups field as the show file writes it.
    std::string groups = {};
  };
  static std::string ShowText(const ShowSections& sections);

  // Tuesday 24 December 2024, 18:00:00.
  explicit HostRig(DateTime start = DateTime::FromParts(2024, 12, 24, 18, 0, 0));
  ~HostRig();

  // Files in the user data folder.
  std::string Write(const std::string& relative, const std::string& bytes);
  // A plain sequence in Sequences/ that sets one DMX slot and lasts `ms`.
  void WriteSequence(const std::string& name, int32_t ms);
  void WriteShow(const std::string& name, const std::string& text) { Write(name, text); }
  void WriteWeekSchedule(const std::vector<WeeklyShow>& shows);

  // Makes the form (creation) and loads it with `commandLine`.
  void Create();
  void Load(const std::string& commandLine = "");
  void Advance(uint64_t ms) { timers.Advance(ms); }
  // Advances in steps of `stepMs` until `done` holds or `limitMs` passed;
  // false when it never held.
  template <typename Condition>
  bool AdvanceUntil(Condition done, uint64_t limitMs, uint64_t stepMs = 1) {
    for (uint64_t passed = 0; passed <= limitMs; passed += stepMs) {
      if (done()) return true;
      timers.Advance(stepMs);
    }
    return done();
  }

  // A tray window that has introduced itself (message 2).
  TrayLinkPair::Window& ConnectTray();
  // A request from a tray window (a new, silent one unless given).
  void Request(int32_t type, const std::string& body = "", TrayLinkPair::Window* from = nullptr);

  // Log lines of level 1 or more, "<level> <text>", in order, as the form's
  // echo saw them while no tray was connected, with the user data folder
  // cut out of paths ("Starting Animation: Sequences/main.tseq").
  const std::vector<std::string>& Lines() const { return m_lines; }
  bool Logged(const std::string& text) const;
  int CountLogged(const std::string& text) const;
  bool HasCurrentShow() const;
  std::string CurrentShowFile() const;
  uint64_t NowMs() const { return timers.NowMs(); }

  const DateTime start;
  TempFolder folder;
  VirtualTimerService timers;
  std::shared_ptr<ManualClock> clock;
  MemoryRegistryStore registry;
  TrayLinkPair link;
  std::shared_ptr<RecordingChannelIO> cio;
  ScriptedMediaPlayer media;
  std::shared_ptr<FixedProcessMemory> memory;
  std::shared_ptr<RecordingShellCommandManager> shell;
  std::unique_ptr<frmMonitor> form;
  std::vector<std::string> messageBoxes;
  int unloads = 0;
  // How often the engine's network preferences were reported as applied.
  int networkPreferencesApplied = 0;
  // When each unload happened, virtual ms.
  uint64_t unloadedAtMs = 0;

 private:
  std::unique_ptr<TextFileStore> m_files;
  std::vector<std::string> m_lines;
  TrayLinkPair::Window* m_silentTray = nullptr;
};

}  // namespace tav
