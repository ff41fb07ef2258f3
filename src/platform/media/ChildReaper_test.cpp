#include "platform/media/ChildReaper.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <string>
#include <vector>

#include "platform/media/ChildProcess.h"

// Real children (sh): what the reaper is for is that none is left behind.

namespace tav {
namespace {

using namespace std::chrono_literals;

struct Started {
  int64_t processId;
  int socket;
};

// A child that ends when its socket reaches end of file, or never.
Started StartChild(bool endsOnClose) {
  std::string script = endsOnClose ? "read line <&3; exit 7" : "exec sleep 30";
  SpawnedChild child = SpawnWithSocket("/bin/sh", {"-c", script}, 3);
  return {child.processId, child.socket};
}

bool Reaped(int64_t processId) {
  return ::kill(static_cast<pid_t>(processId), 0) == -1 && errno == ESRCH;
}

TEST(ChildReaperTest, ReapsEachChildAndSaysHowItEnded) {
  EventLoop loop;
  ChildReaper reaper(loop);
  std::vector<std::string> told;
  auto tell = [&](const std::string& how) { told.push_back(how); };

  Started quits = StartChild(true);
  Started hangs = StartChild(false);
  Started killed = StartChild(false);
  reaper.AwaitQuit(quits.processId, ChildReaper::Clock::now() + 5s, tell);
  ::close(quits.socket);
  reaper.AwaitQuit(hangs.processId, ChildReaper::Clock::now() + 100ms, tell);
  reaper.Kill(killed.processId, tell);
  ::close(hangs.socket);
  ::close(killed.socket);

  auto deadline = ChildReaper::Clock::now() + 10s;
  while (reaper.Pending() > 0 && ChildReaper::Clock::now() < deadline) loop.RunFor(5ms);
  EXPECT_EQ(reaper.Pending(), 0u);
  for (const Started& child : {quits, hangs, killed}) EXPECT_TRUE(Reaped(child.processId));
  std::sort(told.begin(), told.end());
  EXPECT_EQ(told, (std::vector<std::string>{"exited with status 7", "killed by signal 9 (Killed)",
                                            "killed by signal 9 (Killed)"}));
}

TEST(ChildReaperTest, WaitingForAllKillsAtTheDeadlineAndTellsNobody) {
  EventLoop loop;
  bool told = false;
  Started hangs = StartChild(false);
  {
    ChildReaper reaper(loop);
    reaper.AwaitQuit(hangs.processId, ChildReaper::Clock::now() + 50ms,
                     [&](const std::string&) { told = true; });
    reaper.WaitForAll();
    EXPECT_EQ(reaper.Pending(), 0u);
  }
  ::close(hangs.socket);
  EXPECT_TRUE(Reaped(hangs.processId));
  loop.RunFor(30ms);  // the cancelled timer finds nobody
  EXPECT_FALSE(told);
}

}  // namespace
}  // namespace tav
