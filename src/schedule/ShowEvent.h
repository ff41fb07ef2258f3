#pragma once
// One entry of a week schedule: a show (a show file run from a start to an
// end week time) or a wait (no show in that span). The end is exclusive in
// the schedule's lookups; equal start and end mean the whole week.
//
// The start and end are shared WeekTime objects: the accessors return the
// stored objects themselves, and schedules deliberately let neighbouring
// events share the object at their common boundary. The setters keep the type
// and file name, and the start, end and duration, consistent silently.

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "schedule/TimeRange.h"
#include "schedule/WeekTime.h"
#include "support/DateTime.h"

namespace tav {

constexpr int32_t kEventTypeWait = 1;
constexpr int32_t kEventTypeShow = 2;

class ShowEvent {
 public:
  ShowEvent();

  int32_t EventType() const { return m_eventType; }
  // Writing a wait (1) also empties the file name.
  void SetEventType(int32_t value);
  const std::string& Filename() const { return m_filename; }
  // An empty name makes the event a wait, any other a show.
  void SetFilename(std::string value);

  const std::shared_ptr<WeekTime>& StartTime() const { return m_startTime; }
  // Stores the object; derives the end from a known duration when there is
  // no end, else the duration from the end.
  void SetStartTime(std::shared_ptr<WeekTime> NewStart);
  const std::shared_ptr<WeekTime>& EndTime() const { return m_endTime; }
  // Mirror image of SetStartTime; deriving a start from the end fails (see
  // WeekTime::MinusDuration).
  void SetEndTime(std::shared_ptr<WeekTime> NewEnd);
  // The end becomes the start plus Duration; 604800 makes the event fill the
  // week.
  void SetDuration(int32_t Duration);

  // The calendar span of the occurrence that is current or next at
  // dtReference; no bounds for an event that fills the week.
  std::shared_ptr<TimeRange> Range(DateTime dtReference) const;

 private:
  int32_t m_eventType = kEventTypeWait;
  std::string m_filename;
  std::shared_ptr<WeekTime> m_startTime;
  std::shared_ptr<WeekTime> m_endTime;
  int32_t m_duration = -1;  // -1 while unknown
};

// A wait from Start lasting Duration seconds.
std::shared_ptr<ShowEvent> NewWaitEvent(std::shared_ptr<WeekTime> Start, int32_t Duration);
// A show (or, for an empty name, a wait) from StartTime to EndTime; the
// objects are stored, not copied.
std::shared_ptr<ShowEvent> NewShowEvent(std::string szFilename, std::shared_ptr<WeekTime> StartTime,
                                        std::shared_ptr<WeekTime> EndTime);

// The show record of the schedule files: "(165600,2,(, 0,Xmas),151200)",
// end before start.
std::string ShowEventToText(const ShowEvent& event);
// Reads a show record. Missing fields fail with the subscript error (9), a
// type that is no number with the type-mismatch error (13).
std::shared_ptr<ShowEvent> ShowEventFromText(std::string_view text);

}  // namespace tav
