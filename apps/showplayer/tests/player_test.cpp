// End-to-end tests of the showplayer binary: each starts the real program in
// a folder of its own (settings file, user data folder and tray socket
// there, no sound and no video), and watches what it prints and how it ends.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <fstream>
#include <optional>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "support/testing/TempFolder.h"

namespace tav::player {
namespace {

using namespace std::chrono_literals;

class PlayerProcessTest : public ::testing::Test {
 protected:
  PlayerProcessTest() : m_folder("tav-showplayer") {
    m_folder.Write("registry.reg",
                   "Windows Registry Editor Version 5.00\r\n\r\n"
                   "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\r\n"
                   "\"UserDataPath\"=\"" +
                       m_folder.Path() +
                       "data/\"\r\n\r\n"
                       "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Media]\r\n"
                       "\"AudioOutput\"=\"null\"\r\n\"VideoOutput\"=\"null\"\r\n");
    m_folder.Write("data/weeksched.tsc", "\r\n");
  }
  ~PlayerProcessTest() override {
    for (pid_t pid : m_running) {
      ::kill(pid, SIGKILL);
      ::waitpid(pid, nullptr, 0);
    }
  }

  // Starts showplayer with `args`; its standard error goes to `errName`.
  pid_t Start(const std::vector<std::string>& args, const std::string& errName = "err.txt") {
    std::string err = m_folder / errName;
    pid_t pid = ::fork();
    if (pid == 0) {
      ::setenv("TAV_REGISTRY_FILE", (m_folder / "registry.reg").c_str(), 1);
      ::setenv("TAV_TRAY_SOCKET", (m_folder / "run/showplayer.sock").c_str(), 1);
      ::setenv("XDG_RUNTIME_DIR", (m_folder / "run").c_str(), 1);
      ::setenv("XDG_DATA_HOME", m_folder.Path().c_str(), 1);
      int fd = ::open(err.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
      ::dup2(fd, STDERR_FILENO);
      ::dup2(fd, STDOUT_FILENO);
      std::vector<char*> argv{const_cast<char*>(TAV_SHOWPLAYER_PATH)};
      for (const std::string& arg : args) argv.push_back(const_cast<char*>(arg.c_str()));
      argv.push_back(nullptr);
      ::execv(TAV_SHOWPLAYER_PATH, argv.data());
      ::_exit(127);
    }
    m_running.push_back(pid);
    return pid;
  }

  // The exit status, or nothing when the process is still running after
  // `limit`.
  std::optional<int> WaitFor(pid_t pid, std::chrono::milliseconds limit) {
    auto deadline = std::chrono::steady_clock::now() + limit;
    for (;;) {
      int status = 0;
      if (::waitpid(pid, &status, WNOHANG) == pid) {
        std::erase(m_running, pid);
        return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
      }
      if (std::chrono::steady_clock::now() > deadline) return std::nullopt;
      std::this_thread::sleep_for(20ms);
    }
  }

  // Waits until `text` appears in the file, up to `limit`.
  bool WaitForText(const std::string& name, const std::string& text,
                   std::chrono::milliseconds limit) {
    auto deadline = std::chrono::steady_clock::now() + limit;
    while (std::chrono::steady_clock::now() < deadline) {
      if (Read(name).find(text) != std::string::npos) return true;
      std::this_thread::sleep_for(20ms);
    }
    return false;
  }
  std::string Read(const std::string& name) const {
    return m_folder.Exists(name) ? m_folder.Read(name) : "";
  }
  int Count(const std::string& name, const std::string& text) const {
    std::string all = Read(name);
    int count = 0;
    for (size_t at = all.find(text); at != std::string::npos; at = all.find(text, at + 1)) ++count;
    return count;
  }

  TempFolder m_folder;
  std::vector<pid_t> m_running;
};

TEST_F(PlayerProcessTest, HelpAndVersionAnswerWithoutStarting) {
  pid_t help = Start({"--help"}, "help.txt");
  EXPECT_EQ(WaitFor(help, 10s), 0);
  EXPECT_NE(Read("help.txt").find("/noschedule"), std::string::npos);
  EXPECT_NE(Read("help.txt").find("75"), std::string::npos);
  pid_t version = Start({"--version"}, "version.txt");
  EXPECT_EQ(WaitFor(version, 10s), 0);
  EXPECT_EQ(Read("version.txt").rfind("showplayer ", 0), 0u);
  EXPECT_FALSE(m_folder.Exists("run/showplayer.lock"));
}

TEST_F(PlayerProcessTest, ASecondPlayerEndsAtOnceWhileTheFirstRuns) {
  pid_t first = Start({});
  ASSERT_TRUE(WaitForText("err.txt", "Schedule loaded", 20s)) << Read("err.txt");
  pid_t second = Start({}, "second.txt");
  EXPECT_EQ(WaitFor(second, 10s), 3);
  EXPECT_NE(Read("second.txt").find("another show player is already running"), std::string::npos);
  EXPECT_EQ(Count("second.txt", "\n"), 1) << Read("second.txt");
  EXPECT_FALSE(WaitFor(first, 0ms).has_value()) << "the first player must go on";
}

TEST_F(PlayerProcessTest, SigtermEndsAnIdlePlayerGracefullyWithStatusZero) {
  pid_t player = Start({});
  ASSERT_TRUE(WaitForText("err.txt", "Schedule loaded", 20s)) << Read("err.txt");
  ::kill(player, SIGTERM);
  EXPECT_EQ(WaitFor(player, 10s), 0) << Read("err.txt");
  std::string err = Read("err.txt");
  EXPECT_NE(err.find("info    Graceful shutdown requested"), std::string::npos) << err;
  EXPECT_NE(err.find("info    Show Player shutting down"), std::string::npos) << err;
  EXPECT_FALSE(m_folder.Exists("run/showplayer.sock")) << "the socket is removed";
}

TEST_F(PlayerProcessTest, AScheduleThatCannotBeReadEndsThePlayerWithOneClearLine) {
  m_folder.Write("data/weeksched.tsc", "((100,2,(, 0,a),50),(120,2,(, 0,b),60))\r\n");
  pid_t player = Start({"/noschedule"});
  EXPECT_EQ(WaitFor(player, 20s), 1);
  std::string err = Read("err.txt");
  EXPECT_NE(err.find("info    Show Player starting (for on demand shows)"), std::string::npos);
  EXPECT_EQ(Count("err.txt", "Shows cannot be enabled because of an error."), 1) << err;
  EXPECT_NE(err.find("Can't add event -- event conflict/Schedule.AddShowEvent"), std::string::npos);
}

}  // namespace
TEST_F(PlayerProcessTest, TemporariesLeftByADeadWriterAreRemovedAtStart) {
  // A writer that is certainly gone: a child that has ended and been reaped.
  pid_t gone = ::fork();
  if (gone == 0) ::_exit(0);
  ::waitpid(gone, nullptr, 0);
  std::string dead = ".show.tseq.tcs.tav-tmp-" + std::to_string(gone) + "-a1B2c3";
  std::string live = ".other.tseq.tcs.tav-tmp-" + std::to_string(::getpid()) + "-d4E5f6";
  m_folder.Write("data/Sequences/" + dead, "half");
  m_folder.Write("data/Sequences/" + live, "being written");
  m_folder.Write("data/Sequences/show.tseq", "kept");
  m_folder.Write("data/" + dead, "half");

  pid_t player = Start({});
  ASSERT_TRUE(WaitForText("err.txt", "Schedule loaded", 20s)) << Read("err.txt");
  EXPECT_FALSE(m_folder.Exists("data/Sequences/" + dead));
  EXPECT_FALSE(m_folder.Exists("data/" + dead));
  EXPECT_TRUE(m_folder.Exists("data/Sequences/" + live)) << "its writer is still running";
  EXPECT_EQ(Read("data/Sequences/show.tseq"), "kept");
  EXPECT_EQ(Count("err.txt", "unfinished temporary file(s)"), 2) << Read("err.txt");
  ::kill(player, SIGTERM);
  EXPECT_EQ(WaitFor(player, 10s), 0);
}

}  // namespace tav::player
