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

std::string ComposeLogLine(DateTime now, std::string_view szText, const SequenceIdentity* seqInfo) {
  std::string line = now.TimeText();
  line += ": ";
  line.append(szText);
  if (seqInfo != nullptr) {
    line += ' ';
    line += PlayTypeName(seqInfo->PlayType());
    line += ": ";
    line += seqInfo->Filename();
  }
  return line;
}

void HostLog::LogMessage(int32_t level, const std::string& szText,
                         const SequenceIdentity* seqInfo) {
  if (szText.empty()) return;
  try {
    std::string line = ComposeLogLine(m_clock.Now(), szText, seqInfo);
    if (level <= 0) return;
    if (m_outbox.TrayWindow() != 0) {
      FlushPendingLog();
      m_outbox.Send(kMsgLogText, line);
    } else {
      m_pendingLog.Append(line);
    }
  } catch (...) {
    // Logging must never disturb the caller; the line is lost.
  }
}

void HostLog::FlushPendingLog() {
  if (m_outbox.TrayWindow() == 0 || m_pendingLog.IsEmpty()) return;
  m_outbox.Send(kMsgLogText, m_pendingLog.Take());
}

}  // namespace tav
