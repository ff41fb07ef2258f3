#pragma once
// Reads a week or year schedule file the way the player does, but instead of
// stopping at the first error it goes on and reports everything that is wrong,
// in words a person understands: which show, what is wrong with it, and what
// the player would do about it. Used by showctl's "schedule check".
//
// A problem is something that makes the player refuse the file or play
// something other than what the file seems to say; a note is information.

#include <string>
#include <string_view>
#include <vector>

namespace tav {

struct FileFinding {
  bool IsProblem = false;
  std::string Text;
};

struct FileCheck {
  std::vector<FileFinding> Findings;
  bool HasProblems() const;
};

FileCheck CheckWeekScheduleText(std::string_view text);
FileCheck CheckYearScheduleText(std::string_view text);

// Whether the text looks like a year schedule file (its first record starts
// with a date) rather than a week schedule file.
bool LooksLikeYearSchedule(std::string_view text);

}  // namespace tav
