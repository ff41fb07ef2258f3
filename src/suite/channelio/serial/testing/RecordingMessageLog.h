#pragma once
// Test double for the MessageLog port: keeps every line with its level.

#include <cstdint>
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
    lines.push_back({level, szText});
  }
  // Lines containing `part`.
  std::vector<std::string> Matching(const std::string& part) const {
    std::vector<std::string> found;
    for (const auto& line : lines) {
      if (line.text.find(part) != std::string::npos) found.push_back(line.text);
    }
    return found;
  }

  std::vector<Line> lines;
};

}  // namespace tav
