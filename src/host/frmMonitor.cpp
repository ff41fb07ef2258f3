// The form's life: creation, load, the timers other than the next-show
// step, the three ways of ending, and unload. The schedules and the
// next-show step are in frmMonitorShows.cpp.

#include "host/frmMonitor.h"

#include <exception>
#include <optional>

#include "host/Msg.h"
#include "show/ShowPlayer.h"
#include "suite/seqlib/PlaybackFileCreator.h"

namespace tav {

// The registry watch calls its callback by name and keeps it alive while
// armed; the form is not shared, so a small shared object stands in for it.
class frmMonitor::RegistryCallback : public CallableByName {
 public:
  explicit RegistryCallback(frmMonitor& form) : m_form(form) {}
  void CallByName(const std::string& name) override {
    if (name != "DoUpdateNetworkPrefsFromRegistry") {
      throw Error(438, "frmMonitor." + name, "Object doesn't support this property or method");
    }
    m_form.DoUpdateNetworkPrefsFromRegistry();
  }

 private:
  frmMonitor& m_form;
};

namespace {

constexpr uint32_t kCIODelayMs = 4000;
constexpr uint32_t kNextActionMs = 1000;
constexpr uint32_t kLightsActiveMs = 1000;
constexpr uint32_t kShutdownMs = 1;
constexpr uint32_t kUnloadGracefullyMs = 100;
constexpr uint32_t kShowPlayerMs = 1;

// "description/source", as a failure is shown to the user.
std::string DescriptionAndSource(const Error& e) {
  return e.Description() + "/" + e.Source();
}

// Any failure as the platform's error, so that the form's handlers can log
// its description and examine its number.
Error AsError(const std::exception_ptr& failure, const std::string& source) {
  try {
    std::rethrow_exception(failure);
  } catch (const Error& e) {
    return e;
  } catch (const std::exception& e) {
    return Error(5, source, e.what());
  } catch (...) {
    return Error(5, source, "Invalid procedure call or argument");
  }
}

}  // namespace

frmMonitor::frmMonitor(HostServices services)
    : m_services(std::move(services)),
      m_settings(m_services.registry, m_services.pathDefaults),
      m_outbox(m_services.trayLink),
      m_log(m_services.clock, m_outbox),
      m_CIO(std::make_shared<SimulatedInputControl>(m_services.cio)),
      m_watchdog(m_settings, *m_services.memory, m_services.clock) {
  m_log.SetEcho([this](int32_t level, DateTime now, const std::string& text) {
    if (m_logEcho && !TrayConnected()) m_logEcho(level, now, text);
  });
  TimerService& timers = m_services.timers;
  m_tmCIODelay =
      timers.CreateTimer("tmCIODelay", kCIODelayMs, false, [this] { tmCIODelay_Timer(); });
  m_tmNextAction =
      timers.CreateTimer("tmNextAction", kNextActionMs, false, [this] { tmNextAction_Timer(); });
  m_tmrLightsActive = timers.CreateTimer("tmrLightsActive", kLightsActiveMs, true,
                                         [this] { tmrLightsActive_Timer(); });
  m_tmrShutdown =
      timers.CreateTimer("tmrShutdown", kShutdownMs, false, [this] { tmrShutdown_Timer(); });
  m_tmrUnloadGracefully = timers.CreateTimer("tmrUnloadGracefully", kUnloadGracefullyMs, false,
                                             [this] { tmrUnloadGracefully_Timer(); });
  // Configured and driven by the show engine from InitControls on.
  m_tmrShowPlayer = timers.CreateTimer("tmrShowPlayer", kShowPlayerMs, false, [] {});

  // Form creation proper: the start of the restart-suppression window and
  // the message queue.
  try {
    m_startTime = m_services.clock.Now();
    m_tray = std::make_unique<TrayMessaging>(m_outbox, m_log, *this, timers, m_services.clock);
  } catch (const Error& e) {
    MessageBox(DescriptionAndSource(e));
  } catch (const std::exception& e) {
    MessageBox(std::string(e.what()) + "/frmMonitor.Form_Initialize");
  }
}

frmMonitor::~frmMonitor() {
  // The engine and the watch refer to the form; they go first, quietly.
  if (m_registryWatcher) m_registryWatcher->DeleteWatch();
  m_showPlayer.reset();
  if (m_subclassed) StopSubclass();
}

void frmMonitor::Form_Load(const std::string& commandLine) {
  // A second instance never gets here: the entry point holds the instance
  // lock before it builds anything, and ends at once without it.
  if (m_shutdownRequested || m_gracefulShutdownPending) {
    Form_Unload();
    return;
  }

  std::optional<Error> lastError;
  auto step = [&](const char* source, auto&& work) {
    try {
      work();
    } catch (...) {
      lastError = AsError(std::current_exception(), source);
    }
  };

  step("frmMonitor.Form_Load", [&] {
    m_onDemandOnly = commandLine == kOnDemandOnlySwitch;
    LogMessage(
        1, m_onDemandOnly ? "Show Player starting (for on demand shows)" : "Show Player starting");
  });
  step("frmMonitor.LoadSchedules", [&] { LoadSchedules(); });
  step("frmMonitor.Form_Load", [&] { StartSubclass(); });
  // The window handle and the caption have no place to go here: the player
  // has no window, and the tray link names the player's handle itself.
  step("frmMonitor.Form_Load", [&] { CreateShowPlayer(); });
  step("frmMonitor.Form_Load", [&] {
    m_playbackFileCreator =
        std::make_unique<PlaybackFileCreator>(m_services.fileSystem, m_services.resolver);
  });
  step("frmMonitor.Form_Load", [&] { m_tmCIODelay->SetEnabled(true); });
  step("frmMonitor.Form_Load", [&] { m_CIO->SetupClient(true, kClientName, true); });
  step("frmMonitor.Form_Load", [&] { ReadVisualizerSettings(); });

  if (lastError) {
    std::string text = lastError->Number() == kErrorPortAlreadyOpen
                           ? std::string(kText8005)
                           : std::string(kTextCannotEnable) + DescriptionAndSource(*lastError);
    MessageBox(text);
    m_end = HostEnd::kShowsNotEnabled;
    Form_Unload();
    return;
  }
  m_showPlayer->AddRegistryWatch(*m_registryWatcher, m_registryCallback);
}

void frmMonitor::StartSubclass() {
  TrayLink& link = m_services.trayLink;
  link.SetOnFrame([this](const TrayFrame& frame) {
    if (m_tray) m_tray->m_FormHook_AfterMessage(frame);
  });
  link.SetOnConnect([this](uint32_t hwnd) { m_connectedWindows.insert(hwnd); });
  link.SetOnDisconnect(
      [this](uint32_t hwnd, const std::string&) { m_connectedWindows.erase(hwnd); });
  m_subclassed = true;
}

void frmMonitor::StopSubclass() {
  TrayLink& link = m_services.trayLink;
  link.SetOnFrame(nullptr);
  link.SetOnConnect(nullptr);
  link.SetOnDisconnect(nullptr);
  m_subclassed = false;
}

bool frmMonitor::TrayConnected() const {
  uint32_t tray = m_outbox.TrayWindow();
  return tray != 0 && m_connectedWindows.count(tray) != 0;
}

void frmMonitor::CreateShowPlayer() {
  m_registryWatcher = std::make_unique<RegistryWatcher>(m_services.timers, m_services.registry);
  m_registryCallback = std::make_shared<RegistryCallback>(*this);
  ShowPlayerServices services;
  services.clock = &m_services.clock;
  services.settings = &m_settings;
  services.registry = &m_services.registry;
  services.memory = m_services.memory;
  services.sequences.library = m_services.library;
  services.sequences.resolver = m_services.resolver;
  services.sequences.fileSystem = m_services.fileSystem;
  services.sequences.memory = m_services.memory;
  services.sequences.useCompressedSequences = [this] {
    return m_settings.UseCompressedSequences();
  };
  services.shellCommands = m_services.shellCommands.get();
  m_showPlayer = std::make_unique<ShowPlayer>(std::move(services));
  m_showPlayer->InitControls(*this, *m_tmrShowPlayer, m_CIO, m_services.media);
  if (m_services.networkPreferencesApplied) {
    m_services.networkPreferencesApplied(m_showPlayer->NetworkSettings());
  }
}

void frmMonitor::ReadVisualizerSettings() {
  // Read as the form always has; the player itself makes no use of them.
  (void)m_settings.RemotePort();
  (void)m_settings.RemoteHost();
  (void)m_settings.MaxCommandsPerMessage();
  (void)m_settings.MaxBytesPerMessage();
  (void)m_settings.MaxDatagramSize();
  (void)m_settings.MaxDatagramsPerCycle();
  (void)m_settings.ThrottleDatagrams();
}

void frmMonitor::tmCIODelay_Timer() {
  try {
    m_initialized = true;
    LogMessage(1, "Show Player initialized");
    m_tmCIODelay->SetEnabled(false);
    m_tmNextAction->SetEnabled(true);
  } catch (const Error& e) {
    LogMessage(3, "tmCIODelay_Timer Error: " + e.Description());
  }
}

void frmMonitor::tmrLightsActive_Timer() {
  try {
    m_CIO->SetLightsActive(true);
  } catch (...) {
    LogMessage(3,
               "Error in tmrLightsActive_Timer: " +
                   AsError(std::current_exception(), "frmMonitor.tmrLightsActive").Description());
  }
}

void frmMonitor::ImmediateShutdown(const std::string& szReason) {
  if (Unloaded()) return;
  m_shutdownRequested = true;
  LogMessage(1, szReason);
  m_tmrShutdown->SetEnabled(true);
}

void frmMonitor::tmrShutdown_Timer() {
  m_tmrShutdown->SetEnabled(false);
  Form_Unload();
}

void frmMonitor::GracefulShutdown() {
  if (Unloaded()) return;
  LogMessage(1, "Graceful shutdown requested");
  m_gracefulShutdownPending = true;
  if (!HasCurrentShow()) {
    Form_Unload();
    return;
  }
  SetNextShow(nullptr);
  SendStatusToTAVTray(false);
  m_tmrUnloadGracefully->SetEnabled(true);
}

void frmMonitor::tmrUnloadGracefully_Timer() {
  if (!HasCurrentShow()) Form_Unload();
}

void frmMonitor::RequestGracefulShutdown() {
  if (Unloaded() || !m_tray) return;
  TAVMessage message;
  message.SetMessageType(kMsgGracefulShutdown);
  m_tray->MessageQueue().Enqueue(std::move(message));
  m_tray->tmrTAVMsgQueue().SetEnabled(true);
}

void frmMonitor::ShutdownForRestartIfNecessary() {
  if (Unloaded()) return;
  WatchdogHostState state{m_gracefulShutdownPending, m_shutdownRequested, m_showLoadedSinceStart,
                          m_startTime};
  if (m_watchdog.RestartIsDue(state, *this)) ShutdownForRestart();
}

void frmMonitor::ShutdownForRestart() {
  m_restartRequested = true;
  ImmediateShutdown(MemoryWatchdog::kRestartReason);
}

void frmMonitor::SimulateInput(int32_t network, int32_t unitId, int32_t inputNumber) {
  if (Unloaded()) return;
  m_CIO->Simulate(network, unitId, inputNumber);
}

void frmMonitor::DoUpdateNetworkPrefsFromRegistry() {
  if (!m_showPlayer) return;
  m_showPlayer->ShowPlayerUpdateNetworkPrefsFromRegistry();
  if (m_services.networkPreferencesApplied) {
    m_services.networkPreferencesApplied(m_showPlayer->NetworkSettings());
  }
}

std::string frmMonitor::CreatePlaybackFileIfNeeded(const std::string& szFilename) {
  std::string playbackFile;
  try {
    if (!m_playbackFileCreator) return "";
    PlaybackFileResult result = m_playbackFileCreator->PreparePlaybackFile(szFilename);
    if (result.errorCount >= 1) {
      LogMessage(3, "Create playback file error: " + result.errorText);
      return "";
    }
    if (result.created) {
      if (result.warningCount >= 1) {
        LogMessage(2, "Warnings about playback file: " + result.warningText);
      }
      LogMessage(1, result.informationMessage);
    }
    playbackFile = result.playbackFilename;
  } catch (...) {
    // The caller reports a sequence it cannot load; nothing more to say here.
  }
  return playbackFile;
}

void frmMonitor::MessageBox(const std::string& text) {
  if (m_services.messageBox) m_services.messageBox(text);
  LogMessage(3, text);
}

void frmMonitor::Form_Unload() {
  if (m_unloading) return;
  m_unloading = true;
  if (m_end == HostEnd::kRunning) {
    m_end = m_restartRequested ? HostEnd::kRestart : HostEnd::kAsked;
  }
  auto quietly = [](auto&& work) {
    try {
      work();
    } catch (...) {
    }
  };
  quietly([&] { LogMessage(1, "Show Player shutting down"); });
  quietly([&] {
    m_weekSchedule.reset();
    m_yearSchedule.reset();
    m_onDemandEvent.reset();
    if (m_registryWatcher) m_registryWatcher->DeleteWatch();
    m_showPlayer.reset();
  });
  quietly([&] {
    if (m_subclassed) StopSubclass();
  });
  quietly([&] { m_playbackFileCreator.reset(); });
  quietly([&] {
    m_services.media.Stop();
    m_services.media.HideVideoForm();
  });
  quietly([&] { m_CIO->ReleaseClient(); });
  for (Timer* timer : {m_tmCIODelay.get(), m_tmNextAction.get(), m_tmrLightsActive.get(),
                       m_tmrShutdown.get(), m_tmrUnloadGracefully.get(), m_tmrShowPlayer.get()}) {
    quietly([&] { timer->SetEnabled(false); });
  }
  if (m_tray) quietly([&] { m_tray->tmrTAVMsgQueue().SetEnabled(false); });
  if (m_services.onUnloaded) m_services.onUnloaded();
}

}  // namespace tav
