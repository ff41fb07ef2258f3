#pragma once
// A moment within the repeating week, to the second, with Sunday 00:00:00 as
// its origin. The week schedule places every show event on this circle of
// 604,800 seconds, and all comparisons on the circle live here so that the
// schedules never do modular arithmetic themselves.
//
// The five fields are kept consistent by every write: writing TimeVal derives
// the day and time of day; writing a part recomputes TimeVal. Hours, minutes
// and seconds are clamped, days and second counts wrapped. Sums that leave 32
// bits fail with the overflow error (6) instead of wrapping.
//
// Show events share WeekTime objects by reference (an event's end is often the
// very object that is its successor's start), so schedules hold them in
// std::shared_ptr and some edits change them in place.

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "support/DateTime.h"

namespace tav {

constexpr int32_t kSecondsPerMinute = 60;
constexpr int32_t kSecondsPerHour = 3600;
constexpr int32_t kSecondsPerDay = 86400;
constexpr int32_t kSecondsPerWeek = 604800;

class WeekTime {
 public:
  int32_t TimeVal() const { return m_timeVal; }
  // (NewTime + 604800) remainder 604800, the remainder keeping the sign of the
  // dividend: -1 gives 604799, but -604801 gives -1.
  void SetTimeVal(int32_t NewTime);
  int32_t Day() const { return m_day; }
  // (NewDay + 7) remainder 7.
  void SetDay(int32_t NewDay);
  int32_t Hour() const { return m_hour; }
  void SetHour(int32_t NewHour);  // clamped to 0..23
  int32_t Minute() const { return m_minute; }
  void SetMinute(int32_t NewMinute);  // clamped to 0..59
  int32_t Second() const { return m_second; }
  void SetSecond(int32_t NewSecond);  // clamped to 0..59

  // Seconds since midnight of the own day.
  int32_t DaySecond() const;

  // Interval tests on the circle. A lower bound after the upper bound means
  // the interval runs across the week end; equal bounds mean the whole week.
  bool Between(const WeekTime& LowerBound, const WeekTime& UpperBound) const;
  bool BetweenEquals(const WeekTime& LowerBound, const WeekTime& UpperBound) const;
  bool InRange(const WeekTime& LowerBound, const WeekTime& UpperBound) const;
  bool Equals(const WeekTime& Othertime) const;

  // A new week time this many seconds later (normalised); this one is unchanged.
  std::shared_ptr<WeekTime> PlusDuration(int32_t duration) const;
  // Forward distance from Othertime to this time, 0..604799.
  int32_t Minus(const WeekTime& Othertime) const;
  // Never yields a week time: after the overflow-checked subtraction it fails
  // with the unset-object error (91). Its only caller reaches it only for an
  // event with a duration and an end but no start, and relies on the failure.
  std::shared_ptr<WeekTime> MinusDuration(int32_t duration) const;

  // "Mon1030" for Monday 10:03:00: no separators, no padding. Logs only.
  std::string ToString() const;
  // "1:30:00 PM": the time of day in 12-hour form, without the day.
  std::string DayTimeToString() const;

 private:
  void Recompute();

  int32_t m_timeVal = 0;
  int32_t m_second = 0;
  int32_t m_minute = 0;
  int32_t m_hour = 0;
  int32_t m_day = 0;
};

// Writes Day, Hour, Minute and Second in that order.
std::shared_ptr<WeekTime> NewWeekTime(int32_t day, int32_t hour, int32_t minute, int32_t second);
// The weekday (Sunday = 0) and time of day of a date-time.
std::shared_ptr<WeekTime> WeekTimeFromDate(DateTime dtTime);
// The leading number of the unescaped field, rounded halves to even; a field
// without a number reads as 0 (Sunday 00:00:00).
std::shared_ptr<WeekTime> WeekTimeFromText(std::string_view field);
// The date-time of the week time in the Sunday-based week that holds
// dtReference.
DateTime WeekTimeToDate(const WeekTime& weekTime, DateTime dtReference);
// The decimal TimeVal, as the schedule files write it.
std::string WeekTimeToText(const WeekTime& weekTime);

}  // namespace tav
