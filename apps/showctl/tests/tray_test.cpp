// The player's tray messaging behind the real Unix socket link, on the real
// event loop and timers, with the real showctl as the tray.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>

#include "host/HostLog.h"
#include "host/Msg.h"
#include "host/TrayMessaging.h"
#include "platform/AsioTimerService.h"
#include "platform/EventLoop.h"
#include "platform/TrayLinkFrame.h"
#include "platform/UnixTrayLink.h"
#include "platform/UnixTrayLinkClient.h"
#include "ports/testing/ManualClock.h"

extern char** environ;

namespace tav {
namespace {

namespace fs = std::filesystem;

std::shared_ptr<MonitoredShowEvent> Event(const std::string& file, int32_t scheduleType, int day) {
  auto event = std::make_shared<MonitoredShowEvent>();
  event->SetFilename(file);
  event->Range()->SetStartTime(DateTime::FromParts(2024, 12, day, 18, 0, 0));
  event->Range()->SetEndTime(DateTime::FromParts(2024, 12, day, 22, 0, 0));
  event->SetScheduleType(scheduleType);
  return event;
}

struct RecordingHost : TrayHost {
  std::vector<std::string> calls;
  std::shared_ptr<MonitoredShowEvent> scheduled = Event("Xmas.tss", 1, 24);
  std::shared_ptr<MonitoredShowEvent> next = Event("Boxing Day.tss", 2, 26);

  void ImmediateShutdown(const std::string& szReason) override {
    calls.push_back("ImmediateShutdown:" + szReason);
  }
  void GracefulShutdown() override { calls.push_back("GracefulShutdown"); }
  void LoadSchedules() override { calls.push_back("LoadSchedules"); }
  void ShowOnDemand(const std::string& szSerialized) override {
    calls.push_back("ShowOnDemand:" + szSerialized);
  }
  void SetOnDemandOnly(bool value) override {
    calls.push_back(std::string("SetOnDemandOnly:") + (value ? "true" : "false"));
  }
  void SimulateInput(int32_t network, int32_t unitId, int32_t inputNumber) override {
    calls.push_back("SimulateInput:" + std::to_string(network) + "," + std::to_string(unitId) +
                    "," + std::to_string(inputNumber));
  }
  bool Initialized() const override { return true; }
  std::shared_ptr<MonitoredShowEvent> CurrentShowEvent(DateTime) override { return scheduled; }
  std::shared_ptr<MonitoredShowEvent> RunningShowEvent() override { return nullptr; }
  std::shared_ptr<MonitoredShowEvent> NextShowEvent(const std::shared_ptr<MonitoredShowEvent>&,
                                                    DateTime) override {
    return next;
  }
};

struct FakeSequence : SequenceIdentity {
  int32_t PlayType() const override { return 5; }
  std::string Filename() const override { return "Carol, part 1.tsq"; }
  int32_t Section() const override { return 4; }
};

// A showctl process with its standard output and error collected.
struct Showctl {
  pid_t pid = -1;
  int outFd = -1;
  int errFd = -1;
  std::string out, err;
  std::optional<int> exitCode;

  void Collect() {
    char buffer[4096];
    for (auto [fd, text] : {std::pair{outFd, &out}, std::pair{errFd, &err}}) {
      ssize_t n;
      while (fd >= 0 && (n = ::read(fd, buffer, sizeof(buffer))) > 0) text->append(buffer, n);
    }
    int status = 0;
    if (!exitCode && pid > 0 && ::waitpid(pid, &status, WNOHANG) == pid) {
      exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    }
  }
  ~Showctl() {
    if (pid > 0 && !exitCode) {
      ::kill(pid, SIGKILL);
      ::waitpid(pid, nullptr, 0);
    }
    if (outFd >= 0) ::close(outFd);
    if (errFd >= 0) ::close(errFd);
  }
};

class TrayEndToEnd : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string pattern = (fs::temp_directory_path() / "tav-e2e-XXXXXX").string();
    ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
    dir = pattern;
    path = dir + "/showplayer.sock";
    ::setenv("TAV_TRAY_SOCKET", path.c_str(), 1);
    UnixTrayLinkLimits limits;
    limits.maxFrameBytes = 4096;
    link = std::make_unique<UnixTrayLink>(loop, path, limits);
    outbox = std::make_unique<TrayOutbox>(*link);
    log = std::make_unique<HostLog>(clock, *outbox);
    messaging = std::make_unique<TrayMessaging>(*outbox, *log, host, timers, clock);
    link->SetOnFrame([this](const TrayFrame& f) { messaging->m_FormHook_AfterMessage(f); });
    link->SetOnDisconnect(
        [this](uint32_t, const std::string& reason) { disconnects.push_back(reason); });
  }
  void TearDown() override {
    messaging.reset();
    log.reset();
    outbox.reset();
    link.reset();
    ::unsetenv("TAV_TRAY_SOCKET");
    fs::remove_all(dir);
  }

  std::unique_ptr<Showctl> Start(std::vector<std::string> args) {
    auto child = std::make_unique<Showctl>();
    int out[2], err[2];
    EXPECT_EQ(::pipe2(out, O_CLOEXEC | O_NONBLOCK), 0);
    EXPECT_EQ(::pipe2(err, O_CLOEXEC | O_NONBLOCK), 0);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, out[1], 1);
    posix_spawn_file_actions_adddup2(&actions, err[1], 2);
    args.insert(args.begin(), TAV_SHOWCTL_PATH);
    std::vector<char*> argv;
    for (auto& arg : args) argv.push_back(arg.data());
    argv.push_back(nullptr);
    EXPECT_EQ(::posix_spawn(&child->pid, TAV_SHOWCTL_PATH, &actions, nullptr, argv.data(), environ),
              0);
    posix_spawn_file_actions_destroy(&actions);
    ::close(out[1]);
    ::close(err[1]);
    child->outFd = out[0];
    child->errFd = err[0];
    return child;
  }

  // Runs the player's loop until `done` holds; false after ten seconds.
  template <typename Predicate>
  bool RunUntil(Predicate done, Showctl* child = nullptr) {
    auto until = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    for (;;) {
      if (child) child->Collect();
      if (done()) return true;
      if (std::chrono::steady_clock::now() > until) return false;
      loop.RunFor(std::chrono::milliseconds(5));
    }
  }

  // Runs showctl to its end while the player serves it; its exit code.
  int Run(Showctl& child) {
    EXPECT_TRUE(RunUntil([&] { return child.exitCode.has_value(); }, &child)) << child.out;
    child.Collect();
    return child.exitCode.value_or(-1);
  }

  std::string dir, path;
  EventLoop loop;
  AsioTimerService timers{loop};
  ManualClock clock{DateTime::FromParts(2024, 12, 24, 12, 0, 0)};
  RecordingHost host;
  std::unique_ptr<UnixTrayLink> link;
  std::unique_ptr<TrayOutbox> outbox;
  std::unique_ptr<HostLog> log;
  std::unique_ptr<TrayMessaging> messaging;
  std::vector<std::string> disconnects;
};

bool Contains(const std::string& text, const std::string& part) {
  return text.find(part) != std::string::npos;
}

TEST_F(TrayEndToEnd, MonitorFollowsLogStatusAndSequencesUntilThePlayerEnds) {
  log->LogMessage(1, "Show Player starting");
  log->LogMessage(1, "Schedule loaded");
  auto monitor = Start({"monitor"});
  ASSERT_TRUE(RunUntil([&] { return Contains(monitor->out, "current"); }, monitor.get()))
      << monitor->out << monitor->err;
  EXPECT_EQ(monitor->out,
            "log      12:00:00: Show Player starting\n"
            "log      12:00:00: Schedule loaded\n"
            "ready    the show player is initialised\n"
            "next     Boxing Day.tss, 2024-12-26 18:00:00 to 2024-12-26 22:00:00, year schedule\n"
            "current  Xmas.tss, 2024-12-24 18:00:00 to 2024-12-24 22:00:00, week schedule\n");
  monitor->out.clear();

  FakeSequence carol;
  log->LogMessage(1, "Starting", &carol);
  log->LogMessage(0, "Queueing", &carol);  // trace: never sent
  messaging->SendSequenceStartToTAVTray(carol);
  host.scheduled->SetShuttingDown(true);
  messaging->SendStatusToTAVTray(false);
  messaging->SendSequenceStopToTAVTray(carol);
  ASSERT_TRUE(RunUntil([&] { return Contains(monitor->out, "stop"); }, monitor.get()));
  EXPECT_EQ(monitor->out,
            "log      12:00:00: Starting Musical: Carol, part 1.tsq\n"
            "start    Carol, part 1.tsq (section 4) at 2024-12-24 12:00:00\n"
            "next     Boxing Day.tss, 2024-12-26 18:00:00 to 2024-12-26 22:00:00, year schedule\n"
            "current  Xmas.tss, 2024-12-24 18:00:00 to 2024-12-24 22:00:00, week schedule, "
            "shutting down\n"
            "stop     Carol, part 1.tsq (section 4) at 2024-12-24 12:00:00\n");

  link->Close();
  EXPECT_EQ(Run(*monitor), 0);
  EXPECT_TRUE(Contains(monitor->out, "closed"));
}

TEST_F(TrayEndToEnd, StatusPrintsTheCurrentAndNextShowOnce) {
  host.next = nullptr;
  auto status = Start({"status"});
  EXPECT_EQ(Run(*status), 0) << status->err;
  EXPECT_EQ(status->out,
            "current  Xmas.tss, 2024-12-24 18:00:00 to 2024-12-24 22:00:00, week schedule\n"
            "next     (none)\n");
}

TEST_F(TrayEndToEnd, RequestsReachTheHost) {
  MonitoredShowEvent cleared;
  const struct {
    std::vector<std::string> args;
    std::string call;
  } cases[] = {
      {{"ondemand", "Xmas.tss", "--from", "2024-12-24 18:00:00", "--until", "2024-12-24 22:00"},
       "ShowOnDemand:(Xmas.tss,(T,2024-12-24 18:00:00,T,2024-12-24 22:00:00), 3,F)"},
      {{"ondemand", "My (new), show.tss"}, "ShowOnDemand:(My *Onew*C*S show.tss,(F,,F,), 3,F)"},
      {{"ondemand", "--clear"}, "ShowOnDemand:" + cleared.Serialize()},
      {{"reload"}, "LoadSchedules"},
      {{"schedules-on"}, "SetOnDemandOnly:false"},
      {{"shutdown"}, "GracefulShutdown"},
      {{"shutdown", "--now"}, "ImmediateShutdown:Immediate shutdown requested"},
      {{"trigger", "0", "3", "12"}, "SimulateInput:0,3,12"},
      {{"trigger", "15", "127", "512"}, "SimulateInput:15,127,512"},
  };
  for (const auto& c : cases) {
    host.calls.clear();
    auto child = Start(c.args);
    EXPECT_EQ(Run(*child), 0) << c.call << ": " << child->err;
    ASSERT_TRUE(RunUntil([&] { return !host.calls.empty(); })) << c.call;
    EXPECT_EQ(host.calls, std::vector<std::string>{c.call});
  }
}

TEST_F(TrayEndToEnd, WrongInputIsRefusedBeforeAnythingIsSent) {
  const std::vector<std::vector<std::string>> cases = {
      {"ondemand"},
      {"ondemand", "x.tss", "--clear"},
      {"ondemand", "x.tss", "--from", "tomorrow"},
      {"ondemand", "x.tss", "--from", "2024-12-24 18:00:00", "--until", "2024-12-24 17:00:00"},
      {"shutdown", "--later"},
      {"trigger", "0", "3"},
      {"trigger", "0", "3", "twelve"},
      {"trigger", "-1", "3", "12"},
      {"trigger", "0", "3", "12", "13"},
  };
  for (const auto& args : cases) {
    auto child = Start(args);
    EXPECT_NE(Run(*child), 0) << args[0];
    EXPECT_FALSE(child->err.empty());
  }
  loop.RunFor(std::chrono::milliseconds(20));
  EXPECT_TRUE(host.calls.empty());
}

TEST_F(TrayEndToEnd, EveryCommandSaysSoWhenThePlayerIsNotRunning) {
  link->Close();
  for (const std::vector<std::string>& args : {std::vector<std::string>{"monitor"},
                                               {"status"},
                                               {"ondemand", "x.tss"},
                                               {"reload"},
                                               {"schedules-on"},
                                               {"shutdown"},
                                               {"shutdown", "--now"},
                                               {"trigger", "0", "1", "1"}}) {
    auto child = Start(args);
    EXPECT_EQ(Run(*child), 1) << args[0];
    EXPECT_TRUE(Contains(child->err, "The show player is not running")) << child->err;
  }
}

TEST_F(TrayEndToEnd, GarbageAndOversizedTraysAreDroppedWithoutHarmingTheOthers) {
  auto monitor = Start({"monitor"});
  ASSERT_TRUE(RunUntil([&] { return Contains(monitor->out, "current"); }, monitor.get()));

  UnixTrayLinkClient garbage(path);
  UnixTrayLinkClient oversized(path);
  garbage.SendBytes(std::string(64, '\x07'));
  // Only the header of a frame too big: refused without waiting for the data.
  oversized.SendBytes(EncodeTrayFrame(TrayFrame{0, 3, std::string(5000, 'x')}).substr(0, 20));
  ASSERT_TRUE(RunUntil([&] { return disconnects.size() == 2; }, monitor.get()));
  std::sort(disconnects.begin(), disconnects.end());
  EXPECT_EQ(disconnects, (std::vector<std::string>{"bad frame header", "oversized frame"}));

  log->LogMessage(2, "Still logging");
  ASSERT_TRUE(RunUntil([&] { return Contains(monitor->out, "Still logging"); }, monitor.get()));
  auto reload = Start({"reload"});
  EXPECT_EQ(Run(*reload), 0);
  ASSERT_TRUE(RunUntil([&] { return !host.calls.empty(); }));
  EXPECT_EQ(host.calls, std::vector<std::string>{"LoadSchedules"});
  EXPECT_FALSE(monitor->exitCode.has_value());
}

}  // namespace
}  // namespace tav
