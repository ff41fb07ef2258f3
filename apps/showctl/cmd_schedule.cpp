// showctl schedule: make and read the week and year schedules without the
// suite's schedule editor, check schedule and show files, and ask which show
// the player would run at a given time.
//
// The files are found as the player finds them, in the user data folder (the
// UserDataPath setting, else $XDG_DATA_HOME/tessavar/, else
// ~/.local/share/tessavar/): "weeksched.tsc" and "yearsched.tsc"; --week and
// --year name others.
// Every change is saved through the schedule library's file store, which
// writes a temporary file and renames it, and only after the whole change
// has succeeded: a failed command never leaves a damaged file.

#include <fmt/format.h>

#include "UserData.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <optional>
#include <string>
#include <vector>

#include "CommandRegistry.h"
#include "ScheduleCheck.h"
#include "TimeArguments.h"
#include "platform/LocalTextFiles.h"
#include "schedule/Schedule.h"
#include "schedule/ScheduleFileCheck.h"
#include "schedule/ScheduleLookup.h"
#include "schedule/WeekTimeInput.h"
#include "schedule/YearSchedule.h"
#include "support/Error.h"
#include "support/Serialize.h"

namespace tav::showctl {
namespace {

namespace fs = std::filesystem;

struct ScheduleOptions {
  std::string week;
  std::string year;
  std::string file;
  std::string from;
  std::string to;
  std::string at;
  std::string kind = "auto";
  bool onDemandOnly = false;
};

std::string WeekPath(const ScheduleOptions& o) {
  return o.week.empty() ? UserDataFolder() + "weeksched.tsc" : o.week;
}
std::string YearPath(const ScheduleOptions& o) {
  return o.year.empty() ? UserDataFolder() + "yearsched.tsc" : o.year;
}

// The first problem the check finds, to say why a file cannot be read.
std::string FirstProblem(const FileCheck& check, const tav::Error& e) {
  for (const auto& finding : check.Findings) {
    if (finding.IsProblem) return finding.Text;
  }
  return e.Description();
}

std::shared_ptr<Schedule> ReadWeek(const std::string& path, TextFileStore& files) {
  try {
    return LoadWeekSchedule(path, files);
  } catch (const tav::Error& e) {
    std::optional<std::string> text;
    try {
      text = files.ReadText(path);
    } catch (const tav::Error&) {
    }
    std::string why = text ? FirstProblem(CheckWeekScheduleText(*text), e) : e.Description();
    throw CommandFailed(fmt::format(
        "cannot read the week schedule {}: {}\n(showctl schedule check {} lists every problem)",
        path, why, path));
  }
}

std::shared_ptr<YearSchedule> ReadYear(const std::string& path, TextFileStore& files) {
  try {
    return LoadYearSchedule(path, files);
  } catch (const tav::Error& e) {
    std::optional<std::string> text;
    try {
      text = files.ReadText(path);
    } catch (const tav::Error&) {
    }
    std::string why = text ? FirstProblem(CheckYearScheduleText(*text), e) : e.Description();
    throw CommandFailed(fmt::format(
        "cannot read the year schedule {}: {}\n(showctl schedule check {} lists every problem)",
        path, why, path));
  }
}

void PrepareFolder(const std::string& path) {
  fs::path folder = fs::path(path).parent_path();
  if (folder.empty()) return;
  std::error_code error;
  fs::create_directories(folder, error);
  if (error) {
    throw CommandFailed(
        fmt::format("cannot create the folder {}: {}", folder.string(), error.message()));
  }
}

void Saved(bool ok, const std::string& path) {
  if (!ok) {
    throw CommandFailed(fmt::format(
        "could not write {} (is its folder writable?); the previous file is unchanged", path));
  }
}

std::shared_ptr<WeekTime> WeekTimeArgument(const std::string& text, const char* what) {
  auto time = WeekTimeFromInput(text);
  if (!time) {
    throw CommandFailed(
        fmt::format("the {} time \"{}\" is not a day and a time of day such as \"Mon 18:00\" or "
                    "\"Sat 11:30 PM\"",
                    what, text));
  }
  return *time;
}

// The weekly show that holds the week time, or nothing.
std::shared_ptr<Node> WeeklyShowAt(const Schedule& week, const WeekTime& time) {
  auto node = week.GetNodeByTime(time);
  return node && node->Obj()->EventType() == kEventTypeShow ? node : nullptr;
}

struct DatedShow {
  DateTime date;
  std::shared_ptr<Node> node;
  std::shared_ptr<TimeRange> range;
};

std::vector<DatedShow> DatedShows(const YearSchedule& year) {
  std::vector<DatedShow> shows;
  for (const std::string& key : year.Keys()) {
    DateTime date = YearSchedule::DateStringToDate(key);
    for (auto node = year.ScheduleByKey(key)->FirstNode(); node; node = node->NextNode()) {
      if (node->Obj()->EventType() == kEventTypeShow) {
        shows.push_back({date, node, node->Obj()->Range(date)});
      }
    }
  }
  // Shows without a start (a malformed file's whole-week entries) go last.
  std::stable_sort(shows.begin(), shows.end(), [](const DatedShow& a, const DatedShow& b) {
    if (!a.range->HasStart()) return false;
    if (!b.range->HasStart()) return true;
    return a.range->StartTime() < b.range->StartTime();
  });
  return shows;
}

void List(const ScheduleOptions& o) {
  LocalTextFiles files;
  std::string weekPath = WeekPath(o), yearPath = YearPath(o);
  auto week = ReadWeek(weekPath, files);
  auto year = ReadYear(yearPath, files);

  std::cout << "Weekly shows (" << weekPath << "):\n";
  std::vector<std::shared_ptr<ShowEvent>> weekly;
  for (auto node = week->FirstNode(); node; node = node->NextNode()) {
    if (node->Obj()->EventType() == kEventTypeShow) weekly.push_back(node->Obj());
  }
  std::sort(weekly.begin(), weekly.end(), [](const auto& a, const auto& b) {
    return a->StartTime()->TimeVal() < b->StartTime()->TimeVal();
  });
  if (weekly.empty()) {
    std::cout << "  none\n";
  } else {
    std::cout << fmt::format("  {:<14} {:<14} {}\n", "From", "To", "Show");
    for (const auto& show : weekly) {
      std::cout << fmt::format("  {:<14} {:<14} {}\n", WeekTimeToDisplay(*show->StartTime()),
                               WeekTimeToDisplay(*show->EndTime()), show->Filename());
    }
  }

  std::cout << "\nDated shows (" << yearPath << "):\n";
  auto dated = DatedShows(*year);
  if (dated.empty()) {
    std::cout << "  none\n";
    return;
  }
  std::cout << fmt::format("  {:<20} {:<20} {}\n", "From", "To", "Show");
  for (const auto& show : dated) {
    const TimeRange& r = *show.range;
    std::cout << fmt::format("  {:<20} {:<20} {}\n",
                             r.HasStart() ? r.StartTime().ToText() : "(all week)",
                             r.HasEnd() ? r.EndTime().ToText() : "", show.node->Obj()->Filename());
  }
}

// The show file may come later, so a missing one is added all the same.
void WarnAboutShowFile(const std::string& name) {
  if (auto problem = ShowFileProblem(name)) {
    std::cerr << fmt::format("showctl: warning: the show file \"{}\" {}; added all the same\n",
                             name, *problem);
  }
}

void AddWeekly(const ScheduleOptions& o) {
  auto start = WeekTimeArgument(o.from, "start");
  auto end = WeekTimeArgument(o.to, "end");
  if (start->Equals(*end)) {
    throw CommandFailed("a weekly show must end at another time than it starts");
  }
  if (o.file.empty()) throw CommandFailed("the show file name must not be empty");
  LocalTextFiles files;
  std::string path = WeekPath(o);
  auto week = ReadWeek(path, files);
  auto show = NewShowEvent(o.file, start, end);
  try {
    week->AddShowEvent(show);
  } catch (const tav::Error& e) {
    std::string with;
    for (auto node = week->FirstNode(); node; node = node->NextNode()) {
      const ShowEvent& other = *node->Obj();
      if (other.EventType() == kEventTypeShow &&
          (other.StartTime()->InRange(*start, *end) ||
           start->InRange(*other.StartTime(), *other.EndTime()))) {
        with =
            fmt::format(" \"{}\" ({} to {}) is in the way", other.Filename(),
                        WeekTimeToDisplay(*other.StartTime()), WeekTimeToDisplay(*other.EndTime()));
        break;
      }
    }
    throw CommandFailed(fmt::format("cannot add \"{}\" from {} to {}: {}{}", o.file,
                                    WeekTimeToDisplay(*start), WeekTimeToDisplay(*end),
                                    e.Description(), with.empty() ? "" : ";" + with));
  }
  PrepareFolder(path);
  Saved(week->Save(path, files), path);
  std::cout << fmt::format("Added weekly show \"{}\" from {} to {} to {}\n", o.file,
                           WeekTimeToDisplay(*start), WeekTimeToDisplay(*end), path);
  WarnAboutShowFile(o.file);
}

void AddDated(const ScheduleOptions& o) {
  DateTime start = DateTimeArgument(o.from, "start");
  DateTime end = DateTimeArgument(o.to, "end", start);
  if (o.file.empty()) throw CommandFailed("the show file name must not be empty");
  if (start < end && WeekTimeFromDate(start)->Equals(*WeekTimeFromDate(end))) {
    // Stored as week times of the start date, such a show would fill the week
    // and never play.
    throw CommandFailed("a dated show must not end at the same time of day it started");
  }
  LocalTextFiles files;
  std::string path = YearPath(o);
  auto year = ReadYear(path, files);
  try {
    year->AddShowEventByFile(o.file, start, end);
  } catch (const tav::Error& e) {
    throw CommandFailed(fmt::format("cannot add \"{}\" from {} to {}: {}", o.file, start.ToText(),
                                    end.ToText(), e.Description()));
  }
  PrepareFolder(path);
  Saved(year->Save(path, files), path);
  std::cout << fmt::format("Added dated show \"{}\" from {} to {} to {}\n", o.file, start.ToText(),
                           end.ToText(), path);
  WarnAboutShowFile(o.file);
}

void RemoveWeekly(const ScheduleOptions& o) {
  auto at = WeekTimeArgument(o.at, "show's");
  LocalTextFiles files;
  std::string path = WeekPath(o);
  auto week = ReadWeek(path, files);
  auto node = WeeklyShowAt(*week, *at);
  if (!node) {
    throw CommandFailed(
        fmt::format("no weekly show runs at {} in {}", WeekTimeToDisplay(*at), path));
  }
  std::string removed = fmt::format("\"{}\" from {} to {}", node->Obj()->Filename(),
                                    WeekTimeToDisplay(*node->Obj()->StartTime()),
                                    WeekTimeToDisplay(*node->Obj()->EndTime()));
  week->RemoveShowEvent(node);
  Saved(week->Save(path, files), path);
  std::cout << "Removed weekly show " << removed << " from " << path << "\n";
}

void RemoveDated(const ScheduleOptions& o) {
  DateTime at = DateTimeArgument(o.at, "show's");
  LocalTextFiles files;
  std::string path = YearPath(o);
  auto year = ReadYear(path, files);
  for (const auto& show : DatedShows(*year)) {
    if (!show.range->HasStart() || !show.range->Includes(at, true, false)) continue;
    std::string removed =
        fmt::format("\"{}\" from {} to {}", show.node->Obj()->Filename(),
                    show.range->StartTime().ToText(), show.range->EndTime().ToText());
    year->RemoveShowEvent(show.date, show.node);
    Saved(year->Save(path, files), path);
    std::cout << "Removed dated show " << removed << " from " << path << "\n";
    return;
  }
  throw CommandFailed(fmt::format("no dated show runs at {} in {}", at.ToText(), path));
}

void Check(const ScheduleOptions& o) {
  CheckFiles({o.file, o.kind, WeekPath(o), YearPath(o)});
}

void PrintDecision(const char* label, const ShowDecision& d) {
  if (!d.Event || d.Event->Filename().empty()) {
    std::cout << fmt::format("  {:<8} no show\n", label);
  } else {
    const TimeRange& r = *d.Event->Range();
    std::string span = r.HasStart() || r.HasEnd()
                           ? fmt::format(", {} to {}", r.HasStart() ? r.StartTime().ToText() : "…",
                                         r.HasEnd() ? r.EndTime().ToText() : "…")
                           : ", all week";
    std::cout << fmt::format("  {:<8} \"{}\" from the {}{}\n", label, d.Event->Filename(),
                             ShowSourceName(d.Source), span);
  }
  std::cout << fmt::format("  {:<8} because {}\n", "", d.Reason);
}

void At(const ScheduleOptions& o) {
  DateTime now = LocalNow();
  DateTime t = o.at.empty() ? now : MomentArgument(o.at, "asked", now);
  LocalTextFiles files;
  ScheduleState state;
  state.Week = ReadWeek(WeekPath(o), files);
  state.Year = ReadYear(YearPath(o), files);
  state.OnDemandOnly = o.onDemandOnly;
  ShowDecision current = CurrentShowEvent(state, t);
  ShowDecision next = NextShowEvent(state, current.Event, t);
  std::cout << "At " << WeekdayName(t) << " " << t.ToText() << ":\n";
  PrintDecision("current", current);
  PrintDecision("next", next);
}

void Register(CLI::App& app) {
  auto o = std::make_shared<ScheduleOptions>();
  auto* schedule = app.add_subcommand(
      "schedule",
      "Make and read the week and year schedules, check schedule and show files\n"
      "(files: weeksched.tsc and yearsched.tsc in the UserDataPath setting's folder,\n"
      "else $XDG_DATA_HOME/tessavar/, else ~/.local/share/tessavar/)");
  schedule->require_subcommand(1);
  // Every command takes both files, so scripts can pass the same options to all.
  auto fileOptions = [o](CLI::App* command) {
    command->add_option("--week", o->week, "Week schedule file to use instead of the usual one");
    command->add_option("--year", o->year, "Year schedule file to use instead of the usual one");
  };

  auto* list = schedule->add_subcommand("list", "List the weekly and the dated shows");
  fileOptions(list);
  list->callback([o] { List(*o); });

  auto* add = schedule->add_subcommand("add", "Add a weekly or a dated show");
  add->require_subcommand(1);
  auto* addWeekly = add->add_subcommand("weekly", "Add a show that runs every week");
  addWeekly->add_option("show", o->file, "Show file")->required();
  addWeekly->add_option("from", o->from, "Start, a day and a time: \"Mon 18:00\"")->required();
  addWeekly->add_option("to", o->to, "End (not included): \"Mon 22:00\", \"Sun 01:00\"")
      ->required();
  fileOptions(addWeekly);
  addWeekly->callback([o] { AddWeekly(*o); });
  auto* addDated = add->add_subcommand("dated", "Add a show on one date");
  addDated->add_option("show", o->file, "Show file")->required();
  addDated->add_option("from", o->from, "Start: \"2024-12-24 18:00\"")->required();
  addDated
      ->add_option("to", o->to,
                   "End (not included): \"2024-12-24 22:00\", or a time alone (\"01:00\": "
                   "the next such time after the start)")
      ->required();
  fileOptions(addDated);
  addDated->callback([o] { AddDated(*o); });

  auto* remove = schedule->add_subcommand("remove", "Remove a weekly or a dated show");
  remove->require_subcommand(1);
  auto* removeWeekly = remove->add_subcommand("weekly", "Remove the weekly show running at a time");
  removeWeekly->add_option("at", o->at, "A time within the show: \"Mon 18:00\"")->required();
  fileOptions(removeWeekly);
  removeWeekly->callback([o] { RemoveWeekly(*o); });
  auto* removeDated = remove->add_subcommand("dated", "Remove the dated show running at a time");
  removeDated->add_option("at", o->at, "A time within the show: \"2024-12-24 18:00\"")->required();
  fileOptions(removeDated);
  removeDated->callback([o] { RemoveDated(*o); });

  auto* check = schedule->add_subcommand(
      "check",
      "Check a week schedule, year schedule or show file and explain what is wrong, and check "
      "every show file a schedule names; without a file, the usual week and year schedules");
  check->add_option("file", o->file, "File to check (default: the week and year schedules)");
  check->add_option("--as", o->kind, "What the file is (default: tell by its name and content)")
      ->check(CLI::IsMember({"auto", "week", "year", "show"}));
  fileOptions(check);
  check->callback([o] { Check(*o); });

  auto* at = schedule->add_subcommand(
      "at", "Which show the player would run at a time, which comes next, and why");
  at->add_option("time", o->at,
                 "Date and time, \"2024-12-24 19:00\", or a day and time, \"Mon 19:00\", or a "
                 "time, \"19:00\" (the next such moment); default: now");
  at->add_flag("--on-demand-only", o->onDemandOnly,
               "As the player started with /noschedule: the schedules do not count");
  fileOptions(at);
  at->callback([o] { At(*o); });
}

}  // namespace

static CommandGroup reg{"schedule", Register};

}  // namespace tav::showctl
