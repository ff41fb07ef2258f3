#include "ConsoleLog.h"

namespace tav::player {

std::string LevelName(int32_t level) {
  switch (level) {
    case 1:
      return "info";
    case 2:
      return "warning";
    case 3:
      return "error";
    default:
      return "level " + std::to_string(level);
  }
}

std::string FormatConsoleLine(int32_t level, DateTime now, std::string_view text) {
  std::string prefix = now.ToText() + " " + LevelName(level);
  if (prefix.size() < 27) prefix.append(27 - prefix.size(), ' ');
  prefix += ' ';
  std::string out;
  size_t start = 0;
  for (;;) {
    size_t end = text.find('\n', start);
    std::string_view line = text.substr(start, end == std::string_view::npos ? end : end - start);
    if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
    if (!out.empty()) out += '\n';
    out += prefix;
    out.append(line);
    if (end == std::string_view::npos) break;
    start = end + 1;
  }
  return out;
}

void ConsoleLog::Write(int32_t level, DateTime now, std::string_view text) {
  std::string lines = FormatConsoleLine(level, now, text);
  if (m_keep == 0) {
    std::fputs(lines.c_str(), m_stream);
    std::fputc('\n', m_stream);
    std::fflush(m_stream);
    return;
  }
  size_t start = 0;
  for (;;) {
    size_t end = lines.find('\n', start);
    m_recent.push_back(lines.substr(start, end == std::string::npos ? end : end - start));
    if (end == std::string::npos) break;
    start = end + 1;
  }
  while (m_recent.size() > m_keep) m_recent.pop_front();
}

void ConsoleLog::KeepForView(size_t lines) {
  m_keep = lines;
  while (m_recent.size() > m_keep) m_recent.pop_front();
}

}  // namespace tav::player
