#pragma once
// Test double for the MessageLog port: keeps every line with its level.
// Header only.

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
                  const SequenceIdentity* = nullptr) override {
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
  void Clear() { m_lines.clear(); }

 private:
  std::vector<Line> m_lines;
};

}  // namespace tav
