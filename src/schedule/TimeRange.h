#pragma once
// A span of calendar date-times whose start and end are each optional, so it
// can stand for a span open at either end or for all time. Inclusiveness is
// not stored: every test takes it as arguments, because the same range is
// tested half-open in one place and closed in another.
//
// A range is never stored inverted: writing a bound on the wrong side of the
// other bound drops the other bound. Callers that set both set the start
// first, then the end.

#include <memory>
#include <string>
#include <string_view>

#include "support/DateTime.h"

namespace tav {

class TimeRange {
 public:
  // Fail with error 37 when the bound is not set.
  DateTime StartTime() const;
  DateTime EndTime() const;
  void SetStartTime(DateTime value);
  void SetEndTime(DateTime value);
  bool HasStart() const { return m_hasStart; }
  bool HasEnd() const { return m_hasEnd; }
  // Clear the flag; the stored date-time stays as it is.
  void ClearStart() { m_hasStart = false; }
  void ClearEnd() { m_hasEnd = false; }

  bool Includes(DateTime dtTime, bool boolStartInclusive, bool boolEndInclusive) const;
  // Whether a bound of another range lies in this one, an exclusive bound
  // being nudged one second inward first (schedule times have one-second
  // resolution).
  bool IncludesAdjustable(DateTime dtToCheck, DateTime dtOtherBound, bool boolToCheckInclusive,
                          bool boolOtherBoundInclusive, bool boolAdjustmentPositive,
                          bool boolStartInclusive, bool boolEndInclusive) const;
  bool Overlaps(const std::shared_ptr<TimeRange>& Other, bool boolThisStartInclusive,
                bool boolThisEndInclusive, bool boolOtherStartInclusive,
                bool boolOtherEndInclusive) const;
  bool StartsBeforeOtherEnds(const std::shared_ptr<TimeRange>& Other) const;
  // Not symmetric: a range with an end equals the same range without one,
  // but not the other way round. Kept, since stored comparisons rely on it.
  bool Equals(const std::shared_ptr<TimeRange>& Other) const;

  // "(T,2024-12-24 18:30:00,F,)". Deserialize keeps the previous state when
  // the record fails to read.
  std::string Serialize() const;
  void Deserialize(std::string_view szSerialized);
  // Copies through the text, so a copy is exactly what a save and load give.
  void CopyFrom(const std::shared_ptr<TimeRange>& Other);

 private:
  DateTime m_startTime;
  DateTime m_endTime;
  bool m_hasStart = false;
  bool m_hasEnd = false;
};

}  // namespace tav
