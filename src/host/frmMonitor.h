#pragma once
// The player's main form: the owner of everything that lives as long as the
// program, and the host of the timers that drive it. It is created at start
// (StartTime, the message queue), loads in a fixed order (the command line,
// the schedules, the tray link hook, the show engine and its controls, the
// playback-file creator, the start-up delay, the I/O control's client),
// works out every second which show should run next (a show on demand, a
// dated show of the year schedule, the week schedule) and hands it to the
// engine, and ends in one of three ways: at once, gracefully (the running
// show plays its shutdown section first), or for a restart when the memory
// watchdog asks for one.
//
// It is what the other subsystems call their host: the log, the tray's
// notices and status, the playback-file creator, the restart check, the
// network-settings callback of the registry watch, and everything the tray's
// requests ask for (TrayHost).
//
// Owned by the program's entry point, which builds the services (see
// HostServices), creates the form, calls Form_Load and runs the event loop
// until the form reports that it has unloaded. Single-threaded: every call
// comes from the loop.

#include <cstdint>
#include <memory>
#include <set>
#include <string>

#include "config/CallableByName.h"
#include "config/RegistryWatcher.h"
#include "config/Settings.h"
#include "host/HostLog.h"
#include "host/HostServices.h"
#include "host/MemoryWatchdog.h"
#include "host/SimulatedInputControl.h"
#include "host/TrayHost.h"
#include "host/TrayMessaging.h"
#include "host/TrayOutbox.h"
#include "schedule/MonitoredShowEvent.h"
#include "schedule/Schedule.h"
#include "schedule/YearSchedule.h"
#include "show/ShowPlayerHost.h"
#include "support/Error.h"

namespace tav {

class PlaybackFileCreator;
class ShowPlayer;
class Show;

// How the form ended, for the program's exit status.
enum class HostEnd {
  kRunning,          // not unloaded yet
  kAsked,            // a shutdown the tray (or a signal) asked for
  kShowsNotEnabled,  // loading failed: the message box said why
  kRestart,          // the memory watchdog asked for a fresh start
};

class frmMonitor : public TrayHost, public ShowPlayerHost {
 public:
  // The command line that starts the player for shows on demand only.
  static constexpr const char* kOnDemandOnlySwitch = "/noschedule";
  // The client set-up call's name for this program.
  static constexpr const char* kClientName = "Show Player";
  static constexpr const char* kText8005 =
      "Shows can not be enabled because the comm port is already open.  If the Tessavar "
      "Hardware Utility is running, shut it down and then enable shows.";
  static constexpr const char* kTextCannotEnable = "Shows cannot be enabled because of an error.";

  // Form creation: records StartTime and makes the message queue. A failure
  // goes to the message box (description, "/", source) and creation goes on.
  explicit frmMonitor(HostServices services);
  ~frmMonitor() override;
  frmMonitor(const frmMonitor&) = delete;
  frmMonitor& operator=(const frmMonitor&) = delete;

  // Form load with the program's command line (without the program name).
  void Form_Load(const std::string& commandLine);
  // Form unload: releases everything in order and reports the end. Does
  // nothing the second time.
  void Form_Unload();
  bool Unloaded() const { return m_unloading; }
  HostEnd End() const { return m_end; }

  // A graceful shutdown, queued as the tray's message 8 would be (SIGTERM).
  void RequestGracefulShutdown();

  // --- State (read by tests and the status) ---
  DateTime StartTime() const { return m_startTime; }
  bool OnDemandOnly() const { return m_onDemandOnly; }
  bool ReadyAnnounced() const { return m_tray && m_tray->ReadyAnnounced(); }
  bool ShutdownRequested() const { return m_shutdownRequested; }
  bool GracefulShutdownPending() const { return m_gracefulShutdownPending; }
  bool ShowLoadedSinceStart() const { return m_showLoadedSinceStart; }
  uint32_t TrayWindow() const { return m_outbox.TrayWindow(); }
  const std::shared_ptr<MonitoredShowEvent>& OnDemandEvent() const { return m_onDemandEvent; }
  ShowPlayer* Engine() const { return m_showPlayer.get(); }
  const HostLog& Log() const { return m_log; }
  // True while the tray window is connected to the link.
  bool TrayConnected() const;
  // Called for every line of level 1 or more while no tray is connected.
  void SetLogEcho(HostLog::Echo echo) { m_logEcho = std::move(echo); }

  // --- What the subsystems call ---
  void LogMessage(int32_t level, const std::string& szText,
                  const SequenceIdentity* seqInfo = nullptr) override;
  void SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) override;
  void SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) override;
  void SendStatusToTAVTray(bool boolForce) override;
  std::string CreatePlaybackFileIfNeeded(const std::string& szFilename) override;
  void ShutdownForRestartIfNecessary() override;
  void DoUpdateNetworkPrefsFromRegistry();

  // --- TrayHost ---
  void ImmediateShutdown(const std::string& szReason) override;
  void GracefulShutdown() override;
  void LoadSchedules() override;
  void ShowOnDemand(const std::string& szSerialized) override;
  void SetOnDemandOnly(bool value) override;
  void SimulateInput(int32_t network, int32_t unitId, int32_t inputNumber) override;
  bool Initialized() const override { return m_initialized; }
  std::shared_ptr<MonitoredShowEvent> CurrentShowEvent(DateTime t) override;
  std::shared_ptr<MonitoredShowEvent> RunningShowEvent() override;
  std::shared_ptr<MonitoredShowEvent> NextShowEvent(
      const std::shared_ptr<MonitoredShowEvent>& current, DateTime t) override;

  // The timers, by the names the form gives them.
  Timer& tmCIODelay() { return *m_tmCIODelay; }
  Timer& tmNextAction() { return *m_tmNextAction; }
  Timer& tmrLightsActive() { return *m_tmrLightsActive; }
  Timer& tmrShutdown() { return *m_tmrShutdown; }
  Timer& tmrUnloadGracefully() { return *m_tmrUnloadGracefully; }
  Timer& tmrShowPlayer() { return *m_tmrShowPlayer; }

 private:
  class RegistryCallback;

  // Load steps that run inside the form's error collection.
  void StartSubclass();
  void StopSubclass();
  void CreateShowPlayer();
  void ReadVisualizerSettings();

  void tmCIODelay_Timer();
  void tmNextAction_Timer();
  void tmrLightsActive_Timer();
  void tmrShutdown_Timer();
  void tmrUnloadGracefully_Timer();

  // The next-show step, and applying its event.
  void NextShowStep();
  void ApplyShowEvent(const std::shared_ptr<MonitoredShowEvent>& event);
  // The show of a show file, or null when it cannot be read (logged).
  std::shared_ptr<Show> ReadShowFile(const std::string& szFilename);
  // Where a show file named in a schedule is: as given when absolute, else
  // in the user data folder.
  std::string ShowFilePath(const std::string& szFilename) const;
  void SetNextShow(std::shared_ptr<Show> show);
  bool HasCurrentShow() const;

  void ShutdownForRestart();
  void MessageBox(const std::string& text);

  HostServices m_services;
  Settings m_settings;
  TrayOutbox m_outbox;
  HostLog m_log;
  HostLog::Echo m_logEcho;
  std::set<uint32_t> m_connectedWindows;
  std::unique_ptr<TrayMessaging> m_tray;

  DateTime m_startTime;
  bool m_onDemandOnly = false;
  bool m_initialized = false;
  bool m_shutdownRequested = false;
  bool m_gracefulShutdownPending = false;
  bool m_showLoadedSinceStart = false;
  bool m_subclassed = false;
  bool m_restartRequested = false;
  bool m_unloading = false;
  HostEnd m_end = HostEnd::kRunning;

  std::shared_ptr<MonitoredShowEvent> m_onDemandEvent;
  std::shared_ptr<Schedule> m_weekSchedule;
  std::shared_ptr<YearSchedule> m_yearSchedule;
  std::unique_ptr<ShowPlayer> m_showPlayer;
  std::unique_ptr<PlaybackFileCreator> m_playbackFileCreator;
  // The I/O control as the engine sees it: the real one, with inputs the
  // tray simulates raised as if it had raised them.
  std::shared_ptr<SimulatedInputControl> m_CIO;
  MemoryWatchdog m_watchdog;
  std::unique_ptr<RegistryWatcher> m_registryWatcher;
  std::shared_ptr<RegistryCallback> m_registryCallback;

  std::unique_ptr<Timer> m_tmCIODelay;
  std::unique_ptr<Timer> m_tmNextAction;
  std::unique_ptr<Timer> m_tmrLightsActive;
  std::unique_ptr<Timer> m_tmrShutdown;
  std::unique_ptr<Timer> m_tmrUnloadGracefully;
  std::unique_ptr<Timer> m_tmrShowPlayer;
};

}  // namespace tav
