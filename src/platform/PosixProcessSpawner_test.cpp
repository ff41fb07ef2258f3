#include "platform/PosixProcessSpawner.h"

#include <gtest/gtest.h>

#include <chrono>
#include <fstream>
#include <optional>
#include <thread>

#include "support/Error.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

// The real spawner against the real shell: status, environment and folder.
std::optional<int32_t> WaitFor(PosixProcessSpawner& spawner, int64_t pid) {
  for (int i = 0; i < 5000; ++i) {
    if (auto status = spawner.TryReap(pid)) return status;
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  return std::nullopt;
}

TEST(PosixProcessSpawner, RunsThroughTheShellWithEnvironmentAndFolder) {
  PosixProcessSpawner spawner;
  TempFolder folder("tav-spawn");
  std::string dir = folder.Path();
  ShellCommand command{"echo \"$TAV_SEQUENCE\" > out.txt; pwd >> out.txt; exit 3",
                       dir,
                       {{"TAV_SEQUENCE", "carol.tseq"}}};
  int64_t pid = spawner.Spawn(command);
  EXPECT_EQ(WaitFor(spawner, pid), 3);
  std::ifstream out(dir + "/out.txt");
  std::string line1, line2;
  std::getline(out, line1);
  std::getline(out, line2);
  EXPECT_EQ(line1, "carol.tseq");
  EXPECT_NE(line2.find(dir.substr(0, dir.size() - 1)), std::string::npos);
}

TEST(PosixProcessSpawner, ReportsTheSignalThatEndedAProcess) {
  PosixProcessSpawner spawner;
  int64_t pid = spawner.Spawn({"kill -TERM $$", "", {}});
  EXPECT_EQ(WaitFor(spawner, pid), 128 + 15);
}

TEST(PosixProcessSpawner, AMissingFolderIsReportedByTheShellNotByACrash) {
  PosixProcessSpawner spawner;
  try {
    int64_t pid = spawner.Spawn({"true", "/nonexistent/folder", {}});
    EXPECT_NE(WaitFor(spawner, pid), 0);
  } catch (const Error& e) {
    EXPECT_NE(e.Description().find("Cannot start"), std::string::npos);
  }
}

}  // namespace
}  // namespace tav
