#include "host/HostLog.h"

#include <array>

#include "host/Msg.h"

namespace tav {

std::string PlayTypeName(int32_t playType) {
  static constexpr std::array<const char*, 8> kNames = {"Null",    "Background", "Interactive",
                                                        "Startup", "Animation",  "Musical",
                                                        "Cleanup", "Shutdown"};
  if (playType >= 0 && playType < static_cast<int32_t>(kNames.size())) return kNames[playType];
  return "(" + std::to_string(playType) + ")";
}

std::string ComposeLogText(std::string_view szText, const SequenceIdentity* seqInfo) {
  std::string text(szText);
  if (seqInfo != nullptr) {
    text += ' ';
    text += PlayTypeName(seqInfo->PlayType());
    text += ": ";
    text += seqInfo->Filename();
  }
  return text;
}

std::string ComposeLogLine(DateTime now, std::string_view szText, const SequenceIdentity* seqInfo) {
  return now.TimeText() + ": " + ComposeLogText(szText, seqInfo);
}

void HostLog::LogMessage(int32_t level, const std::string& szText,
                         const SequenceIdentity* seqInfo) {
  if (szText.empty()) return;
  try {
    DateTime now = m_clock.Now();
    std::string text = ComposeLogText(szText, seqInfo);
    if (level <= 0) return;
    std::string line = now.TimeText() + ": " + text;
    if (m_outbox.TrayWindow() != 0) {
      FlushPendingLog();
      m_outbox.Send(kMsgLogText, line);
    } else {
      m_pendingLog.Append(line);
    }
    if (m_echo) m_echo(level, now, text);
  } catch (...) {
    // Logging must never disturb the caller; the line is lost.
  }
}

void HostLog::FlushPendingLog() {
  if (m_outbox.TrayWindow() == 0 || m_pendingLog.IsEmpty()) return;
  m_outbox.Send(kMsgLogText, m_pendingLog.Take());
}

}  // namespace tav
