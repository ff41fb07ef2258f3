#pragma once
// Dates and times typed on showctl's command line, read alike by every
// command: "2024-12-24 18:00" (a date and time), "Mon 19:00" or "Sat 11:30 PM"
// (a day and time of the week) and "19:00" (a time alone). A text that is
// none of them fails with CommandFailed naming the option (`what`), before
// any file is touched.

#include <optional>
#include <string>

#include "support/DateTime.h"

namespace tav::showctl {

// The local date and time now, to the second.
DateTime LocalNow();

// "Sunday" ... "Saturday".
std::string WeekdayName(DateTime t);

// A date and time. A time alone is the first such time after `after`, and
// needs a date when no `after` is given.
DateTime DateTimeArgument(const std::string& text, const char* what,
                          std::optional<DateTime> after = std::nullopt);

// A date and time, or a day and time of the week, or a time alone: the
// latter two are the next such moment from `from`, `from` itself included
// unless `strictlyAfter`.
DateTime MomentArgument(const std::string& text, const char* what, DateTime from,
                        bool strictlyAfter = false);

// How fast virtual time runs: "max" (as fast as the machine can: 0), or a
// factor over real time, "60" or "60x" (a minute each second), at least 1.
double SpeedArgument(const std::string& text);

}  // namespace tav::showctl
