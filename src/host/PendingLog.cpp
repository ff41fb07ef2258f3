#include "host/PendingLog.h"

namespace tav {

void PendingLog::Append(std::string_view line) {
  if (!m_text.empty()) m_text += "\r\n";
  m_text.append(line);
  if (m_text.size() < kTrimAt) return;
  m_text.erase(0, m_text.size() - kKeepAfterTrim);
  size_t lineBreak = m_text.find("\r\n");
  if (lineBreak != std::string::npos) {
    m_text.erase(0, lineBreak + 2);
    return;
  }
  // A line longer than what is kept has no break left and stays as it is,
  // but from a whole character: the tray must get valid UTF-8.
  size_t start = 0;
  while (start < m_text.size() && (static_cast<unsigned char>(m_text[start]) & 0xC0) == 0x80) {
    ++start;
  }
  m_text.erase(0, start);
}

std::string PendingLog::Take() {
  std::string text;
  text.swap(m_text);
  return text;
}

}  // namespace tav
