#include "platform/UnixTrayLink.h"

#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>

#include "platform/UnixTrayLinkClient.h"
#include "support/Error.h"

namespace tav {
namespace {

using namespace std::string_literals;
namespace fs = std::filesystem;

class UnixTrayLinkTest : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string pattern = (fs::temp_directory_path() / "tav-tray-XXXXXX").string();
    ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
    dir = pattern;
    path = dir + "/run/showplayer.sock";
  }
  void TearDown() override {
    link.reset();
    fs::remove_all(dir);
  }

  void Open(UnixTrayLinkLimits limits = {}) {
    link = std::make_unique<UnixTrayLink>(loop, path, limits);
    link->SetOnFrame([this](const TrayFrame& f) { frames.push_back(f); });
    link->SetOnConnect([this](uint32_t h) { connected.push_back(h); });
    link->SetOnDisconnect([this](uint32_t h, const std::string& why) {
      dropped.push_back(std::to_string(h) + " " + why);
    });
  }

  // Runs the loop until `done` holds; false after two seconds.
  template <typename Predicate>
  bool RunUntil(Predicate done) {
    auto until = std::chrono::steady_clock::now() + std::chrono::seconds(2);
    while (!done()) {
      if (std::chrono::steady_clock::now() > until) return false;
      loop.RunFor(std::chrono::milliseconds(2));
    }
    return true;
  }

  // A connected client and its handle.
  std::pair<std::unique_ptr<UnixTrayLinkClient>, uint32_t> Connect() {
    size_t before = connected.size();
    auto client = std::make_unique<UnixTrayLinkClient>(path);
    EXPECT_TRUE(RunUntil([&] { return connected.size() > before; }));
    return {std::move(client), connected.empty() ? 0 : connected.back()};
  }

  std::string dir, path;
  EventLoop loop;
  std::unique_ptr<UnixTrayLink> link;
  std::vector<TrayFrame> frames;
  std::vector<uint32_t> connected;
  std::vector<std::string> dropped;
};

TEST_F(UnixTrayLinkTest, FramesTravelBothWaysAndCarryTheHandleThePlayerGave) {
  Open();
  auto [client, handle] = Connect();
  EXPECT_NE(handle, 0u);
  EXPECT_NE(handle, link->OwnHandle());

  client->Send(TrayFrame{999, 3, "02\0"s});  // claims to be window 999
  ASSERT_TRUE(RunUntil([&] { return frames.size() == 1; }));
  EXPECT_EQ(frames[0], (TrayFrame{handle, 3, "02\0"s}));

  EXPECT_TRUE(link->Send(handle, TrayFrame{link->OwnHandle(), 3, "07line\0"s}));
  auto received = client->Receive(1000);
  ASSERT_TRUE(received);
  EXPECT_EQ(*received, (TrayFrame{1, 3, "07line\0"s}));
  EXPECT_FALSE(link->Send(handle + 100, TrayFrame{1, 3, "x"}));
}

TEST_F(UnixTrayLinkTest, EachConnectionIsItsOwnWindow) {
  Open();
  auto [a, handleA] = Connect();
  auto [b, handleB] = Connect();
  EXPECT_NE(handleA, handleB);
  link->Send(handleB, TrayFrame{1, 3, "for b"});
  EXPECT_FALSE(a->Receive(50));
  EXPECT_EQ(b->Receive(1000)->data, "for b");

  b->Send(TrayFrame{0, 3, "from b"});
  a->Send(TrayFrame{0, 3, "from a"});
  ASSERT_TRUE(RunUntil([&] { return frames.size() == 2; }));
  for (const auto& f : frames) EXPECT_EQ(f.senderHwnd, f.data == "from a" ? handleA : handleB);
}

TEST_F(UnixTrayLinkTest, ATrayThatDoesNotReadIsDroppedOnceTooMuchWaits) {
  UnixTrayLinkLimits limits;
  limits.maxQueuedBytes = 64 * 1024;
  Open(limits);
  auto [sleeper, sleeperHandle] = Connect();
  auto [reader, readerHandle] = Connect();
  std::string line(4000, 'l');
  size_t sent = 0;
  while (link->Send(sleeperHandle, TrayFrame{1, 3, line})) {
    sent += line.size();
    ASSERT_LT(sent, 64u * 1024 * 1024) << "never dropped";
  }
  EXPECT_EQ(link->QueuedBytes(sleeperHandle), 0u);
  ASSERT_TRUE(RunUntil([&] { return !dropped.empty(); }));
  EXPECT_EQ(dropped[0], std::to_string(sleeperHandle) + " tray not reading");

  EXPECT_TRUE(link->Send(readerHandle, TrayFrame{1, 3, "fine"}));
  EXPECT_EQ(reader->Receive(1000)->data, "fine");
}

TEST_F(UnixTrayLinkTest, WritesTheSocketCannotTakeAtOnceAreFinishedLater) {
  Open();
  auto [client, handle] = Connect();
  // More than a socket buffer holds, but under the queue limit.
  const int count = 200;
  for (int i = 0; i < count; ++i) {
    ASSERT_TRUE(link->Send(handle, TrayFrame{1, 3, std::to_string(i) + std::string(4000, '.')}));
  }
  EXPECT_GT(link->QueuedBytes(handle), 0u);
  for (int i = 0; i < count; ++i) {
    std::optional<TrayFrame> frame;
    ASSERT_TRUE(RunUntil([&] { return (frame = client->Receive(0)).has_value(); })) << i;
    EXPECT_EQ(frame->data.substr(0, std::to_string(i).size()), std::to_string(i));
  }
  EXPECT_EQ(link->QueuedBytes(handle), 0u);
}

TEST_F(UnixTrayLinkTest, ConnectionsAboveTheLimitAreClosedAtOnce) {
  UnixTrayLinkLimits limits;
  limits.maxConnections = 2;
  Open(limits);
  auto [a, ha] = Connect();
  auto [b, hb] = Connect();
  UnixTrayLinkClient third(path);
  ASSERT_TRUE(RunUntil([&] { return link->RefusedConnections() == 1; }));
  EXPECT_THROW(third.Receive(1000), Error);
  EXPECT_TRUE(third.Closed());
  EXPECT_EQ(connected.size(), 2u);

  a.reset();
  ASSERT_TRUE(RunUntil([&] { return dropped.size() == 1; }));
  EXPECT_EQ(dropped[0], std::to_string(ha) + " closed");
  auto [c, hc] = Connect();
  EXPECT_NE(hc, ha);  // handles are not reused
}

TEST_F(UnixTrayLinkTest, OnlyItsUserCanReachTheSocket) {
  Open();
  struct stat info {};
  ASSERT_EQ(::stat((dir + "/run").c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 0777, 0700u);
  ASSERT_EQ(::stat(path.c_str(), &info), 0);
  EXPECT_TRUE(S_ISSOCK(info.st_mode));
  EXPECT_EQ(info.st_mode & 0777, 0600u);
}

TEST_F(UnixTrayLinkTest, ASecondPlayerIsRefusedWhileTheFirstListens) {
  Open();
  try {
    UnixTrayLink second(loop, path);
    FAIL() << "a second link listened at the same path";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), kTrayLinkInUse);
    EXPECT_NE(e.Description().find("Another show player is running"), std::string::npos);
  }
  auto [client, handle] = Connect();  // the first is unharmed
  EXPECT_TRUE(link->Send(handle, TrayFrame{1, 3, "ok"}));
  EXPECT_EQ(client->Receive(1000)->data, "ok");
}

TEST_F(UnixTrayLinkTest, ASocketLeftByADeadPlayerIsReplaced) {
  fs::create_directories(dir + "/run");
  int fd = ::socket(AF_UNIX, SOCK_STREAM, 0);
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::strcpy(address.sun_path, path.c_str());
  ASSERT_EQ(::bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof(address)), 0);
  ::close(fd);  // the file stays, nobody listens
  ASSERT_TRUE(fs::exists(path));
  Open();
  auto [client, handle] = Connect();
  EXPECT_NE(handle, 0u);
}

TEST_F(UnixTrayLinkTest, SomethingElseAtThePathIsLeftAlone) {
  fs::create_directories(dir + "/run");
  std::ofstream(path) << "not a socket";
  try {
    Open();
    FAIL() << "listened over a regular file";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), kTrayLinkUnavailable);
  }
  std::ifstream in(path);
  std::string content;
  std::getline(in, content);
  EXPECT_EQ(content, "not a socket");
}

TEST_F(UnixTrayLinkTest, ClosingRemovesTheSocketAndClientsSeeTheEnd) {
  Open();
  auto [client, handle] = Connect();
  link->Close();
  EXPECT_FALSE(fs::exists(path));
  EXPECT_FALSE(link->Send(handle, TrayFrame{1, 3, "x"}));
  EXPECT_THROW(client->Receive(1000), Error);
  try {
    UnixTrayLinkClient late(path);
    FAIL() << "connected to a closed player";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), kTrayLinkUnavailable);
    EXPECT_NE(e.Description().find("not running"), std::string::npos);
  }
}

TEST(UnixTrayLinkPath, ExplicitSocketThenRuntimeDirThenPerUserTmp) {
  std::string savedSocket = std::getenv("TAV_TRAY_SOCKET") ? std::getenv("TAV_TRAY_SOCKET") : "";
  std::string savedRuntime = std::getenv("XDG_RUNTIME_DIR") ? std::getenv("XDG_RUNTIME_DIR") : "";
  ::setenv("TAV_TRAY_SOCKET", "/x/y.sock", 1);
  ::setenv("XDG_RUNTIME_DIR", "/run/user/5", 1);
  EXPECT_EQ(UnixTrayLink::DefaultSocketPath(), "/x/y.sock");
  ::unsetenv("TAV_TRAY_SOCKET");
  EXPECT_EQ(UnixTrayLink::DefaultSocketPath(), "/run/user/5/tessavar/showplayer.sock");
  ::unsetenv("XDG_RUNTIME_DIR");
  EXPECT_EQ(UnixTrayLink::DefaultSocketPath(),
            "/tmp/tessavar-" + std::to_string(::getuid()) + "/showplayer.sock");
  if (!savedSocket.empty()) ::setenv("TAV_TRAY_SOCKET", savedSocket.c_str(), 1);
  if (!savedRuntime.empty()) ::setenv("XDG_RUNTIME_DIR", savedRuntime.c_str(), 1);
}

// A player that is alive but stuck (stopped, say) listens and accepts
// nothing; once its queue of waiting connections is full, a blocking connect
// to it would wait for ever. A new player must see it as running at once.
TEST(UnixTrayLinkDeathTest, APlayerThatAcceptsNothingCountsAsRunningWithoutWaiting) {
  std::string pattern = (fs::temp_directory_path() / "tav-tray-XXXXXX").string();
  ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
  std::string path = pattern + "/showplayer.sock";
  int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::memcpy(address.sun_path, path.c_str(), path.size() + 1);
  ASSERT_EQ(::bind(listener, reinterpret_cast<sockaddr*>(&address), sizeof address), 0);
  ASSERT_EQ(::listen(listener, 0), 0);
  std::vector<int> waiting;
  for (int i = 0; i < 64; ++i) {
    int fd = ::socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0);
    if (::connect(fd, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0) {
      ::close(fd);
      break;
    }
    waiting.push_back(fd);
  }
  ASSERT_FALSE(waiting.empty());

  EXPECT_EXIT(
      {
        ::alarm(5);  // a probe that waits is killed by the alarm
        try {
          EventLoop loop;
          UnixTrayLink link(loop, path);
          std::_Exit(1);
        } catch (const Error& e) {
          std::_Exit(e.Number() == kTrayLinkInUse ? 0 : 2);
        }
      },
      ::testing::ExitedWithCode(0), "");

  for (int fd : waiting) ::close(fd);
  ::close(listener);
  fs::remove_all(pattern);
}

}  // namespace
}  // namespace tav
