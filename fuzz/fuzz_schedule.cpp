// The week and year schedule readers on arbitrary text: they may fail only
// with tav::Error. What they read must write back, answer lookups and take
// removals without failing in any other way, and the file check must explain
// any text without failing at all.

#include <cstdlib>

#include "FuzzCommon.h"
#include "schedule/ScheduleFileCheck.h"
#include "schedule/ScheduleLookup.h"

namespace {

// Lookups at a few moments around the turn of a week and a year.
void Lookups(const tav::ScheduleState& state) {
  const tav::DateTime base = tav::DateTime::FromParts(2024, 12, 28, 22, 0, 0);
  for (int64_t hours : {0, 2, 5, 30, 100}) {
    tav::DateTime t = base.AddSeconds(hours * 3600);
    tav::ShowDecision current = tav::CurrentShowEvent(state, t);
    if (!current.Event) std::abort();
    tav::NextShowEvent(state, current.Event, t);
  }
}

void Week(std::string_view input) {
  try {
    auto week = tav::ScheduleFromText(input);
    tav::ScheduleToText(*week);
    tav::ScheduleState state;
    state.Week = week;
    Lookups(state);
    for (auto node = week->FirstNode(); node;) {
      auto next = node->NextNode();
      try {
        week->RemoveShowEvent(node);
      } catch (const tav::Error&) {
      }
      node = next;
    }
  } catch (const tav::Error&) {
  }
}

void Year(std::string_view input) {
  try {
    auto year = tav::YearScheduleFromText(input);
    tav::YearScheduleToText(*year);
    tav::ScheduleState state;
    state.Year = year;
    Lookups(state);
  } catch (const tav::Error&) {
  }
}

}  // namespace

TAV_FUZZ_TARGET({
  Week(input);
  Year(input);
  try {
    tav::CheckWeekScheduleText(input);
    tav::CheckYearScheduleText(input);
    tav::LooksLikeYearSchedule(input);
  } catch (const tav::Error&) {
    std::abort();  // the check explains bad files; it must not fail on them
  }
})
