#include "suite/channelio/serial/SerialFrameSender.h"

#include <algorithm>

namespace tav {
namespace {

// How soon to look again when the device's queue is full and no baud rate
// tells how long it will take to drain.
constexpr uint32_t kRetryMs = 2;

}  // namespace

SerialFrameSender::SerialFrameSender(FrameSenderOptions options, std::unique_ptr<SerialLink> link,
                                     TimerService& timers, const Clock& clock, MessageLog& log)
    : m_options(std::move(options)),
      m_link(std::move(link)),
      m_clock(clock),
      m_log(log),
      m_pacer(m_options.paceBaud, m_options.stopBits),
      m_timer(timers, m_options.name + " frames", [this] { TrySend(); }) {
  m_link->SetOnConnectionChange(
      [this](bool connected, const std::string& reason) { OnConnectionChange(connected, reason); });
}

SerialFrameSender::~SerialFrameSender() {
  m_timer.Cancel();
  if (!m_waiting || !m_link->Connected()) return;
  if (m_options.breakMicros > 0) {
    m_link->WriteAfterBreak(m_next, m_options.breakMicros, m_options.markMicros);
  } else {
    m_link->Write(m_next);
  }
}

void SerialFrameSender::Send(std::span<const uint8_t> frame) {
  if (m_waiting) ++m_counters.framesReplaced;
  m_next.assign(frame.begin(), frame.end());
  m_waiting = true;
  TrySend();
}

void SerialFrameSender::TrySend() {
  if (!m_link->Connected()) {
    m_timer.Cancel();  // the frame waits for the device to come back
    return;
  }
  const uint32_t now = m_clock.TickCount();
  if (!m_waiting) {
    if (m_options.refreshMs == 0 || m_last.empty()) return;
    if (static_cast<int32_t>(now - m_lastSentTick) < static_cast<int32_t>(m_options.refreshMs)) {
      m_timer.Arm(now, m_lastSentTick + m_options.refreshMs);
      return;
    }
    m_next = m_last;
    m_waiting = true;
    ++m_counters.refreshes;
  }
  int64_t busyMicros = m_options.paceBaud > 0 ? m_pacer.BusyMicros(now) : 0;
  const size_t queued = m_link->QueuedBytes();
  if (queued > 0) {
    // The device's own buffer is full: the line is behind our estimate.
    busyMicros = std::max<int64_t>(
        busyMicros, m_options.paceBaud > 0
                        ? SerialLineMicros(queued, m_options.paceBaud, m_options.stopBits)
                        : kFrameSenderSlackMicros + kRetryMs * 1000);
  }
  if (busyMicros > kFrameSenderSlackMicros) {
    m_timer.ArmIn(static_cast<uint32_t>((busyMicros - kFrameSenderSlackMicros + 999) / 1000));
    return;
  }
  const bool written =
      m_options.breakMicros > 0
          ? m_link->WriteAfterBreak(m_next, m_options.breakMicros, m_options.markMicros)
          : m_link->Write(m_next);
  if (!written) {
    ++m_counters.refused;
    m_timer.ArmIn(kRetryMs);
    return;
  }
  if (m_options.paceBaud > 0) {
    m_pacer.Wrote(m_next.size(), now);
    if (m_options.breakMicros > 0) m_pacer.Occupy(m_options.breakMicros + m_options.markMicros);
  }
  ++m_counters.framesSent;
  m_counters.bytesSent += m_next.size();
  m_last.swap(m_next);
  m_waiting = false;
  m_lastSentTick = now;
  if (m_options.refreshMs > 0) {
    m_timer.Arm(now, now + m_options.refreshMs);
  } else {
    m_timer.Cancel();
  }
}

void SerialFrameSender::OnConnectionChange(bool connected, const std::string& reason) {
  m_pacer.Reset();
  if (!connected) {
    m_log.LogMessage(2, m_options.name + ": lost " + m_options.path + " (" + reason +
                            "); it is reopened when it comes back");
    m_timer.Cancel();
    return;
  }
  m_log.LogMessage(1, m_options.name + ": " + m_options.path + " is back");
  if (!m_waiting && !m_last.empty()) {
    m_next = m_last;
    m_waiting = true;
  }
  TrySend();
}

}  // namespace tav
