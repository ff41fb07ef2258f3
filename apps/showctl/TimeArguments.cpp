#include "TimeArguments.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <ctime>
#include <exception>

#include "CommandRegistry.h"
#include "schedule/WeekTime.h"
#include "schedule/WeekTimeInput.h"

namespace tav::showctl {

DateTime LocalNow() {
  std::time_t now = std::time(nullptr);
  std::tm local{};
  localtime_r(&now, &local);
  return DateTime::FromParts(local.tm_year + 1900, local.tm_mon + 1, local.tm_mday, local.tm_hour,
                             local.tm_min, std::min(local.tm_sec, 59));
}

std::string WeekdayName(DateTime t) {
  static const char* const kNames[] = {"Sunday",   "Monday", "Tuesday", "Wednesday",
                                       "Thursday", "Friday", "Saturday"};
  return kNames[t.DayOfWeek()];
}

DateTime DateTimeArgument(const std::string& text, const char* what,
                          std::optional<DateTime> after) {
  std::optional<DateTime> value = DateTime::FromText(text);
  if (!value) {
    throw CommandFailed(fmt::format(
        "the {} time \"{}\" is not a date and time such as \"2024-12-24 18:00\"", what, text));
  }
  bool timeAlone = value->Serial() >= 0 && value->Serial() < 1;
  if (timeAlone) {
    if (!after) {
      throw CommandFailed(
          fmt::format("the {} time \"{}\" needs a date, such as \"2024-12-24 18:00\"", what, text));
    }
    DateTime onDay = after->DateOnly().AddSeconds(value->SecondOfDay());
    return onDay > *after ? onDay : onDay.AddDays(1);
  }
  return *value;
}

DateTime MomentArgument(const std::string& text, const char* what, DateTime from,
                        bool strictlyAfter) {
  // The first moment that may be the answer.
  const DateTime earliest = strictlyAfter ? from.AddSeconds(1) : from;
  if (auto weekly = WeekTimeFromInput(text)) {
    int64_t ahead =
        ((*weekly)->TimeVal() - WeekTimeFromDate(earliest)->TimeVal() + kSecondsPerWeek) %
        kSecondsPerWeek;
    return earliest.AddSeconds(ahead);
  }
  if (!DateTime::FromText(text)) {
    throw CommandFailed(
        fmt::format("the {} time \"{}\" is neither a date and time such as \"2024-12-24 18:00\" "
                    "nor a day and time such as \"Mon 19:00\" nor a time such as \"19:00\"",
                    what, text));
  }
  return DateTimeArgument(text, what, earliest.AddSeconds(-1));
}

double SpeedArgument(const std::string& text) {
  if (text == "max") return 0;
  std::string number = text;
  if (!number.empty() && (number.back() == 'x' || number.back() == 'X')) number.pop_back();
  double factor = 0;
  size_t used = 0;
  try {
    factor = std::stod(number, &used);
  } catch (const std::exception&) {
    used = 0;
  }
  if (number.empty() || used != number.size() || !std::isfinite(factor) || factor < 1) {
    throw CommandFailed(fmt::format(
        "the speed \"{}\" is neither \"max\" nor a factor of at least 1 such as \"60\"", text));
  }
  return factor;
}

}  // namespace tav::showctl
