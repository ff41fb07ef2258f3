#pragma once
// A calendar date-time in local wall-clock time, held as the platform's
// serial date: days since 1899-12-30 00:00:00 as a double, the time of day as
// the fraction. Schedules compare these numbers directly, so equality and
// order are those of the serial. Daylight-saving changes do not enter: 18:00
// is 18:00 on the day the clocks change.
//
// Dates before 1899-12-30 follow the serial convention too: the whole part
// counts days towards the past and the fraction still moves forward in the
// day (-1.25 is 1899-12-29 06:00). AddSeconds handles that correctly.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tav {

class DateTime {
 public:
  constexpr DateTime() = default;
  constexpr explicit DateTime(double serial) : m_serial(serial) {}

  // Fails with the invalid-argument error (5) for a date or time that does
  // not exist (month 13, 30 February, hour 24).
  static DateTime FromParts(int year, int month, int day, int hour = 0, int minute = 0,
                            int second = 0);
  // The platform's general text-to-date conversion: "yyyy-mm-dd hh:mm:ss",
  // "yyyy-mm-dd hh:mm", a date alone, a time alone ("hh:mm[:ss]", on day 0),
  // "/" as date separator and an optional "AM"/"PM". Nothing for other text.
  static std::optional<DateTime> FromText(std::string_view text);

  constexpr double Serial() const { return m_serial; }

  int Year() const;
  int Month() const;
  int Day() const;
  int Hour() const;
  int Minute() const;
  int Second() const;
  // Sunday is 0, Saturday 6.
  int DayOfWeek() const;
  // Seconds since midnight, 0 to 86399.
  int SecondOfDay() const;

  DateTime DateOnly() const;
  DateTime AddSeconds(int64_t seconds) const;
  DateTime AddDays(int64_t days) const { return AddSeconds(days * 86400); }
  // Whole seconds from `other` to this (positive when this is later).
  int64_t SecondsSince(DateTime other) const;

  // "yyyy-mm-dd hh:mm:ss", 24-hour clock, rounded to the nearest second.
  std::string ToText() const;
  // "hh:mm:ss", 24-hour clock.
  std::string TimeText() const;

  friend constexpr bool operator==(DateTime a, DateTime b) { return a.m_serial == b.m_serial; }
  friend constexpr auto operator<=>(DateTime a, DateTime b) { return a.m_serial <=> b.m_serial; }

 private:
  struct Parts {
    int64_t days;  // days since 1899-12-30
    int seconds;   // 0..86399
  };
  Parts Split() const;
  static DateTime FromLinearMilliseconds(int64_t ms);
  int64_t LinearMilliseconds() const;

  double m_serial = 0.0;
};

}  // namespace tav
