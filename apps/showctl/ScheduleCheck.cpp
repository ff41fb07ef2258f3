#include "ScheduleCheck.h"

#include <fmt/format.h>

#include <algorithm>
#include <filesystem>
#include <iostream>
#include <set>
#include <vector>

#include "CommandRegistry.h"
#include "UserData.h"
#include "platform/LocalTextFiles.h"
#include "schedule/Schedule.h"
#include "schedule/ScheduleFileCheck.h"
#include "schedule/YearSchedule.h"
#include "support/Error.h"
#include "support/Serialize.h"

#if __has_include("show/ShowFunctions.h")
#include "show/ShowFunctions.h"
#define TAV_SHOWCTL_HAS_SHOW_FILES 1
#endif

namespace tav::showctl {
namespace {

namespace fs = std::filesystem;

// Which kind of file to check: by the player's own file names, else by the
// content. A week schedule's records have a file reference list as their
// third field, a year schedule's start with a date; a show file's first
// field is a playlist, whose third field is a number.
std::string KindOf(const std::string& path, const std::string& text) {
  std::string name = fs::path(path).filename().string();
  if (name == "weeksched.tsc") return "week";
  if (name == "yearsched.tsc") return "year";
  if (text.find('(') == std::string::npos) return "week";
  if (LooksLikeYearSchedule(text)) return "year";
  try {
    TextArray records = ListFromText(text, 1);
    if (ArrayCount(records) >= 1) {
      TextArray first = ListFromText(records[1], 1);
      if (ArrayCount(first) >= 3 && first[3].find('(') != std::string::npos) return "week";
      return "show";
    }
  } catch (const tav::Error&) {
  }
  return fs::path(path).extension() == ".tsc" ? "week" : "show";
}

// What the player makes of a show file's text: a summary, or the problem.
std::string DescribeShow(const std::string& text, bool& problem) {
#ifdef TAV_SHOWCTL_HAS_SHOW_FILES
  try {
    auto show = ShowFromText(text);
    if (!show) {
      problem = true;
      return "one of its playlists cannot be read; the player cannot run this show";
    }
    problem = false;
    return fmt::format("{} startup, {} main, {} musical, {} background and {} shutdown sequence(s)",
                       show->Startup()->Count(), show->Main()->Count(), show->Musical()->Count(),
                       show->Background()->Count(), show->Shutdown()->Count());
  } catch (const tav::Error& e) {
    problem = true;
    return "the show file is not a well-formed list (" + e.Description() + ")";
  }
#else
  (void)text;
  (void)problem;
  throw CommandFailed("this showctl was built without show files; it can check schedules only");
#endif
}

int CountProblems(const FileCheck& check) {
  return static_cast<int>(std::count_if(check.Findings.begin(), check.Findings.end(),
                                        [](const auto& f) { return f.IsProblem; }));
}

void PrintFindings(const FileCheck& check) {
  for (const auto& finding : check.Findings) {
    std::cout << (finding.IsProblem ? "  problem: " : "  ") << finding.Text << "\n";
  }
}

void AddShowNames(const Schedule& schedule, std::vector<std::string>& names) {
  for (auto node = schedule.FirstNode(); node; node = node->NextNode()) {
    const ShowEvent& event = *node->Obj();
    if (event.EventType() != kEventTypeShow) continue;
    if (std::find(names.begin(), names.end(), event.Filename()) == names.end()) {
      names.push_back(event.Filename());
    }
  }
}

// Checks one schedule's text and collects the show files it names, as the
// player would load it (a schedule the player refuses names none).
int CheckSchedule(const std::string& kind, const std::string& text,
                  std::vector<std::string>& shows) {
  FileCheck check = kind == "year" ? CheckYearScheduleText(text) : CheckWeekScheduleText(text);
  PrintFindings(check);
  try {
    if (kind == "year") {
      auto year = YearScheduleFromText(text);
      for (const auto& key : year->Keys()) AddShowNames(*year->ScheduleByKey(key), shows);
    } else {
      AddShowNames(*ScheduleFromText(text), shows);
    }
  } catch (const tav::Error&) {
    // Already among the findings.
  }
  return CountProblems(check);
}

int CheckShowFiles(const std::vector<std::string>& names) {
  if (names.empty()) return 0;
  std::cout << "Show files the schedules name:\n";
  int problems = 0;
  for (const auto& name : names) {
    auto problem = ShowFileProblem(name);
    if (problem) {
      ++problems;
      std::cout << fmt::format("  problem: \"{}\" {}\n", name, *problem);
    } else {
      std::cout << fmt::format("  \"{}\" ({}): OK\n", name, ShowFilePath(name));
    }
  }
  return problems;
}

std::optional<std::string> ReadOrFail(const std::string& path) {
  LocalTextFiles files;
  try {
    return files.ReadText(path);
  } catch (const tav::Error& e) {
    throw CommandFailed(fmt::format("cannot read {}: {}", path, e.Description()));
  }
}

}  // namespace

std::string ShowFilePath(const std::string& name) {
  return fs::path(name).is_absolute() ? name : UserDataFolder() + name;
}

std::optional<std::string> ShowFileProblem(const std::string& name) {
  std::string path = ShowFilePath(name);
  std::optional<std::string> text;
  try {
    text = LocalTextFiles().ReadText(path);
  } catch (const tav::Error& e) {
    return fmt::format("cannot be read ({}): {}", path, e.Description());
  }
  if (!text) return fmt::format("does not exist (looked for at {})", path);
  bool problem = false;
  std::string description = DescribeShow(*text, problem);
  if (problem) return fmt::format("cannot be run ({}): {}", path, description);
  return std::nullopt;
}

void CheckFiles(const CheckRequest& r) {
  int problems = 0;
  std::vector<std::string> shows;
  if (!r.file.empty()) {
    std::optional<std::string> text = ReadOrFail(r.file);
    if (!text) throw CommandFailed(fmt::format("there is no file {}", r.file));
    std::string kind = r.kind == "auto" ? KindOf(r.file, *text) : r.kind;
    if (kind == "show") {
      std::cout << r.file << " (show file):\n";
      bool problem = false;
      std::string description = DescribeShow(*text, problem);
      std::cout << (problem ? "  problem: " : "  ") << description << "\n";
      problems += problem;
    } else {
      std::cout << r.file << (kind == "year" ? " (year schedule):\n" : " (week schedule):\n");
      problems += CheckSchedule(kind, *text, shows);
    }
  } else {
    for (const auto& [kind, path] : {std::pair<std::string, std::string>{"week", r.weekPath},
                                     std::pair<std::string, std::string>{"year", r.yearPath}}) {
      std::optional<std::string> text = ReadOrFail(path);
      std::cout << path << " (" << kind << " schedule):\n";
      if (!text) {
        std::cout << "  none: the player runs no " << (kind == "week" ? "weekly" : "dated")
                  << " shows\n";
        continue;
      }
      problems += CheckSchedule(kind, *text, shows);
    }
  }
  problems += CheckShowFiles(shows);
  std::string what = r.file.empty() ? "the schedules and their show files" : r.file;
  if (problems > 0) throw CommandFailed(fmt::format("{} problem(s) in {}", problems, what));
  std::cout << "OK\n";
}

}  // namespace tav::showctl
