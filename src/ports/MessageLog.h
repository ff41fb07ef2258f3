#pragma once
// Port: the program's log, as every subsystem writes to it. The host
// implements it (lines go to the tray program, or are held back while none is
// known); tests stand in a recorder. Logging through this interface rather
// than through the host keeps ownership one-way: the host owns the
// subsystems, and they only know that somebody listens.

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

}  // namespace tav
