#include "schedule/ScheduleFileCheck.h"

#include <algorithm>
#include <memory>
#include <set>

#include "schedule/Schedule.h"
#include "schedule/WeekTimeInput.h"
#include "schedule/YearSchedule.h"
#include "support/Error.h"
#include "support/Numbers.h"
#include "support/Serialize.h"

namespace tav {
namespace {

constexpr const char* kDayNames[] = {"Sunday",   "Monday", "Tuesday", "Wednesday",
                                     "Thursday", "Friday", "Saturday"};

std::string Quoted(const std::string& text) {
  return "\"" + text + "\"";
}

// What a record reader's error means for the person who wrote the file.
std::string Explain(const Error& e) {
  if (e.Source() == "Serialize.ListFromText") {
    return "is not a well-formed list (" + e.Description() + ")";
  }
  switch (e.Number()) {
    case errors::kSubscriptOutOfRange:
      return "has too few fields";
    case errors::kTypeMismatch:
      return "holds text where a number or a date belongs";
    case errors::kOverflow:
      return "holds a number far outside the week";
    default:
      return "cannot be read (" + e.Description() + ")";
  }
}

std::string SpanText(const ShowEvent& event) {
  return WeekTimeToDisplay(*event.StartTime()) + " to " + WeekTimeToDisplay(*event.EndTime());
}

std::string Label(const std::string& prefix, int32_t index, const ShowEvent* event) {
  std::string label = prefix + "show " + std::to_string(index);
  if (event) label += " (" + Quoted(event->Filename()) + ", " + SpanText(*event) + ")";
  return label;
}

bool Overlap(const ShowEvent& a, const ShowEvent& b) {
  return a.StartTime()->InRange(*b.StartTime(), *b.EndTime()) ||
         b.StartTime()->InRange(*a.StartTime(), *a.EndTime());
}

void Add(FileCheck& check, bool problem, std::string text) {
  check.Findings.push_back({problem, std::move(text)});
}

// A raw week time field outside 0..604799 is read, but not as written.
void CheckRawTime(FileCheck& check, const std::string& label, const char* which,
                  std::string_view field) {
  double value = LeadingNumber(UnescapeText(field));
  if (value < 0 || value >= kSecondsPerWeek) {
    Add(check, true,
        label + ": its " + which + " time " + UnescapeText(field) +
            " is not a second of the week (0 to 604799)");
  }
}

// Checks the show records of one week schedule text and returns the schedule
// the player would build from the records it accepts.
std::shared_ptr<Schedule> CheckShows(FileCheck& check, std::string_view text,
                                     const std::string& prefix, int32_t& shows) {
  auto schedule = std::make_shared<Schedule>();
  TextArray records;
  try {
    records = ListFromText(text, 1);
  } catch (const Error& e) {
    Add(check, true, prefix + "the show list " + Explain(e));
    return schedule;
  }
  std::vector<std::shared_ptr<ShowEvent>> accepted;
  bool stopped = false;
  for (int32_t i = 1; i <= ArrayCount(records); ++i) {
    std::shared_ptr<ShowEvent> event;
    try {
      event = ShowEventFromText(records[i]);
    } catch (const Error& e) {
      Add(check, true, Label(prefix, i, nullptr) + " " + Explain(e));
      stopped = true;
      continue;
    }
    std::string label = Label(prefix, i, event.get());
    TextArray fields = ListFromText(records[i], 1);
    CheckRawTime(check, label, "end", fields[1]);
    CheckRawTime(check, label, "start", fields[4]);
    if (event->EventType() != kEventTypeShow) {
      Add(check, true, label + " has no show file name; the player reads it as a pause");
    }
    if (event->StartTime()->Equals(*event->EndTime())) {
      Add(check, true,
          label + " starts and ends at the same time, which the player takes for the whole week");
    }
    try {
      schedule->AddShowEvent(event);
      accepted.push_back(event);
      ++shows;
    } catch (const Error& e) {
      stopped = true;
      auto other = std::find_if(accepted.begin(), accepted.end(),
                                [&](const auto& a) { return Overlap(*a, *event); });
      if (other != accepted.end()) {
        Add(check, true,
            label + " overlaps " + Quoted((*other)->Filename()) + " (" + SpanText(**other) + ")");
      } else {
        Add(check, true, label + " cannot be placed in the week (" + e.Description() + ")");
      }
    }
  }
  if (stopped) {
    Add(check, false,
        prefix +
            "the player stops reading the file at the first of these problems and keeps "
            "none of it");
  }
  return schedule;
}

}  // namespace

bool FileCheck::HasProblems() const {
  return std::any_of(Findings.begin(), Findings.end(),
                     [](const FileFinding& f) { return f.IsProblem; });
}

bool LooksLikeYearSchedule(std::string_view text) {
  try {
    TextArray records = ListFromText(text, 1);
    if (ArrayCount(records) == 0) return false;
    TextArray first = ListFromText(records[1], 1);
    return ArrayCount(first) >= 1 && DateTime::FromText(UnescapeText(first[1])).has_value();
  } catch (const Error&) {
    return false;
  }
}

FileCheck CheckWeekScheduleText(std::string_view text) {
  FileCheck check;
  int32_t shows = 0;
  bool hasList = text.find('(') != std::string_view::npos;
  if (!hasList && text.find_first_not_of(" \t\r\n") != std::string_view::npos) {
    Add(check, true, "the file holds no list of shows");
    return check;
  }
  CheckShows(check, text, "", shows);
  if (!check.HasProblems()) {
    Add(check, false,
        shows == 0 ? "no weekly shows" : std::to_string(shows) + " weekly show(s), no overlaps");
  }
  return check;
}

FileCheck CheckYearScheduleText(std::string_view text) {
  FileCheck check;
  TextArray days;
  try {
    days = ListFromText(text, 1);
  } catch (const Error& e) {
    Add(check, true, "the file " + Explain(e));
    return check;
  }
  if (ArrayCount(days) == 0 && text.find_first_not_of(" \t\r\n") != std::string_view::npos) {
    Add(check, true, "the file holds no list of dates");
    return check;
  }

  struct Dated {
    DateTime start, end;
    std::string label;
  };
  std::vector<Dated> occurrences;
  std::set<std::string> keys;
  int32_t shows = 0;
  for (int32_t i = 1; i <= ArrayCount(days); ++i) {
    std::string where = "date record " + std::to_string(i);
    TextArray record;
    DateTime date;
    try {
      record = ListFromText(days[i], 1);
      date = DateFromText(record[1]);
      (void)record[2];
    } catch (const Error& e) {
      Add(check, true, where + " " + Explain(e) + "; the player refuses the file");
      continue;
    }
    std::string key = YearSchedule::DateToString(date);
    if (!keys.insert(key).second) {
      Add(check, true, "the date " + key + " appears twice; the player refuses the file");
    }
    auto schedule = CheckShows(check, record[2], key + ", ", shows);
    for (auto node = schedule->FirstNode(); node; node = node->NextNode()) {
      const ShowEvent& show = *node->Obj();
      if (show.EventType() != kEventTypeShow) continue;
      std::string label = key + " " + Quoted(show.Filename());
      int32_t weekday = ((show.StartTime()->Day() % 7) + 7) % 7;
      auto range = show.Range(date);
      if (weekday != date.DayOfWeek()) {
        Add(check, true,
            label + " starts on a " + kDayNames[weekday] + ", but " + key + " is a " +
                kDayNames[date.DayOfWeek()] +
                (range->HasStart() ? "; it would play on " + range->StartTime().ToText() : ""));
      }
      if (range->HasStart() && range->HasEnd()) {
        occurrences.push_back({range->StartTime(), range->EndTime(), label});
      }
    }
  }
  // Dates are checked against each other only when shows are added, not when
  // the file is read, so a hand-made file may hold shows that overlap.
  std::sort(occurrences.begin(), occurrences.end(),
            [](const Dated& a, const Dated& b) { return a.start < b.start; });
  for (size_t i = 1; i < occurrences.size(); ++i) {
    if (occurrences[i].start < occurrences[i - 1].end) {
      Add(check, true,
          occurrences[i].label + " (from " + occurrences[i].start.ToText() + ") overlaps " +
              occurrences[i - 1].label + " (until " + occurrences[i - 1].end.ToText() + ")");
    }
  }
  if (!check.HasProblems()) {
    Add(check, false,
        std::to_string(shows) + " dated show(s) on " + std::to_string(keys.size()) +
            " date(s), no overlaps");
  }
  return check;
}

}  // namespace tav
