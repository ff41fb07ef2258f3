#pragma once
// showctl schedule check: explains what is wrong with a week schedule, a
// year schedule or a show file, and checks every show file the schedules
// name the way the player will read it when the show is due. Without a
// file it checks the usual week and year schedules of the user data folder.

#include <optional>
#include <string>

namespace tav::showctl {

// Where the player looks for a show file a schedule names: an absolute path
// as it stands, any other name in the user data folder.
std::string ShowFilePath(const std::string& name);

// Why the player could not run a show file (missing, unreadable or not a
// show file it reads), or nothing when it can.
std::optional<std::string> ShowFileProblem(const std::string& name);

struct CheckRequest {
  std::string file;  // empty: the week and year schedules below
  std::string kind = "auto";
  std::string weekPath;
  std::string yearPath;
};

// Prints the findings; throws CommandFailed naming the number of problems.
void CheckFiles(const CheckRequest& request);

}  // namespace tav::showctl
