#include "Timeline.h"

namespace tav::simulation {

const char* EventKindName(EventKind kind) {
  switch (kind) {
    case EventKind::kShowStart:
      return "show-start";
    case EventKind::kShowWindingDown:
      return "show-winding-down";
    case EventKind::kShowEnd:
      return "show-end";
    case EventKind::kSequenceStart:
      return "sequence-start";
    case EventKind::kSequenceStop:
      return "sequence-stop";
    case EventKind::kWarning:
      return "warning";
    case EventKind::kError:
      return "error";
    case EventKind::kInfo:
      return "info";
    case EventKind::kNote:
      return "note";
    case EventKind::kEnd:
      return "end";
  }
  return "?";
}

bool Timeline::Add(TimelineEvent event) {
  auto key = std::make_pair(event.kind, event.text);
  auto last = m_last.find(key);
  if (last != m_last.end()) {
    TimelineEvent& earlier = m_events[last->second];
    if (event.at.SecondsSince(earlier.lastAt) <= kFoldSeconds) {
      ++earlier.repeats;
      earlier.lastAt = event.at;
      return false;
    }
  }
  event.repeats = 0;
  event.lastAt = event.at;
  const bool showEvent = event.kind == EventKind::kShowStart ||
                         event.kind == EventKind::kShowWindingDown ||
                         event.kind == EventKind::kShowEnd;
  if (showEvent) m_last.clear();
  m_last[key] = m_events.size();
  m_events.push_back(std::move(event));
  return true;
}

int64_t Timeline::Count(EventKind kind) const {
  int64_t count = 0;
  for (const TimelineEvent& e : m_events) {
    if (e.kind == kind) count += 1 + e.repeats;
  }
  return count;
}

int64_t Timeline::Lines(EventKind kind) const {
  int64_t lines = 0;
  for (const TimelineEvent& e : m_events) lines += e.kind == kind ? 1 : 0;
  return lines;
}

}  // namespace tav::simulation
