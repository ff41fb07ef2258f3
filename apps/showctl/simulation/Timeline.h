#pragma once
// The timeline a simulation prints: one event per line, at its virtual date
// and time, in the order things happened. Shows start (with the source that
// chose them and why), wind down and end; sequences start and stop; the
// player's warnings and errors; notes on what a simulation does not do
// (shell commands it does not run, exports it does not write).
//
// A line identical to one of the same kind added at most kFoldSeconds
// before is folded into it, so that a problem the player reports every
// second (a show file that cannot be read while its show is due) or a
// sequence that fails and restarts every millisecond is one line with a
// count and the time of its last repetition; counts include the folded
// repetitions. A show starting, winding down or ending closes every fold,
// so that what happens around it keeps its order.

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "support/DateTime.h"

namespace tav::simulation {

enum class EventKind {
  kShowStart,
  kShowWindingDown,
  kShowEnd,
  kSequenceStart,
  kSequenceStop,
  kWarning,
  kError,
  kInfo,  // a log line of level 1, kept only when asked for
  kNote,
  kEnd,  // what was still running when the simulation ended
};

// "show-start", "sequence-stop", "warning", ... (for scripts).
const char* EventKindName(EventKind kind);

struct TimelineEvent {
  DateTime at;
  EventKind kind = EventKind::kInfo;
  // The line as a person reads it, after the time and the kind.
  std::string text;
  // The show or sequence file, where there is one; the section of a
  // sequence ("Musical"); for a show start, the source ("week", "year",
  // "on-demand") and the reason in words.
  std::string file;
  std::string section;
  std::string source;
  std::string reason;
  // Identical lines folded into this one, and when the last of them came.
  int64_t repeats = 0;
  DateTime lastAt;
};

class Timeline {
 public:
  static constexpr int64_t kFoldSeconds = 2;

  // Adds the event, or folds it into an identical one (same kind and text)
  // whose last repetition came at most kFoldSeconds before, with no show
  // event between them. True when it was added as a line of its own.
  bool Add(TimelineEvent event);

  const std::vector<TimelineEvent>& Events() const { return m_events; }
  // Events of the kind, each folded repetition counted.
  int64_t Count(EventKind kind) const;
  // Lines of the kind.
  int64_t Lines(EventKind kind) const;

 private:
  std::vector<TimelineEvent> m_events;
  // The last event of each kind and text, by index.
  std::map<std::pair<EventKind, std::string>, size_t> m_last;
};

}  // namespace tav::simulation
