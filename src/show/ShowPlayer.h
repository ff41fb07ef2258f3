#pragma once
// The show engine. The host form owns one ShowPlayer, hands it its controls
// once (InitControls) and from then on only tells it which show should run
// next (SetNextShow). Everything else happens in the show timer's tick: it
// starts the next show when none runs, starts queued sequences, services
// every playing sequence (pumps its light events to the hardware-I/O control
// and keeps the musical one in step with the media player), steps the
// show's sections (Startup, Background, Main, Musical with clean-up and
// delay, Interactive, Shutdown), and finishes the show and starts the next.
// Input events of the I/O control start interactive sequences; the media
// player's events show the video form and report media errors.
//
// Pacing. A tick that finds nothing to do has no effect, so the engine does
// not tick every millisecond: after each tick it works out the earliest
// moment at which a tick could do something (a sequence's next event, a
// queued item, the end of the pause between musical pieces, the media
// position check) and sets the show timer to wake it then; an input event,
// a media event, a new next show or WakeUp wakes it at once. What it does
// is the same as with a tick every millisecond (Pacing::kEveryMillisecond,
// kept for comparison). All time comes from the Clock and the timer, so a
// whole show plays on virtual time in a test or a simulation.
//
// Single-threaded: the tick, the control events and the host's calls run on
// the one event loop and never interleave; nothing is locked. The services
// and the controls handed to InitControls must outlive the engine.

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

#include "config/CallableByName.h"
#include "config/NetworkPreferences.h"
#include "config/RegistryStore.h"
#include "config/RegistryWatcher.h"
#include "config/Settings.h"
#include "ports/Clock.h"
#include "ports/ProcessMemory.h"
#include "ports/TimerService.h"
#include "sequence/SequencePlayInfo.h"
#include "show/DecachePass.h"
#include "show/MediaGlue.h"
#include "show/MediaPlayer.h"
#include "show/NetworkStartup.h"
#include "show/Show.h"
#include "show/ShowPlayerHost.h"
#include "show/ShowState.h"
#include "suite/channelio/ChannelIO.h"
#include "suite/shellcmd/ShellCommandManager.h"

namespace tav {

// What the engine is built with. Everything but `random` is required.
struct ShowPlayerServices {
  const Clock* clock = nullptr;
  const Settings* settings = nullptr;
  // The network preferences are read from it, and their "Ver" watched.
  RegistryStore* registry = nullptr;
  // Measured by the decache pass.
  std::shared_ptr<const ProcessMemory> memory;
  // For every sequence the engine makes; the host is filled in by
  // InitControls.
  SequencePlayServices sequences;
  ShellCommandManager* shellCommands = nullptr;
  // Uniform in [0, 1), for the musical shuffle. Empty: a generator seeded
  // from the clock.
  std::function<double()> random;
};

class ShowPlayer {
 public:
  enum class Pacing { kWakeWhenDue, kEveryMillisecond };
  // The longest the engine sleeps while a show runs, so that a wall clock
  // that jumped is noticed within a second.
  static constexpr uint32_t kMaxSleepMs = 1000;
  // How often the musical sequence is put in step with the media player at
  // the least, whether or not its lights have anything due.
  static constexpr uint32_t kMediaSyncPeriodMs = 100;
  // A sequence's events are pumped for at most this long in one tick.
  static constexpr uint32_t kPumpLimitMs = 100;

  // Reads the video preferences and the network preferences.
  explicit ShowPlayer(ShowPlayerServices services);
  ~ShowPlayer();
  ShowPlayer(const ShowPlayer&) = delete;
  ShowPlayer& operator=(const ShowPlayer&) = delete;

  // Called once, before any show: stores the controls, sets the show timer
  // to 1 ms and disables it, subscribes to the control's and the player's
  // events, and opens the TAV networks. A failure of the I/O control (8005:
  // a port held by another program) is raised; the networks are then opened
  // when a sequence first needs them.
  void InitControls(ShowPlayerHost& parentForm, Timer& showTimer, std::shared_ptr<ChannelIO> CIO,
                    MediaPlayer& WMP);

  const std::shared_ptr<Show>& CurrentShow() const { return m_currentShow; }
  const std::shared_ptr<Show>& NextShow() const { return m_nextShow; }
  // Offers the show that should run next (null: none). The same show with a
  // new time range only updates the running show's range; anything else
  // winds the running show down (its Shutdown section plays) and then starts
  // the new one.
  void SetNextShow(std::shared_ptr<Show> show);

  // The registry watcher's callback, through the host's
  // DoUpdateNetworkPrefsFromRegistry.
  void ShowPlayerUpdateNetworkPrefsFromRegistry();
  // Arms `watcher` on the network preferences' "Ver" value, calling
  // "DoUpdateNetworkPrefsFromRegistry" on `callObject` (the host form).
  void AddRegistryWatch(RegistryWatcher& watcher, std::shared_ptr<CallableByName> callObject);
  const NetworkPreferences& NetworkSettings() const { return m_networks.Preferences(); }

  // An input as the I/O control would raise it; for trying a show without
  // the hardware (the tray's simulated input). Handled like a real one.
  void SimulateInput(int32_t network, int32_t unitId, int32_t inputNumber) {
    m_CIO_InputEvent({network, unitId, inputNumber, ""});
  }

  Pacing GetPacing() const { return m_pacing; }
  void SetPacing(Pacing pacing);
  // Something the engine cannot see changed what its next tick would do;
  // it ticks at once (while a show runs).
  void WakeUp();

  // The show timer's tick; public so that a host or a benchmark may drive
  // the engine directly.
  void tmrShowPlayer_Timer();

 private:
  // What a tick learns while servicing the playing sequences.
  struct Occupancy {
    bool startupPlaying = false;
    bool mainPlaying = false;
    bool musicalBusy = false;
    bool musicalFirstIsMedia = false;
    bool shutdownPlaying = false;
  };

  // --- ShowPlayer.cpp: the tick, and switching shows ---
  void RunTick();
  void RunNormal(const Occupancy& occupancy);
  void RunShutdown(const Occupancy& occupancy);
  void StartNextShow();
  void FinishShow();
  void ResetShowState();
  void Log(int32_t level, const std::string& text, const SequencePlayInfo* seqInfo = nullptr);

  // --- ShowSections.cpp: preparing and stepping the sections ---
  void PrepareSections();
  void PrepareList(const std::shared_ptr<Playlist>& playlist, SequenceList& target,
                   int32_t playType, bool loop, bool lightsOff);
  SequenceRef MakeSequence(const std::string& filename, int32_t playType, bool loop, bool lightsOff,
                           std::shared_ptr<InteractiveGroup> group);
  void StepMain();
  void StepMusical();
  void StepMusicalDelay();
  void ChooseMusicalPiece();
  SequenceRef Queue(SequenceList& list, int32_t index, bool remove,
                    std::shared_ptr<TriggeredSequences> bumpee);
  void ReleaseBackground();
  void RunDecachePass();
  std::vector<DecacheCandidate> DecacheCandidates() const;

  // --- ShowSequences.cpp: starting, servicing and ending sequences ---
  void StartQueued();
  bool ResolveInteractiveConflicts(const SequenceRef& item);
  void StopAndEnd(const SequenceRef& item);
  // True while the sequence stays in the playing list.
  bool ServiceSequence(const SequenceRef& item);
  void PumpEvents(SequencePlayInfo& item);
  void EndSequence(const SequenceRef& item);
  void NoteFailedStart(const SequencePlayInfo& item);

  // --- ShowTriggers.cpp: inputs ---
  void RegisterStartupTrigger();
  void RegisterInteractiveTriggers();
  void ClearTriggers();
  void m_CIO_InputEvent(const ChannelInputEvent& input);
  void ReactToTrigger(const Trigger& trigger);

  // --- ShowPacing.cpp: when to tick next ---
  struct Signature;
  Signature TakeSignature() const;
  void ScheduleNextTick(bool changed);
  int64_t MillisecondsUntilNextCheck();
  void Wake();

  // Media events.
  void m_WMP_PlayStateChange(int32_t newState);
  void m_WMP_MediaError();

  ShowPlayerServices m_services;
  const Clock& m_clock;
  ShowPlayerHost* m_host = nullptr;
  Timer* m_tmrShowPlayer = nullptr;
  std::shared_ptr<ChannelIO> m_CIO;
  MediaPlayer* m_WMP = nullptr;
  MediaGlue m_media;
  NetworkStartup m_networks;
  DecachePass m_decache;
  std::function<double()> m_random;

  std::shared_ptr<Show> m_currentShow;
  std::shared_ptr<Show> m_nextShow;
  ShowState m_state;
  PlayEvent m_event;  // reused by the pump, so frames cost no allocation
  // The last failure logged for a playing sequence, so that one that fails
  // on every tick does not flood the log.
  std::unordered_map<const SequencePlayInfo*, std::string> m_serviceFailures;

  Pacing m_pacing = Pacing::kWakeWhenDue;
  uint64_t m_logCount = 0;
  bool m_inTick = false;
  bool m_wokenDuringTick = false;
  std::optional<uint32_t> m_lastTickAt;
};

}  // namespace tav
