#pragma once
// The player's log. There is no log file: every line goes to the tray
// program as a log message, and while no tray is known lines are held back
// in a bounded buffer that is sent in one piece once a tray introduces itself.
// A line is the time of day, ": ", the text and, for a sequence, " ", its
// play-type name, ": " and its file name. Trace lines (level 0 or less) are
// composed and discarded.
//
// Owned by the host; takes the clock for the time of day and the outbox that
// knows the tray window. Logging never fails towards the caller. An echo,
// when set, sees every line that is not a trace line as well (the player
// copies lines to standard error while no tray is connected).

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

#include "host/PendingLog.h"
#include "host/TrayOutbox.h"
#include "ports/Clock.h"
#include "ports/MessageLog.h"

namespace tav {

// "Null", "Background", ... "Shutdown" for 0 to 7; "(n)" for any other n.
std::string PlayTypeName(int32_t playType);

// The log line for `szText` at the time of day of `now`: the time, ": " and
// the text of ComposeLogText.
std::string ComposeLogLine(DateTime now, std::string_view szText, const SequenceIdentity* seqInfo);
// `szText` and, for a sequence, " ", its play-type name, ": " and its file.
std::string ComposeLogText(std::string_view szText, const SequenceIdentity* seqInfo);

class HostLog : public MessageLog {
 public:
  HostLog(const Clock& clock, TrayOutbox& outbox) : m_clock(clock), m_outbox(outbox) {}

  void LogMessage(int32_t level, const std::string& szText,
                  const SequenceIdentity* seqInfo = nullptr) override;

  // Sends the held-back lines as one log message when a tray is known.
  void FlushPendingLog();

  const PendingLog& Pending() const { return m_pendingLog; }

  // Called with the level, the time and the text (without the time) of
  // every line of level 1 or more, after it went to the tray or the buffer.
  using Echo = std::function<void(int32_t level, DateTime now, const std::string& text)>;
  void SetEcho(Echo echo) { m_echo = std::move(echo); }

 private:
  const Clock& m_clock;
  TrayOutbox& m_outbox;
  PendingLog m_pendingLog;
  Echo m_echo;
};

}  // namespace tav
