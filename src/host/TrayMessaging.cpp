#include "host/TrayMessaging.h"

#include <exception>

#include "host/Msg.h"
#include "support/Error.h"

namespace tav {
namespace {

// A pair differs when exactly one side is missing or the texts differ.
bool Differs(const std::shared_ptr<MonitoredShowEvent>& a,
             const std::shared_ptr<MonitoredShowEvent>& b) {
  if (!a || !b) return static_cast<bool>(a) != static_cast<bool>(b);
  return !a->MemberwiseEquals(b);
}

// What was sent is remembered as a copy: the engine changes its running
// show's event in place (it marks it shutting down), and a kept reference
// would then always compare equal to itself and the change never be sent.
std::shared_ptr<MonitoredShowEvent> Snapshot(const std::shared_ptr<MonitoredShowEvent>& event) {
  if (!event) return nullptr;
  auto copy = std::make_shared<MonitoredShowEvent>();
  copy->CopyFrom(event);
  return copy;
}

}  // namespace

TrayMessaging::TrayMessaging(TrayOutbox& outbox, HostLog& log, TrayHost& host, TimerService& timers,
                             const Clock& clock)
    : m_outbox(outbox), m_log(log), m_host(host), m_clock(clock) {
  m_tmrTAVMsgQueue =
      timers.CreateTimer("tmrTAVMsgQueue", 1, false, [this] { tmrTAVMsgQueue_Timer(); });
}

void TrayMessaging::SetTrayWindow(uint32_t hwnd) {
  if (hwnd == m_outbox.TrayWindow()) return;
  m_outbox.Retarget(hwnd);
  m_log.FlushPendingLog();
  AnnounceReadiness();
}

void TrayMessaging::AnnounceReadiness() {
  if (m_readyAnnounced || !m_host.Initialized() || m_outbox.TrayWindow() == 0) return;
  m_outbox.Send(kMsgPlayerReady, "");
  m_readyAnnounced = true;
}

void TrayMessaging::SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) {
  SendSequenceNotice(kMsgSequenceStart, seqInfo);
}

void TrayMessaging::SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) {
  SendSequenceNotice(kMsgSequenceStop, seqInfo);
}

void TrayMessaging::SendSequenceNotice(int32_t type, const SequenceIdentity& seqInfo) {
  try {
    m_outbox.Send(type, SequenceNoticeText(seqInfo, m_clock.Now()));
  } catch (...) {
    // A notice the tray cannot get is of no use later; the sequence goes on.
  }
}

void TrayMessaging::SendStatusToTAVTray(bool boolForce) {
  try {
    if (m_outbox.TrayWindow() == 0) return;
    DateTime now = m_clock.Now();
    std::shared_ptr<MonitoredShowEvent> scheduled = m_host.CurrentShowEvent(now);
    std::shared_ptr<MonitoredShowEvent> running = m_host.RunningShowEvent();
    std::shared_ptr<MonitoredShowEvent> current = running ? running : scheduled;
    std::shared_ptr<MonitoredShowEvent> next = m_host.NextShowEvent(current, now);

    bool send = boolForce || !m_lastSentStatus.sent || Differs(current, m_lastSentStatus.current) ||
                Differs(next, m_lastSentStatus.next);
    if (!send) return;
    m_outbox.Send(kMsgNextShow, next ? next->Serialize() : std::string());
    m_outbox.Send(kMsgCurrentShow, current ? current->Serialize() : std::string());
    m_lastSentStatus = {Snapshot(current), Snapshot(next), true};
  } catch (...) {
    // The status is sent again at the next change or introduction.
  }
}

void TrayMessaging::m_FormHook_AfterMessage(const TrayFrame& frame) {
  try {
    m_lastMessageTime = m_clock.Now();
    m_messageQueue.Enqueue(DecodeReceivedMessage(frame));
    m_tmrTAVMsgQueue->SetEnabled(true);
  } catch (const Error& e) {
    m_log.LogMessage(3, "m_FormHook_AfterMessage Error: " + e.Description());
  } catch (const std::exception& e) {
    m_log.LogMessage(3, std::string("m_FormHook_AfterMessage Error: ") + e.what());
  }
}

void TrayMessaging::tmrTAVMsgQueue_Timer() {
  try {
    while (m_messageQueue.Count() >= 1) {
      TAVMessage message = m_messageQueue.Dequeue();
      switch (message.MessageType()) {
        case kMsgImmediateShutdown:
          // The rest stays queued: the program is about to end.
          m_host.ImmediateShutdown("Immediate shutdown requested");
          return;
        case kMsgTrayIntroduction:
          SetTrayWindow(message.SenderHwnd());
          SendStatusToTAVTray(true);
          break;
        case kMsgReloadSchedules:
          m_host.LoadSchedules();
          break;
        case kMsgGracefulShutdown:
          m_host.GracefulShutdown();
          break;
        case kMsgShowOnDemand:
          m_host.ShowOnDemand(message.Text());
          break;
        case kMsgLeaveOnDemandOnly:
          m_host.SetOnDemandOnly(false);
          break;
        case kMsgSimulateInput: {
          // A malformed body fails here, before the host is asked anything.
          SimulatedInput input = SimulatedInputFromText(message.Text());
          m_host.SimulateInput(input.network, input.unitId, input.inputNumber);
          break;
        }
        default:
          // Player-to-tray types echoed back and unknown types mean nothing here.
          break;
      }
    }
    m_tmrTAVMsgQueue->SetEnabled(false);
  } catch (const Error& e) {
    // The failing message is lost; the timer stays enabled for the rest.
    m_log.LogMessage(3, "tmrTAVMsgQueue_Timer Error: " + e.Description());
  } catch (const std::exception& e) {
    m_log.LogMessage(3, std::string("tmrTAVMsgQueue_Timer Error: ") + e.what());
  }
}

}  // namespace tav
