#pragma once
// The host's services as the rest of the program sees them. Sequences, the
// show engine and the schedules log and report through these interfaces
// rather than through the host itself, which owns them: that keeps the
// ownership one-way and lets tests stand in a recorder for the host.

#include <cstdint>
#include <string>

namespace tav {

// What log lines and tray notices need to know of a sequence. The sequence
// play info implements it.
class SequenceIdentity {
 public:
  virtual ~SequenceIdentity() = default;
  virtual int32_t PlayType() const = 0;
  virtual std::string Filename() const = 0;
  virtual int32_t Section() const = 0;
};

// Log levels: 0 or less trace (composed and discarded), 1 information,
// 2 warning, 3 error.
class MessageLog {
 public:
  virtual ~MessageLog() = default;
  // Never fails towards the caller.
  virtual void LogMessage(int32_t level, const std::string& szText,
                          const SequenceIdentity* seqInfo = nullptr) = 0;
};

// What a playing sequence asks of the host.
class SequenceHost : public MessageLog {
 public:
  virtual void SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) = 0;
  virtual void SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) = 0;
  // The path of a playable file made from a sequence name that does not
  // exist as given, or "" when none could be made.
  virtual std::string CreatePlaybackFileIfNeeded(const std::string& szFilename) = 0;
};

}  // namespace tav
