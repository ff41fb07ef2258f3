#include "platform/InstanceLock.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/testing/TempFolder.h"

namespace tav {
namespace {

TEST(InstanceLock, LockFileSitsBesideTheSocket) {
  EXPECT_EQ(InstanceLock::PathForSocket("/run/user/1/tessavar/showplayer.sock"),
            "/run/user/1/tessavar/showplayer.lock");
  EXPECT_EQ(InstanceLock::PathForSocket("/tmp/player"), "/tmp/player.lock");
  EXPECT_EQ(InstanceLock::PathForSocket(".sock"), ".sock.lock");
}

TEST(InstanceLock, SecondHolderIsRefusedUntilTheFirstLetsGo) {
  TempFolder folder;
  std::string path = folder / "run/tessavar/showplayer.lock";
  {
    InstanceLock first(path);
    ASSERT_TRUE(first.Held()) << first.Problem();
    struct stat st {};
    ASSERT_EQ(::stat((folder / "run/tessavar").c_str(), &st), 0);
    EXPECT_EQ(st.st_mode & 0777, 0700u);

    // flock locks belong to the open file, so a second open in this process
    // is refused just as another process would be.
    InstanceLock second(path);
    EXPECT_FALSE(second.Held());
    EXPECT_TRUE(second.HeldElsewhere());
    EXPECT_NE(second.Problem().find("another show player is already running"), std::string::npos);
  }
  InstanceLock again(path);
  EXPECT_TRUE(again.Held());
}

TEST(InstanceLock, LockOfAProcessThatDiedIsFree) {
  TempFolder folder;
  std::string path = folder / "showplayer.lock";
  pid_t child = fork();
  if (child == 0) {
    InstanceLock held(path);
    _exit(held.Held() ? 0 : 1);  // dies holding the lock, without a destructor
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
  InstanceLock next(path);
  EXPECT_TRUE(next.Held()) << next.Problem();
}

TEST(InstanceLock, UnopenableFileIsAProblemNotAnotherPlayer) {
  InstanceLock lock("/proc/tav-no-such-folder/showplayer.lock");
  EXPECT_FALSE(lock.Held());
  EXPECT_FALSE(lock.HeldElsewhere());
  EXPECT_NE(lock.Problem().find("cannot open the lock file"), std::string::npos);
}

}  // namespace
}  // namespace tav
