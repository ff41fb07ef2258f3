#pragma once
// Test double for the MessageLog port: keeps every line as "<level> <text>",
// with " [seq]" appended when a sequence was given, so a test can compare
// what was logged with one list.

#include <string>
#include <vector>

#include "ports/MessageLog.h"

namespace tav {

class RecordingMessageLog : public MessageLog {
 public:
  void LogMessage(int32_t level, const std::string& szText,
                  const SequenceIdentity* seqInfo = nullptr) override {
    lines.push_back(std::to_string(level) + " " + szText + (seqInfo ? " [seq]" : ""));
  }

  std::vector<std::string> lines;
};

}  // namespace tav
