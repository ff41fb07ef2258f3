#include "schedule/WeekTime.h"

#include <algorithm>
#include <limits>

#include "support/Error.h"
#include "support/Numbers.h"
#include "support/Serialize.h"

namespace tav {
namespace {

// The week arithmetic is 32-bit on purpose: a sum outside that range is a
// corrupt record, reported as an overflow rather than silently wrapped.
int32_t Checked(int64_t value, const char* source) {
  if (value < std::numeric_limits<int32_t>::min() || value > std::numeric_limits<int32_t>::max())
    throw errors::Overflow(source);
  return static_cast<int32_t>(value);
}

}  // namespace

void WeekTime::SetTimeVal(int32_t NewTime) {
  int32_t shifted = Checked(int64_t{NewTime} + kSecondsPerWeek, "WeekTime.TimeVal");
  m_timeVal = shifted % kSecondsPerWeek;  // truncating: keeps the sign of the dividend
  m_day = m_timeVal / kSecondsPerDay;
  m_hour = (m_timeVal % kSecondsPerDay) / kSecondsPerHour;
  m_minute = (m_timeVal % kSecondsPerHour) / kSecondsPerMinute;
  m_second = m_timeVal % kSecondsPerMinute;
}

void WeekTime::SetDay(int32_t NewDay) {
  m_day = Checked(int64_t{NewDay} + 7, "WeekTime.Day") % 7;
  Recompute();
}

void WeekTime::SetHour(int32_t NewHour) {
  m_hour = std::clamp(NewHour, 0, 23);
  Recompute();
}

void WeekTime::SetMinute(int32_t NewMinute) {
  m_minute = std::clamp(NewMinute, 0, 59);
  Recompute();
}

void WeekTime::SetSecond(int32_t NewSecond) {
  m_second = std::clamp(NewSecond, 0, 59);
  Recompute();
}

void WeekTime::Recompute() {
  // Not reduced modulo the week again: the parts are already in range.
  m_timeVal = Checked(int64_t{m_day} * kSecondsPerDay + int64_t{m_hour} * kSecondsPerHour +
                          int64_t{m_minute} * kSecondsPerMinute + m_second,
                      "WeekTime.TimeVal");
}

int32_t WeekTime::DaySecond() const {
  return Checked(int64_t{m_timeVal} - int64_t{m_day} * kSecondsPerDay, "WeekTime.DaySecond");
}

bool WeekTime::Between(const WeekTime& LowerBound, const WeekTime& UpperBound) const {
  const int32_t s = m_timeVal, a = LowerBound.m_timeVal, b = UpperBound.m_timeVal;
  if (a < b) return a < s && s < b;
  if (a > b) return s > a || s < b;
  return true;
}

bool WeekTime::BetweenEquals(const WeekTime& LowerBound, const WeekTime& UpperBound) const {
  const int32_t s = m_timeVal, a = LowerBound.m_timeVal, b = UpperBound.m_timeVal;
  if (a < b) return a <= s && s <= b;
  if (a > b) return s >= a || s <= b;
  return true;
}

bool WeekTime::InRange(const WeekTime& LowerBound, const WeekTime& UpperBound) const {
  const int32_t s = m_timeVal, a = LowerBound.m_timeVal, b = UpperBound.m_timeVal;
  if (a < b) return a <= s && s < b;
  if (a > b) return s >= a || s < b;
  return true;
}

bool WeekTime::Equals(const WeekTime& Othertime) const {
  return m_timeVal == Othertime.m_timeVal;
}

std::shared_ptr<WeekTime> WeekTime::PlusDuration(int32_t duration) const {
  auto result = std::make_shared<WeekTime>();
  result->SetTimeVal(Checked(int64_t{m_timeVal} + duration, "WeekTime.PlusDuration"));
  return result;
}

int32_t WeekTime::Minus(const WeekTime& Othertime) const {
  return Checked(int64_t{m_timeVal} - Othertime.m_timeVal + kSecondsPerWeek, "WeekTime.Minus") %
         kSecondsPerWeek;
}

std::shared_ptr<WeekTime> WeekTime::MinusDuration(int32_t duration) const {
  Checked(int64_t{m_timeVal} - duration, "WeekTime.MinusDuration");
  // The result object is never created, so storing into it fails.
  throw errors::ObjectNotSet("WeekTime.MinusDuration");
}

std::string WeekTime::ToString() const {
  static const char* const kDayNames[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  std::string text = m_day >= 0 && m_day <= 6 ? kDayNames[m_day] : "";
  text += std::to_string(m_hour);
  text += std::to_string(m_minute);
  text += std::to_string(m_second);
  return text;
}

std::string WeekTime::DayTimeToString() const {
  auto twoDigits = [](int32_t value) {
    return value < 10 ? "0" + std::to_string(value) : std::to_string(value);
  };
  std::string text = m_hour == 0 || m_hour == 12 ? "12" : std::to_string(m_hour % 12);
  text += ":" + twoDigits(m_minute) + ":" + twoDigits(m_second);
  text += m_hour / 12 != 0 ? " PM" : " AM";
  return text;
}

std::shared_ptr<WeekTime> NewWeekTime(int32_t day, int32_t hour, int32_t minute, int32_t second) {
  auto result = std::make_shared<WeekTime>();
  result->SetDay(day);
  result->SetHour(hour);
  result->SetMinute(minute);
  result->SetSecond(second);
  return result;
}

std::shared_ptr<WeekTime> WeekTimeFromDate(DateTime dtTime) {
  return NewWeekTime(dtTime.DayOfWeek(), dtTime.Hour(), dtTime.Minute(), dtTime.Second());
}

std::shared_ptr<WeekTime> WeekTimeFromText(std::string_view field) {
  auto result = std::make_shared<WeekTime>();
  result->SetTimeVal(NumberOf(UnescapeText(field)));
  return result;
}

DateTime WeekTimeToDate(const WeekTime& weekTime, DateTime dtReference) {
  DateTime sunday = dtReference.DateOnly().AddDays(-dtReference.DayOfWeek());
  return sunday.AddDays(weekTime.Day())
      .AddSeconds(int64_t{weekTime.Hour()} * kSecondsPerHour)
      .AddSeconds(int64_t{weekTime.Minute()} * kSecondsPerMinute)
      .AddSeconds(weekTime.Second());
}

std::string WeekTimeToText(const WeekTime& weekTime) {
  return std::to_string(weekTime.TimeVal());
}

}  // namespace tav
