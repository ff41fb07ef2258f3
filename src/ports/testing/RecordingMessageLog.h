#pragma once
// Test double for the MessageLog port: keeps every line as "<level> <text>",
// with " [seq]" appended when a sequence was given, so a test can compare
// what was logged with one list; and every line with its level, for tests
// that look for a part of a text.

#include <algorithm>
#include <string>
#include <vector>

#include "ports/MessageLog.h"

namespace tav {

class RecordingMessageLog : public MessageLog {
 public:
  struct Line {
    int32_t level;
    std::string text;
  };

  void LogMessage(int32_t level, const std::string& szText,
                  const SequenceIdentity* seqInfo = nullptr) override {
    lines.push_back(std::to_string(level) + " " + szText + (seqInfo ? " [seq]" : ""));
    m_lines.push_back({level, szText});
  }

  const std::vector<Line>& Lines() const { return m_lines; }
  std::vector<std::string> Texts() const {
    std::vector<std::string> texts;
    for (const auto& line : m_lines) texts.push_back(line.text);
    return texts;
  }
  // How many lines contain `part`.
  size_t CountContaining(const std::string& part) const {
    return static_cast<size_t>(std::count_if(m_lines.begin(), m_lines.end(), [&](const Line& l) {
      return l.text.find(part) != std::string::npos;
    }));
  }
  void Clear() {
    lines.clear();
    m_lines.clear();
  }

  std::vector<std::string> lines;

 private:
  std::vector<Line> m_lines;
};

}  // namespace tav
