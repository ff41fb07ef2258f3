#pragma once
// Everything a whole show needs, on virtual time, for tests (and for a
// simulation of a schedule): a virtual timer service and a clock that
// follows it, an in-memory registry with the settings over it, a memory
// probe, the recording I/O control, the scripted media player, a recording
// shell-command manager, the real sequence library on a folder of the
// test's own, a recording host, and the engine itself. Every record goes to
// one Timeline, with the folder's path cut out.
//
//   ShowRig rig;
//   rig.WriteSequence("main.tseq", data);
//   rig.Start();
//   rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts));
//   rig.Advance(60'000);
//   EXPECT_THAT(rig.timeline.Texts("log"), ...);

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "config/MemoryRegistryStore.h"
#include "config/Settings.h"
#include "ports/testing/FixedProcessMemory.h"
#include "ports/testing/ManualClock.h"
#include "ports/testing/VirtualTimerService.h"
#include "show/Show.h"
#include "show/ShowPlayer.h"
#include "show/testing/RecordingShowHost.h"
#include "show/testing/ScriptedMediaPlayer.h"
#include "show/testing/Timeline.h"
#include "suite/channelio/testing/RecordingChannelIO.h"
#include "suite/seqlib/SequenceData.h"
#include "suite/shellcmd/testing/RecordingShellCommandManager.h"
#include "support/testing/TempFolder.h"

namespace tav {

// The parts of a show, by file name (relative names are made full paths in
// the rig's folder by MakeShow).
struct ShowParts {
  std::vector<std::string> background;
  std::vector<std::string> startup;
  std::vector<std::string> main;
  int32_t animationType = 1;
  std::vector<std::string> musical;
  int32_t musicalType = 1;
  int32_t delay = 0;
  std::string cleanUp;
  bool shuffleWithReplacement = false;
  bool shuffleAllowsBackToBack = false;
  std::vector<std::string> shutdown;
  std::vector<std::shared_ptr<InteractiveGroup>> groups;
  int32_t startupType = 0;
  std::shared_ptr<Trigger> startupTrigger;
  bool preload = false;
  bool lightsOffAtEnd = false;
};

class ShowRig {
 public:
  explicit ShowRig(DateTime start = DateTime::FromParts(2024, 12, 24, 18, 0, 0));
  ~ShowRig();

  // Full path of a name in the rig's folder.
  std::string PathOf(const std::string& name) const { return m_folder / name; }
  // Writes a plain sequence file; returns its full path.
  std::string WriteSequence(const std::string& name, const SequenceData& data);
  // Copies a file of the repository's testdata/ under `name`.
  std::string CopyTestData(const std::string& relative, const std::string& name);
  std::string WriteFile(const std::string& name, const std::string& bytes);

  // A show of these parts, scheduled from `from` for `minutes`.
  std::shared_ptr<Show> MakeShow(const std::string& filename, const ShowParts& parts,
                                 DateTime from = DateTime::FromParts(2024, 12, 24, 18, 0, 0),
                                 int minutes = 240, int32_t scheduleType = 1);
  // An interactive group binding `trigger` to `sequences`.
  std::shared_ptr<InteractiveGroup> Group(bool independent, bool interruptible,
                                          std::shared_ptr<Trigger> trigger,
                                          const std::vector<std::string>& sequences);

  // Makes the engine and calls InitControls.
  void Start(ShowPlayer::Pacing pacing = ShowPlayer::Pacing::kWakeWhenDue);
  void Advance(uint64_t ms) { timers.Advance(ms); }
  // Runs `action` from the loop `ms` from now, as an outside event would
  // arrive (a tray request, an input, the host's next-show step).
  void At(uint64_t ms, std::function<void()> action);
  void Press(int32_t network, int32_t unit, int32_t input, const std::string& name = "");

  VirtualTimerService timers;
  std::shared_ptr<ManualClock> clock;
  Timeline timeline;
  MemoryRegistryStore registry;
  Settings settings;
  std::shared_ptr<FixedProcessMemory> memory;
  std::shared_ptr<RecordingChannelIO> cio;
  ScriptedMediaPlayer media;
  RecordingShellCommandManager shell;
  RecordingShowHost host;
  // What every sequence the engine makes is given: the real sequence
  // library and file system over the rig's folder (kinds 2 and 3 both).
  SequencePlayServices sequenceServices;
  std::unique_ptr<Timer> tmrShowPlayer;
  std::unique_ptr<ShowPlayer> player;
  // Fixed unless a test sets it before Start.
  std::function<double()> random;

 private:
  TempFolder m_folder;
  std::vector<std::unique_ptr<Timer>> m_actions;
};

}  // namespace tav
