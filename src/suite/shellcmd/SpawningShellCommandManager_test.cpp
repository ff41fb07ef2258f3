#include "suite/shellcmd/SpawningShellCommandManager.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdio>
#include <fstream>
#include <map>
#include <thread>

#include "ports/testing/VirtualTimerService.h"
#include "support/Error.h"

namespace tav {
namespace {

class FakeSpawner : public ProcessSpawner {
 public:
  int64_t Spawn(const ShellCommand& command) override {
    if (failNext) throw Error(5, "ShellCommandManager.Spawn", "Cannot start shell command");
    spawned.push_back(command);
    return nextPid++;
  }
  std::optional<int32_t> TryReap(int64_t pid) override {
    ++reapCalls;
    auto it = exited.find(pid);
    if (it == exited.end()) return std::nullopt;
    int32_t status = it->second;
    exited.erase(it);
    return status;
  }

  bool failNext = false;
  int64_t nextPid = 100;
  std::vector<ShellCommand> spawned;
  std::map<int64_t, int32_t> exited;
  int reapCalls = 0;
};

struct Manager : ::testing::Test {
  VirtualTimerService timers;
  std::shared_ptr<FakeSpawner> spawner = std::make_shared<FakeSpawner>();
  SpawningShellCommandManager manager{spawner, timers};
  std::vector<std::pair<std::string, int32_t>> finished;

  void SetUp() override {
    manager.SetOnFinished(
        [this](const ShellCommand& c, int32_t s) { finished.emplace_back(c.commandLine, s); });
  }
};

TEST_F(Manager, PrepareTrimsAndRefusesEmptyCommands) {
  EXPECT_EQ(manager.PrepareCommand("  echo hi \n")->commandLine, "echo hi");
  EXPECT_THROW(manager.PrepareCommand(" \t "), Error);
}

TEST_F(Manager, ReapsFinishedCommandsOnTheTimerAndStopsTheTimerWhenIdle) {
  EXPECT_TRUE(timers.ArmedTimerNames().empty());
  manager.RunCommand(*manager.PrepareCommand("first"));
  manager.RunCommand(*manager.PrepareCommand("second"));
  EXPECT_EQ(manager.RunningCount(), 2u);
  EXPECT_EQ(timers.ArmedTimerNames(), std::vector<std::string>{"tmShellCmdReap"});

  spawner->exited[101] = 3;  // the second ends first
  timers.Advance(SpawningShellCommandManager::kReapIntervalMs);
  ASSERT_EQ(finished.size(), 1u);
  EXPECT_EQ(finished[0], std::make_pair(std::string("second"), 3));
  EXPECT_EQ(manager.RunningCount(), 1u);

  spawner->exited[100] = 0;
  timers.Advance(SpawningShellCommandManager::kReapIntervalMs);
  EXPECT_EQ(finished.size(), 2u);
  EXPECT_TRUE(timers.ArmedTimerNames().empty());
  int calls = spawner->reapCalls;
  timers.Advance(10 * SpawningShellCommandManager::kReapIntervalMs);
  EXPECT_EQ(spawner->reapCalls, calls);
}

TEST_F(Manager, AFailedStartLeavesNothingRunning) {
  spawner->failNext = true;
  EXPECT_THROW(manager.RunCommand(*manager.PrepareCommand("x")), Error);
  EXPECT_EQ(manager.RunningCount(), 0u);
  EXPECT_TRUE(timers.ArmedTimerNames().empty());
}

}  // namespace
}  // namespace tav
