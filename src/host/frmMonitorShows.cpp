// The form's show selection: the schedules, the show on demand, the
// next-show step that works out every second which show should run and
// offers it to the engine, and the status the tray is told.

#include "host/frmMonitor.h"

#include "schedule/ScheduleLookup.h"
#include "show/Show.h"
#include "show/ShowFunctions.h"
#include "show/ShowPlayer.h"
#include "suite/seqlib/PathResolver.h"

namespace tav {

void frmMonitor::LoadSchedules() {
  if (Unloaded()) return;
  // Both files are read before either schedule is replaced, so a file that
  // fails to load leaves the schedules the player had.
  std::shared_ptr<Schedule> week =
      LoadWeekSchedule(m_settings.WeekSchedulePath(), m_services.files);
  std::shared_ptr<YearSchedule> year =
      LoadYearSchedule(m_settings.YearSchedulePath(), m_services.files);
  m_weekSchedule = std::move(week);
  m_yearSchedule = std::move(year);
  LogMessage(1, "Schedule loaded");
}

void frmMonitor::SetOnDemandOnly(bool value) {
  if (Unloaded()) return;
  m_onDemandOnly = value;
}

void frmMonitor::ShowOnDemand(const std::string& szSerialized) {
  if (Unloaded()) return;
  try {
    auto event = std::make_shared<MonitoredShowEvent>();
    event->Deserialize(szSerialized);
    if (!event->Filename().empty()) {
      LogMessage(1, "Request for show on demand received: " + event->Filename());
      m_onDemandEvent = event;
    } else {
      LogMessage(1, "Request to clear show on demand received");
      m_onDemandEvent.reset();
    }
    if (m_tmNextAction->Enabled()) NextShowStep();
  } catch (const Error& e) {
    LogMessage(3, "Show on demand error: " + e.Description());
  }
}

void frmMonitor::tmNextAction_Timer() {
  NextShowStep();
}

void frmMonitor::NextShowStep() {
  if (m_gracefulShutdownPending || m_shutdownRequested) return;
  m_tmNextAction->SetEnabled(false);
  try {
    if (m_tray) m_tray->AnnounceReadiness();
    ApplyShowEvent(CurrentShowEvent(m_services.clock.Now()));
  } catch (const Error& e) {
    LogMessage(3, "tmNextAction_Timer Error: " + e.Description());
  } catch (const std::exception& e) {
    LogMessage(3, std::string("tmNextAction_Timer Error: ") + e.what());
  }
  // A show on demand may have unloaded the form meanwhile (a restart).
  if (!Unloaded()) m_tmNextAction->SetEnabled(true);
}

void frmMonitor::ApplyShowEvent(const std::shared_ptr<MonitoredShowEvent>& event) {
  if (m_gracefulShutdownPending) return;
  if (!event || event->Filename().empty()) {
    SetNextShow(nullptr);
  } else if (std::shared_ptr<Show> show = ReadShowFile(event->Filename())) {
    show->Monitoring()->CopyFrom(event);
    m_showLoadedSinceStart = true;
    SetNextShow(std::move(show));
  } else {
    SetNextShow(nullptr);
  }
  SendStatusToTAVTray(false);
}

std::shared_ptr<Show> frmMonitor::ReadShowFile(const std::string& szFilename) {
  // A file that is missing, cannot be read, or holds no show all count as
  // unreadable: the player is offered no show, so a running show winds down
  // as it would at the end of its time range.
  std::shared_ptr<Show> show;
  try {
    std::optional<std::string> text = m_services.files.ReadText(ShowFilePath(szFilename));
    if (text) show = ShowFromText(*text);
  } catch (const Error&) {
    show.reset();
  }
  if (!show) LogMessage(3, "Cannot read show file: " + szFilename);
  return show;
}

std::string frmMonitor::ShowFilePath(const std::string& szFilename) const {
  if (PathResolver::IsAbsolute(szFilename)) return szFilename;
  return m_settings.UserDataPath() + szFilename;
}

void frmMonitor::SetNextShow(std::shared_ptr<Show> show) {
  if (m_showPlayer) m_showPlayer->SetNextShow(std::move(show));
}

bool frmMonitor::HasCurrentShow() const {
  return m_showPlayer && m_showPlayer->CurrentShow() != nullptr;
}

std::shared_ptr<MonitoredShowEvent> frmMonitor::CurrentShowEvent(DateTime t) {
  ScheduleState state{m_weekSchedule, m_yearSchedule, m_onDemandEvent, m_onDemandOnly};
  return tav::CurrentShowEvent(state, t).Event;
}

std::shared_ptr<MonitoredShowEvent> frmMonitor::RunningShowEvent() {
  if (!HasCurrentShow()) return nullptr;
  return m_showPlayer->CurrentShow()->Monitoring();
}

std::shared_ptr<MonitoredShowEvent> frmMonitor::NextShowEvent(
    const std::shared_ptr<MonitoredShowEvent>& current, DateTime t) {
  ScheduleState state{m_weekSchedule, m_yearSchedule, m_onDemandEvent, m_onDemandOnly};
  return tav::NextShowEvent(state, current, t).Event;
}

void frmMonitor::SendStatusToTAVTray(bool boolForce) {
  if (m_tray && !Unloaded()) m_tray->SendStatusToTAVTray(boolForce);
}

void frmMonitor::LogMessage(int32_t level, const std::string& szText,
                            const SequenceIdentity* seqInfo) {
  m_log.LogMessage(level, szText, seqInfo);
}

void frmMonitor::SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) {
  if (m_tray) m_tray->SendSequenceStartToTAVTray(seqInfo);
}

void frmMonitor::SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) {
  if (m_tray) m_tray->SendSequenceStopToTAVTray(seqInfo);
}

}  // namespace tav
