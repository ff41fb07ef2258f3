#pragma once
// The player's side of the conversation with the tray program. Received
// frames are decoded and queued by the receive handler, which never acts on
// them, so that the tray's send returns at once; the 1 ms timer
// tmrTAVMsgQueue drains the queue and carries out each request through the
// host. Towards the tray it sends sequence starts and stops and the show
// status (current and next show event), the latter only when it changed
// since it was last sent unless forced.
//
// Owned by the host form, which implements TrayHost and owns the outbox, the
// log and the timer service this refers to; all must outlive it. The host
// routes the tray link's received frames to m_FormHook_AfterMessage.

#include <cstdint>
#include <memory>

#include "host/HostLog.h"
#include "host/Queue.h"
#include "host/TAVMessage.h"
#include "host/TrayHost.h"
#include "host/TrayLink.h"
#include "host/TrayOutbox.h"
#include "ports/Clock.h"
#include "ports/MessageLog.h"
#include "ports/TimerService.h"
#include "schedule/MonitoredShowEvent.h"

namespace tav {

class TrayMessaging {
 public:
  TrayMessaging(TrayOutbox& outbox, HostLog& log, TrayHost& host, TimerService& timers,
                const Clock& clock);

  uint32_t TrayWindow() const { return m_outbox.TrayWindow(); }
  // A new tray window: stores it, flushes the held-back log to it and
  // announces readiness when due. The same window again does nothing.
  void SetTrayWindow(uint32_t hwnd);

  bool ReadyAnnounced() const { return m_readyAnnounced; }
  // Sends the ready message once per run, when the host is initialised and a
  // tray is known. The host also calls it every second.
  void AnnounceReadiness();

  // Failures are swallowed; with no tray known the notice is lost.
  void SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo);
  void SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo);
  // Sends the next and the current show event, when forced, when nothing was
  // sent yet, or when either differs from what was last sent.
  void SendStatusToTAVTray(bool boolForce);

  // The receive handler: decodes, queues and enables the drain timer.
  void m_FormHook_AfterMessage(const TrayFrame& frame);
  // When the last frame arrived (shown for diagnosis).
  DateTime LastMessageTime() const { return m_lastMessageTime; }

  Queue<TAVMessage>& MessageQueue() { return m_messageQueue; }
  Timer& tmrTAVMsgQueue() { return *m_tmrTAVMsgQueue; }

 private:
  struct SentStatus {
    std::shared_ptr<MonitoredShowEvent> current;
    std::shared_ptr<MonitoredShowEvent> next;
    bool sent = false;
  };

  void tmrTAVMsgQueue_Timer();
  void SendSequenceNotice(int32_t type, const SequenceIdentity& seqInfo);

  TrayOutbox& m_outbox;
  HostLog& m_log;
  TrayHost& m_host;
  const Clock& m_clock;
  Queue<TAVMessage> m_messageQueue;
  std::unique_ptr<Timer> m_tmrTAVMsgQueue;
  bool m_readyAnnounced = false;
  SentStatus m_lastSentStatus;
  DateTime m_lastMessageTime;
};

}  // namespace tav
