#pragma once
// Week times as people type them, for tools that edit schedules: a day name
// and a time of day, "Mon 18:00", "monday 6:30 PM", "Sat 23:59:59". The
// schedule files never hold this form; they hold the decimal TimeVal.

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "schedule/WeekTime.h"

namespace tav {

// The day is a name or its first three letters, in any letter case; the time
// is H[:MM[:SS]] on the 24-hour clock, or 1..12 followed by AM or PM. Nothing
// for any other text (no clamping: "25:00" is refused, not read as 23:00).
std::optional<std::shared_ptr<WeekTime>> WeekTimeFromInput(std::string_view text);

// "Mon 18:00:00", the form the tools print.
std::string WeekTimeToDisplay(const WeekTime& time);

}  // namespace tav
