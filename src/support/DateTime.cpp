#include "support/DateTime.h"

#include <cmath>
#include <cstdio>

#include "support/Error.h"

namespace tav {
namespace {

constexpr int64_t kMsPerDay = 86400000;
// Days from 1970-01-01 to 1899-12-30.
constexpr int64_t kSerialEpochOffset = -25569;

// Days since 1970-01-01 of a proleptic Gregorian date.
int64_t DaysFromCivil(int64_t y, unsigned m, unsigned d) {
  y -= m <= 2;
  const int64_t era = (y >= 0 ? y : y - 399) / 400;
  const unsigned yoe = static_cast<unsigned>(y - era * 400);
  const unsigned doy = (153 * (m > 2 ? m - 3 : m + 9) + 2) / 5 + d - 1;
  const unsigned doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + static_cast<int64_t>(doe) - 719468;
}

struct Civil {
  int64_t year;
  unsigned month;
  unsigned day;
};

Civil CivilFromDays(int64_t z) {
  z += 719468;
  const int64_t era = (z >= 0 ? z : z - 146096) / 146097;
  const unsigned doe = static_cast<unsigned>(z - era * 146097);
  const unsigned yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const int64_t y = static_cast<int64_t>(yoe) + era * 400;
  const unsigned doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const unsigned mp = (5 * doy + 2) / 153;
  const unsigned d = doy - (153 * mp + 2) / 5 + 1;
  const unsigned m = mp < 10 ? mp + 3 : mp - 9;
  return {y + (m <= 2), m, d};
}

bool IsLeap(int64_t y) {
  return (y % 4 == 0 && y % 100 != 0) || y % 400 == 0;
}

int DaysInMonth(int64_t y, int m) {
  static const int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  return m == 2 && IsLeap(y) ? 29 : kDays[m - 1];
}

bool ValidParts(int year, int month, int day, int hour, int minute, int second) {
  return year >= 100 && year <= 9999 && month >= 1 && month <= 12 && day >= 1 &&
         day <= DaysInMonth(year, month) && hour >= 0 && hour <= 23 && minute >= 0 &&
         minute <= 59 && second >= 0 && second <= 59;
}

// A small cursor for the text reader.
struct Reader {
  std::string_view text;
  size_t pos = 0;

  void SkipBlanks() {
    while (pos < text.size() && (text[pos] == ' ' || text[pos] == '\t')) ++pos;
  }
  bool AtEnd() const { return pos >= text.size(); }
  bool Peek(char c) const { return pos < text.size() && text[pos] == c; }
  bool Take(char c) {
    if (!Peek(c)) return false;
    ++pos;
    return true;
  }
  // Reads 1 to maxDigits decimal digits.
  std::optional<int> Number(size_t maxDigits) {
    size_t start = pos;
    int value = 0;
    while (pos < text.size() && pos - start < maxDigits && text[pos] >= '0' && text[pos] <= '9') {
      value = value * 10 + (text[pos] - '0');
      ++pos;
    }
    if (pos == start) return std::nullopt;
    return value;
  }
};

struct TimeOfDay {
  int hour = 0, minute = 0, second = 0;
};

std::optional<TimeOfDay> ReadTime(Reader& r) {
  TimeOfDay t;
  auto h = r.Number(2);
  if (!h || !r.Take(':')) return std::nullopt;
  auto m = r.Number(2);
  if (!m) return std::nullopt;
  t.hour = *h;
  t.minute = *m;
  if (r.Take(':')) {
    auto s = r.Number(2);
    if (!s) return std::nullopt;
    t.second = *s;
  }
  r.SkipBlanks();
  auto rest = r.text.substr(r.pos);
  auto isMarker = [&](char first) {
    return rest.size() >= 2 && (rest[0] == first || rest[0] == first + 32) &&
           (rest[1] == 'M' || rest[1] == 'm');
  };
  if (isMarker('A') || isMarker('P')) {
    if (t.hour < 1 || t.hour > 12) return std::nullopt;
    bool pm = rest[0] == 'P' || rest[0] == 'p';
    t.hour = t.hour % 12 + (pm ? 12 : 0);
    r.pos += 2;
  }
  return t;
}

}  // namespace

DateTime DateTime::FromParts(int year, int month, int day, int hour, int minute, int second) {
  if (!ValidParts(year, month, day, hour, minute, second)) {
    throw errors::InvalidProcedureCall("DateTime.FromParts");
  }
  int64_t days = DaysFromCivil(year, static_cast<unsigned>(month), static_cast<unsigned>(day)) -
                 kSerialEpochOffset;
  int64_t ms = days * kMsPerDay + (hour * 3600 + minute * 60 + second) * 1000LL;
  return FromLinearMilliseconds(ms);
}

std::optional<DateTime> DateTime::FromText(std::string_view text) {
  Reader r{text};
  r.SkipBlanks();
  size_t start = r.pos;
  // Try a date first: yyyy-mm-dd or yyyy/mm/dd.
  auto year = r.Number(4);
  if (year && r.pos - start == 4 && (r.Peek('-') || r.Peek('/'))) {
    char sep = r.text[r.pos++];
    auto month = r.Number(2);
    if (!month || !r.Take(sep)) return std::nullopt;
    auto day = r.Number(2);
    if (!day) return std::nullopt;
    TimeOfDay t;
    bool blank = r.Peek(' ') || r.Peek('T');
    r.Take('T');
    r.SkipBlanks();
    if (!r.AtEnd()) {
      if (!blank) return std::nullopt;
      auto time = ReadTime(r);
      if (!time) return std::nullopt;
      t = *time;
    }
    r.SkipBlanks();
    if (!r.AtEnd() || !ValidParts(*year, *month, *day, t.hour, t.minute, t.second)) {
      return std::nullopt;
    }
    return FromParts(*year, *month, *day, t.hour, t.minute, t.second);
  }
  // Otherwise a time alone, on day 0.
  r.pos = start;
  auto time = ReadTime(r);
  r.SkipBlanks();
  if (!time || !r.AtEnd() || !ValidParts(1900, 1, 1, time->hour, time->minute, time->second)) {
    return std::nullopt;
  }
  return DateTime((time->hour * 3600 + time->minute * 60 + time->second) / 86400.0);
}

DateTime::Parts DateTime::Split() const {
  double whole = std::trunc(m_serial);
  double fraction = std::fabs(m_serial - whole);
  int64_t days = static_cast<int64_t>(whole);
  int64_t seconds = std::llround(fraction * 86400.0);
  if (seconds >= 86400) {
    seconds -= 86400;
    days += m_serial < 0 ? -1 : 1;
  }
  return {days, static_cast<int>(seconds)};
}

int64_t DateTime::LinearMilliseconds() const {
  double whole = std::trunc(m_serial);
  double fraction = std::fabs(m_serial - whole);
  return static_cast<int64_t>(whole) * kMsPerDay + std::llround(fraction * kMsPerDay);
}

DateTime DateTime::FromLinearMilliseconds(int64_t ms) {
  int64_t days = ms >= 0 ? ms / kMsPerDay : -((-ms + kMsPerDay - 1) / kMsPerDay);
  int64_t rest = ms - days * kMsPerDay;  // 0 <= rest < day
  double fraction = static_cast<double>(rest) / kMsPerDay;
  if (days >= 0) return DateTime(static_cast<double>(days) + fraction);
  return DateTime(static_cast<double>(days) - fraction);
}

int DateTime::Year() const {
  return static_cast<int>(CivilFromDays(Split().days + kSerialEpochOffset).year);
}
int DateTime::Month() const {
  return static_cast<int>(CivilFromDays(Split().days + kSerialEpochOffset).month);
}
int DateTime::Day() const {
  return static_cast<int>(CivilFromDays(Split().days + kSerialEpochOffset).day);
}
int DateTime::Hour() const {
  return Split().seconds / 3600;
}
int DateTime::Minute() const {
  return Split().seconds / 60 % 60;
}
int DateTime::Second() const {
  return Split().seconds % 60;
}
int DateTime::SecondOfDay() const {
  return Split().seconds;
}

int DateTime::DayOfWeek() const {
  // 1899-12-30 was a Saturday.
  int64_t d = (Split().days + 6) % 7;
  return static_cast<int>(d < 0 ? d + 7 : d);
}

DateTime DateTime::DateOnly() const {
  return DateTime(static_cast<double>(Split().days));
}

DateTime DateTime::AddSeconds(int64_t seconds) const {
  return FromLinearMilliseconds(LinearMilliseconds() + seconds * 1000);
}

int64_t DateTime::SecondsSince(DateTime other) const {
  int64_t diff = LinearMilliseconds() - other.LinearMilliseconds();
  return diff >= 0 ? (diff + 500) / 1000 : -((-diff + 500) / 1000);
}

std::string DateTime::ToText() const {
  Parts p = Split();
  Civil c = CivilFromDays(p.days + kSerialEpochOffset);
  char buffer[48];
  std::snprintf(buffer, sizeof buffer, "%04lld-%02u-%02u %02d:%02d:%02d",
                static_cast<long long>(c.year), c.month, c.day, p.seconds / 3600,
                p.seconds / 60 % 60, p.seconds % 60);
  return buffer;
}

std::string DateTime::TimeText() const {
  int s = Split().seconds;
  char buffer[16];
  std::snprintf(buffer, sizeof buffer, "%02d:%02d:%02d", s / 3600, s / 60 % 60, s % 60);
  return buffer;
}

}  // namespace tav
