#include "host/PendingLog.h"

namespace tav {

void PendingLog::Append(std::string_view line) {
  if (!m_text.empty()) m_text += "\r\n";
  m_text.append(line);
  if (m_text.size() < kTrimAt) return;
  m_text.erase(0, m_text.size() - kKeepAfterTrim);
  // A line longer than what is kept has no break left and stays as it is.
  size_t lineBreak = m_text.find("\r\n");
  if (lineBreak != std::string::npos) m_text.erase(0, lineBreak + 2);
}

std::string PendingLog::Take() {
  std::string text;
  text.swap(m_text);
  return text;
}

}  // namespace tav
