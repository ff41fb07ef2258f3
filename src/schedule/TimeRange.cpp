#include "schedule/TimeRange.h"

#include "support/Error.h"
#include "support/Serialize.h"

namespace tav {

constexpr int32_t kMissingFieldError = 37;

DateTime TimeRange::StartTime() const {
  if (!m_hasStart)
    throw Error(kMissingFieldError, "TimeRange.StartTime", "Time range has no start");
  return m_startTime;
}

DateTime TimeRange::EndTime() const {
  if (!m_hasEnd) throw Error(kMissingFieldError, "TimeRange.EndTime", "Time range has no end");
  return m_endTime;
}

void TimeRange::SetStartTime(DateTime value) {
  m_startTime = value;
  m_hasStart = true;
  if (m_hasEnd && !(m_endTime >= value)) m_hasEnd = false;
}

void TimeRange::SetEndTime(DateTime value) {
  m_endTime = value;
  m_hasEnd = true;
  if (m_hasStart && !(value >= m_startTime)) m_hasStart = false;
}

bool TimeRange::Includes(DateTime dtTime, bool boolStartInclusive, bool boolEndInclusive) const {
  if (m_hasStart) {
    bool after = dtTime > m_startTime || (dtTime == m_startTime && boolStartInclusive);
    if (!after) return false;
  }
  if (!m_hasEnd) return true;
  return dtTime < m_endTime || (dtTime == m_endTime && boolEndInclusive);
}

bool TimeRange::IncludesAdjustable(DateTime dtToCheck, DateTime dtOtherBound,
                                   bool boolToCheckInclusive, bool boolOtherBoundInclusive,
                                   bool boolAdjustmentPositive, bool boolStartInclusive,
                                   bool boolEndInclusive) const {
  if (!boolToCheckInclusive) {
    dtToCheck = dtToCheck.AddSeconds(boolAdjustmentPositive ? 1 : -1);
    // The other range is empty at one-second resolution.
    if (!boolOtherBoundInclusive && dtToCheck == dtOtherBound) return false;
  }
  return Includes(dtToCheck, boolStartInclusive, boolEndInclusive);
}

bool TimeRange::Overlaps(const std::shared_ptr<TimeRange>& Other, bool boolThisStartInclusive,
                         bool boolThisEndInclusive, bool boolOtherStartInclusive,
                         bool boolOtherEndInclusive) const {
  if (!Other) throw errors::ObjectNotSet("TimeRange.Overlaps");
  const TimeRange& o = *Other;
  const bool ts = boolThisStartInclusive, te = boolThisEndInclusive;
  const bool os = boolOtherStartInclusive, oe = boolOtherEndInclusive;

  if (!m_hasStart && !m_hasEnd) return true;
  if (!o.m_hasStart && !o.m_hasEnd) return true;
  if (!m_hasStart && !o.m_hasStart) return true;
  if (!m_hasEnd && !o.m_hasEnd) return true;

  if (!m_hasStart) {
    return (te && os) ? o.m_startTime <= m_endTime : o.m_startTime < m_endTime;
  }
  if (m_hasEnd && o.m_hasStart && !o.m_hasEnd) {
    // The other's start inclusiveness is deliberately not consulted here.
    return te ? o.m_startTime <= m_endTime : o.m_startTime < m_endTime;
  }
  if (m_hasEnd && o.m_hasStart && o.m_hasEnd) {
    return o.IncludesAdjustable(m_startTime, m_endTime, ts, te, true, os, oe) ||
           o.IncludesAdjustable(m_endTime, m_startTime, te, ts, false, os, oe) ||
           IncludesAdjustable(o.m_startTime, o.m_endTime, os, oe, true, ts, te) ||
           IncludesAdjustable(o.m_endTime, o.m_startTime, oe, os, false, ts, te);
  }
  // This range has a start; the other has no start, or this has no end.
  return (oe && ts) ? m_startTime <= o.m_endTime : m_startTime < o.m_endTime;
}

bool TimeRange::StartsBeforeOtherEnds(const std::shared_ptr<TimeRange>& Other) const {
  if (!Other || !m_hasStart || !Other->m_hasEnd) return true;
  return m_startTime < Other->m_endTime;
}

bool TimeRange::Equals(const std::shared_ptr<TimeRange>& Other) const {
  if (!Other) return false;
  if (m_hasStart != Other->m_hasStart) return false;
  if (m_hasStart && !(m_startTime == Other->m_startTime)) return false;
  if (!m_hasEnd) return !Other->m_hasEnd;
  if (Other->m_hasEnd) return m_endTime == Other->m_endTime;
  return true;
}

std::string TimeRange::Serialize() const {
  return ListToText({BoolToText(m_hasStart), m_hasStart ? DateToText(m_startTime) : "",
                     BoolToText(m_hasEnd), m_hasEnd ? DateToText(m_endTime) : ""});
}

void TimeRange::Deserialize(std::string_view szSerialized) {
  TextArray fields = ListFromText(szSerialized, 0);
  int32_t count = ArrayCount(fields);
  if (count != 4) {
    throw Error(kMissingFieldError, "TimeRange.Deserialize",
                "Unexpected number of fields in serialized time range: " + std::to_string(count));
  }
  bool hasStart = BoolFromText(fields[0]);
  DateTime start = hasStart ? DateFromText(fields[1]) : DateTime();
  bool hasEnd = BoolFromText(fields[2]);
  DateTime end = hasEnd ? DateFromText(fields[3]) : DateTime();

  if (hasStart) {
    SetStartTime(start);
  } else {
    ClearStart();
  }
  if (hasEnd) {
    SetEndTime(end);
  } else {
    ClearEnd();
  }
}

void TimeRange::CopyFrom(const std::shared_ptr<TimeRange>& Other) {
  Deserialize(Other ? Other->Serialize() : TimeRange().Serialize());
}

}  // namespace tav
