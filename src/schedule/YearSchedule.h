#pragma once
// Shows for particular calendar dates, on top of the repeating week schedule.
// Each date that has shows keeps one week Schedule, keyed by "yyyy-mm-dd"; a
// dated show is stored in the schedule of its start date as week times, so
// only that date's weekday matters inside it. A dated show may run past
// midnight into the next day but not further.
//
// Owned by the host. Keys keeps the order in which dates were added, which is
// also the order of the year schedule file. Errors are thrown as tav::Error.

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "schedule/Schedule.h"
#include "schedule/TimeRange.h"
#include "support/DateTime.h"

namespace tav {

class YearSchedule {
 public:
  // "yyyy-mm-dd" of the date.
  static std::string DateToString(DateTime date);
  // Splits at "-" into year, month and day (16-bit numbers); months and days
  // out of range roll over as in ordinary date arithmetic ("2024-13-01" is
  // 2025-01-01). Not three parts: error 37, "Unexpected date string format: ".
  static DateTime DateStringToDate(std::string_view szDateString);

  // That date's schedule, or null.
  std::shared_ptr<Schedule> ScheduleByKey(const std::string& key) const;
  std::shared_ptr<Schedule> DateSchedule(DateTime SchedDate) const;
  // Fails with the duplicate-key error (457) for a date already present.
  void AddSchedule(DateTime SchedDate, std::shared_ptr<Schedule> Sched);
  const std::vector<std::string>& Keys() const { return m_keys; }
  bool Modified() const { return m_modified; }
  void SetModified(bool value) { m_modified = value; }

  // The earliest dated show whose occurrence overlaps trRange (start
  // included, end excluded; null for all time), or null. Its start goes to
  // dtFirstShowStartTime. Of shows with equal starts the later one wins.
  std::shared_ptr<ShowEvent> FirstShowWithinRange(const std::shared_ptr<TimeRange>& trRange,
                                                  DateTime& dtFirstShowStartTime) const;
  // Adds a show from start to end, which may end on the next day. Fails, with
  // the source "Schedule.AddShowEventByFile", with 1 "End time precedes start
  // time", 2 "Event spans more than two days", 3 "End time conficts with
  // event in next day", 4 "Start time conflicts with event in previous day"
  // or 4 "Event conflict".
  void AddShowEventByFile(std::string szFilename, DateTime start, DateTime end);
  // Removes the node's show from the date's schedule; a date left without a
  // show is dropped.
  void RemoveShowEvent(DateTime ShowDate, const std::shared_ptr<Node>& ShowNode);

  // Writes the year schedule file; Modified is cleared whatever the result.
  bool Save(const std::string& szFilename, TextFileStore& files);

 private:
  std::vector<std::string> m_keys;
  std::vector<DateTime> m_keyDates;  // the dates of m_keys, for the range search
  std::unordered_map<std::string, std::shared_ptr<Schedule>> m_schedules;
  bool m_modified = false;
};

// One day record "(yyyy-mm-dd,<week schedule text>)" per date, in Keys order;
// the empty text for no dates.
std::string YearScheduleToText(const YearSchedule& yearSchedule);
std::shared_ptr<YearSchedule> YearScheduleFromText(std::string_view text);
// The year schedule file: a new empty year schedule when the file does not
// exist or cannot be read; Modified cleared after loading. A file that reads
// but is no year schedule fails with the reader's error.
std::shared_ptr<YearSchedule> LoadYearSchedule(const std::string& path, TextFileStore& files);

}  // namespace tav
