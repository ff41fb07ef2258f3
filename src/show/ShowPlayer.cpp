#include "show/ShowPlayer.h"

#include <random>

#include "support/Error.h"

namespace tav {

namespace {

const Clock& RequireClock(const ShowPlayerServices& services) {
  if (!services.clock || !services.settings || !services.registry) {
    throw errors::ObjectNotSet("ShowPlayer");
  }
  return *services.clock;
}

std::function<double()> DefaultRandom(const Clock& clock) {
  auto generator = std::make_shared<std::mt19937>(clock.TickCount());
  return [generator] { return std::generate_canonical<double, 53>(*generator); };
}

}  // namespace

ShowPlayer::ShowPlayer(ShowPlayerServices services)
    : m_services(std::move(services)),
      m_clock(RequireClock(m_services)),
      m_media(*m_services.settings),
      m_networks(*m_services.registry),
      m_decache(*m_services.settings, m_services.memory),
      m_random(m_services.random ? m_services.random : DefaultRandom(m_clock)) {}

ShowPlayer::~ShowPlayer() {
  // The music stops with the show's lights when the engine goes.
  try {
    if (m_media.MediaSequence()) m_media.SequenceEnded(m_media.MediaSequence().get());
  } catch (...) {
  }
  if (m_tmrShowPlayer) {
    m_tmrShowPlayer->SetEnabled(false);
    m_tmrShowPlayer->SetOnTick(nullptr);
  }
  if (m_CIO) m_CIO->SetOnInput(nullptr);
  if (m_WMP) {
    m_WMP->SetOnPlayStateChange(nullptr);
    m_WMP->SetOnMediaError(nullptr);
  }
}

void ShowPlayer::InitControls(ShowPlayerHost& parentForm, Timer& showTimer,
                              std::shared_ptr<ChannelIO> CIO, MediaPlayer& WMP) {
  if (!CIO) throw errors::ObjectNotSet("ShowPlayer.InitControls");
  m_host = &parentForm;
  m_services.sequences.host = &parentForm;
  m_tmrShowPlayer = &showTimer;
  m_CIO = std::move(CIO);
  m_WMP = &WMP;
  m_tmrShowPlayer->SetInterval(1);
  m_tmrShowPlayer->SetEnabled(false);
  m_tmrShowPlayer->SetOnTick([this] { tmrShowPlayer_Timer(); });
  m_CIO->SetOnInput([this](const ChannelInputEvent& input) { m_CIO_InputEvent(input); });
  m_WMP->SetOnPlayStateChange([this](int32_t newState) { m_WMP_PlayStateChange(newState); });
  m_WMP->SetOnMediaError([this] { m_WMP_MediaError(); });
  m_media.SetControls(m_WMP, m_host);
  m_networks.SetControls(m_CIO.get(), m_host);
  m_networks.ReportProblems();
  m_networks.InitializeTAVNetworks();
}

void ShowPlayer::Log(int32_t level, const std::string& text, const SequencePlayInfo* seqInfo) {
  ++m_logCount;
  if (m_host) m_host->LogMessage(level, text, seqInfo);
}

// ---- The next show ---------------------------------------------------------

void ShowPlayer::SetNextShow(std::shared_ptr<Show> show) {
  if (!m_state.ShuttingDown && m_currentShow && show) {
    MonitoredShowEvent& current = *m_currentShow->Monitoring();
    const MonitoredShowEvent& offered = *show->Monitoring();
    if (offered.Range()->StartsBeforeOtherEnds(current.Range()) &&
        offered.Filename() == current.Filename() &&
        offered.ScheduleType() == current.ScheduleType()) {
      if (show->HasSameContents(*m_currentShow)) {
        if (offered.Range()->Equals(current.Range())) return;
        // The same show over a changed span: it runs on undisturbed.
        auto range = std::make_shared<TimeRange>();
        range->CopyFrom(offered.Range());
        current.SetRange(range);
        Log(1, "Current show's time range has changed");
        return;
      }
      Log(1, "Current show's contents have changed");
    }
  }

  m_nextShow = std::move(show);
  ClearTriggers();
  m_state.ShuttingDown = true;
  if (m_currentShow) {
    MonitoredShowEvent& current = *m_currentShow->Monitoring();
    bool wasShuttingDown = current.ShuttingDown();
    current.SetShuttingDown(true);
    if (!wasShuttingDown) {
      Log(1, "Current show is entering shutdown mode");
      if (m_host) m_host->SendStatusToTAVTray(false);
    }
  }
  if (!m_tmrShowPlayer) return;
  if (m_tmrShowPlayer->Enabled()) {
    Wake();
  } else {
    m_tmrShowPlayer->SetEnabled(true);
  }
}

// ---- The tick --------------------------------------------------------------

void ShowPlayer::RunTick() {
  if (!m_currentShow) {
    Log(0, "Starting next show");
    StartNextShow();
  }
  if (!m_currentShow) {
    Log(0, "No current show");
    m_tmrShowPlayer->SetEnabled(false);
    return;
  }

  while (!m_state.PlayQueue.Empty()) StartQueued();

  Occupancy occupancy;
  for (int32_t index = 1; index <= m_state.PlayingList.Count();) {
    SequenceRef item = m_state.PlayingList.Item(index);
    if (!ServiceSequence(item)) continue;  // it ended: the next one moved up
    ++index;
    bool makesMusicalBusy = false;
    switch (item->PlayType()) {
      case 3:
        occupancy.startupPlaying = true;
        break;
      case 4:
        occupancy.mainPlaying = true;
        break;
      case 5:
      case 6:
        makesMusicalBusy = true;
        break;
      case 2:
        makesMusicalBusy = m_media.IsMediaSequence(item.get());
        break;
      case 7:
        occupancy.shutdownPlaying = true;
        break;
      default:
        break;
    }
    if (makesMusicalBusy && !occupancy.musicalBusy) {
      occupancy.musicalBusy = true;
      occupancy.musicalFirstIsMedia = m_media.IsMediaSequence(item.get());
    }
  }

  if (!m_state.ShuttingDown) {
    RunNormal(occupancy);
  } else {
    RunShutdown(occupancy);
  }
}

void ShowPlayer::RunNormal(const Occupancy& occupancy) {
  if (occupancy.startupPlaying || !m_state.MainReleased) return;
  // Startup sequences play one after another, each alone.
  if (!m_state.StartupList.Empty()) {
    Queue(m_state.StartupList, 1, true, nullptr);
    return;
  }
  if (!occupancy.mainPlaying) StepMain();
  if (!occupancy.musicalBusy) StepMusical();
  if (!m_state.TriggersRegistered) RegisterInteractiveTriggers();
}

void ShowPlayer::RunShutdown(const Occupancy& occupancy) {
  if (occupancy.shutdownPlaying) return;
  if (occupancy.musicalBusy && occupancy.musicalFirstIsMedia) {
    // The musical piece may finish; Main keeps the lights going meanwhile.
    if (!occupancy.mainPlaying) StepMain();
    return;
  }
  m_media.HideVideoForm();
  if (!m_state.ShutdownStopsIssued) {
    // Background sequences keep running under the Shutdown section.
    for (const SequenceRef& item : m_state.PlayingList) {
      if (item->PlayType() == 1) continue;
      Log(1, "Stopping", item.get());
      item->StopPlay();
    }
    m_state.ShutdownStopsIssued = true;
  }
  // A show that never got its startup trigger skips its Shutdown section.
  if (!m_state.ShutdownList.Empty() && m_state.MainReleased) {
    Queue(m_state.ShutdownList, 1, true, nullptr);
    return;
  }
  for (const SequenceRef& item : m_state.PlayingList) {
    Log(1, "Stopping", item.get());
    item->StopPlay();
  }
  // Stopped sequences leave the list when a later tick services them.
  if (!m_state.PlayingList.Empty()) return;
  FinishShow();
}

// ---- Starting and finishing shows ------------------------------------------

void ShowPlayer::StartNextShow() {
  if (m_currentShow) return;
  m_currentShow = std::move(m_nextShow);
  m_nextShow = nullptr;
  m_host->SendStatusToTAVTray(false);
  ResetShowState();
  if (!m_currentShow) {
    m_host->ShutdownForRestartIfNecessary();
    return;
  }
  Log(1, "Starting show: " + m_currentShow->Monitoring()->Filename());
  PrepareSections();

  const Show& show = *m_currentShow;
  if (!show.StartupTrigger()) {
    m_state.BackgroundReleased = true;
    m_state.MainReleased = true;
  } else if (show.StartupType() == 1) {
    // Nothing plays until the trigger.
    m_state.BackgroundReleased = false;
    m_state.MainReleased = false;
  } else if (show.StartupType() == 2) {
    // The background plays while the show waits for the trigger.
    m_state.BackgroundReleased = true;
    m_state.MainReleased = false;
  } else {
    m_state.BackgroundReleased = true;
    m_state.MainReleased = true;
  }
  RegisterStartupTrigger();
  if (m_state.BackgroundReleased) ReleaseBackground();
}

void ShowPlayer::FinishShow() {
  Log(1, "Finished show: " + m_currentShow->Monitoring()->Filename());
  m_currentShow = nullptr;
  m_host->SendStatusToTAVTray(false);
  ResetShowState();
  StartNextShow();
}

void ShowPlayer::ResetShowState() {
  ClearTriggers();
  m_state = ShowState();
  m_serviceFailures.clear();
}

// ---- Networks and media events ---------------------------------------------

void ShowPlayer::ShowPlayerUpdateNetworkPrefsFromRegistry() {
  m_networks.UpdateFromRegistry();
}

void ShowPlayer::AddRegistryWatch(RegistryWatcher& watcher,
                                  std::shared_ptr<CallableByName> callObject) {
  m_networks.AddRegistryWatch(watcher, std::move(callObject));
}

void ShowPlayer::m_WMP_PlayStateChange(int32_t newState) {
  try {
    m_media.OnPlayStateChange(newState);
  } catch (const Error& e) {
    Log(3, "m_WMP_PlayStateChange Error: " + e.Description());
  }
  Wake();
}

void ShowPlayer::m_WMP_MediaError() {
  try {
    ++m_logCount;
    m_media.OnMediaError();
  } catch (const Error& e) {
    Log(3, "m_WMP_MediaError Error: " + e.Description());
  }
  Wake();
}

}  // namespace tav
