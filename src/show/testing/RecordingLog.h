#pragma once
// Test double of the MessageLog port: keeps every line as "<level> <text>".

#include <cstdint>
#include <string>
#include <vector>

#include "ports/MessageLog.h"

namespace tav {

class RecordingLog : public MessageLog {
 public:
  void LogMessage(int32_t level, const std::string& szText, const SequenceIdentity*) override {
    lines.push_back(std::to_string(level) + " " + szText);
  }
  std::vector<std::string> lines;
};

}  // namespace tav
