#include "platform/FileRegistryStore.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/file.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <future>
#include <sstream>
#include <thread>

#include "config/LibRegistry.h"
#include "config/TextEncoding.h"
#include "platform/PlatformPaths.h"
#include "platform/PosixFiles.h"
#include "ports/testing/VirtualTimerService.h"
#include "support/Error.h"

namespace tav {
namespace {

namespace fs = std::filesystem;

class FileRegistryStoreTest : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/tav-registry-XXXXXX";
    ASSERT_NE(::mkdtemp(pattern), nullptr);
    folder = pattern;
    path = folder + "/sub/registry.reg";
  }
  void TearDown() override { fs::remove_all(folder); }

  FileRegistryStore MakeStore() {
    return FileRegistryStore(path, [this](const std::string& p) { problems.push_back(p); });
  }
  void WriteRaw(const std::string& bytes) {
    fs::create_directories(fs::path(path).parent_path());
    std::ofstream(path, std::ios::binary | std::ios::trunc) << bytes;
  }
  std::string ReadRaw() {
    std::ifstream in(path, std::ios::binary);
    std::stringstream text;
    text << in.rdbuf();
    return text.str();
  }

  std::string folder;
  std::string path;
  std::vector<std::string> problems;
};

TEST_F(FileRegistryStoreTest, MissingFileIsEmptyAndTheFirstWriteCreatesIt) {
  FileRegistryStore store = MakeStore();
  EXPECT_EQ(GetLongSetting(store, "MonitorX", "VideoPreferences", 12), 12);
  EXPECT_FALSE(fs::exists(path));
  SetLongSetting(store, "MonitorX", "VideoPreferences", 10);
  SetStringSetting(store, "RemoteHost", "Visualizer", "C:\\Host \"A\"");
  EXPECT_EQ(ReadRaw(),
            "Windows Registry Editor Version 5.00\n"
            "\n"
            "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\VideoPreferences]\n"
            "\"MonitorX\"=dword:0000000a\n"
            "\n"
            "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Visualizer]\n"
            "\"RemoteHost\"=\"C:\\\\Host \\\"A\\\"\"\n"
            "\n");
  // Another store on the same file reads what was written.
  FileRegistryStore other = MakeStore();
  EXPECT_EQ(GetStringSetting(other, "RemoteHost", "Visualizer", ""), "C:\\Host \"A\"");
  EXPECT_TRUE(problems.empty());
}

TEST_F(FileRegistryStoreTest, ReadsSeeChangesMadeByOtherPrograms) {
  FileRegistryStore store = MakeStore();
  WriteRaw(
      "Windows Registry Editor Version 5.00\n[HKEY_CURRENT_USER\\Software\\Tessavar\\"
      "Shared\\Network]\n\"Ver\"=\"1\"\n");
  EXPECT_EQ(GetStringSetting(store, "Ver", "Network", ""), "1");
  // Rewritten in place, as an editor might: same inode.
  WriteRaw(
      "Windows Registry Editor Version 5.00\n[HKEY_CURRENT_USER\\Software\\Tessavar\\"
      "Shared\\Network]\n\"Ver\"=\"22\"\n");
  EXPECT_EQ(GetStringSetting(store, "Ver", "Network", ""), "22");
  fs::remove(path);
  EXPECT_EQ(GetStringSetting(store, "Ver", "Network", "gone"), "gone");
}

TEST_F(FileRegistryStoreTest, WritesKeepUnknownContentAndUnreadableLines) {
  const std::string original =
      "Windows Registry Editor Version 5.00\n"
      "; kept comment\n"
      "\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Tray]\n"
      "\"Window\"=hex(b):01,02,03,04,05,06,07,08\n"
      "\"Broken\"=dword:nope\n"
      "\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\n"
      "\"AppPath\"=\"/opt/tav/\"\n"
      "\n";
  WriteRaw(original);
  FileRegistryStore store = MakeStore();
  EXPECT_EQ(GetStringSetting(store, "AppPath", "", ""), "/opt/tav/");
  ASSERT_EQ(problems.size(), 1u);
  EXPECT_EQ(problems[0], path + ": line 6: unreadable dword: \"Broken\"=dword:nope");

  SetStringSetting(store, "AppPath", "", "/usr/lib/tav/");
  std::string expected = original;
  expected.replace(expected.find("/opt/tav/"), 9, "/usr/lib/tav/");
  EXPECT_EQ(ReadRaw(), expected);
  // Our own rewrite did not make it report the same problem again.
  EXPECT_EQ(GetStringSetting(store, "AppPath", "", ""), "/usr/lib/tav/");
  EXPECT_EQ(problems.size(), 1u);
}

TEST_F(FileRegistryStoreTest, WindowsExportAsTheSettingsFileIsReadAndRewrittenAsUtf8) {
  WriteRaw("\xFF\xFE" + Utf8ToUtf16Le("Windows Registry Editor Version 5.00\r\n\r\n"
                                      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\r\n"
                                      "\"UserDataPath\"=\"D:\\\\Lichtshow\\\\Bühne\\\\\"\r\n"));
  FileRegistryStore store = MakeStore();
  EXPECT_EQ(GetStringSetting(store, "UserDataPath", "", ""), "D:\\Lichtshow\\Bühne\\");
  SetBooleanSetting(store, "AudioOnly", "VideoPreferences", true);
  std::string text = ReadRaw();
  EXPECT_TRUE(text.starts_with("Windows Registry Editor Version 5.00\n"));
  EXPECT_NE(text.find("\"UserDataPath\"=\"D:\\\\Lichtshow\\\\Bühne\\\\\""), std::string::npos);
  EXPECT_TRUE(problems.empty());
}

TEST_F(FileRegistryStoreTest, FailedChangeLeavesTheFileAlone) {
  FileRegistryStore store = MakeStore();
  SetLongSetting(store, "A", "S", 1);
  std::string before = ReadRaw();
  EXPECT_EQ(store.SetValue("Software\\Tessavar\\Missing", "A", RegistryValue::Dword(2)),
            kRegistryNotFound);
  EXPECT_EQ(store.Update([](RegistryDocument& d) {
    d.CreateKey("Software\\Tessavar\\Half");
    return kRegistryAccessDenied;
  }),
            kRegistryAccessDenied);
  EXPECT_EQ(ReadRaw(), before);
  EXPECT_EQ(store.OpenKey("Software\\Tessavar\\Half"), kRegistryNotFound);
}

TEST_F(FileRegistryStoreTest, UnwritableLocationIsAnIoFailureReported) {
  std::ofstream(folder + "/plain") << "x";
  FileRegistryStore store(folder + "/plain/registry.reg",
                          [this](const std::string& p) { problems.push_back(p); });
  EXPECT_EQ(store.CreateKey("Software\\Tessavar"), kRegistryIoFailed);
  try {
    SetLongSetting(store, "A", "", 1);
    FAIL() << "expected a failure";
  } catch (const Error& e) {
    EXPECT_EQ(e.Description(), "RegCreateKeyEx failure");
    EXPECT_EQ(e.Number(), kRegistryIoFailed);
  }
  ASSERT_FALSE(problems.empty());
  EXPECT_EQ(problems[0], folder + "/plain/registry.reg: cannot read settings: Not a directory");
  problems.clear();
  EXPECT_EQ(store.Update([](RegistryDocument&) { return kRegistryOk; }), kRegistryIoFailed);
  ASSERT_EQ(problems.size(), 1u);
  EXPECT_NE(problems[0].find("cannot create the settings folder"), std::string::npos);
}

// Each child process writes its own distinct values, one transaction each,
// while the other does the same; every value must survive.
TEST_F(FileRegistryStoreTest, TwoProcessesWritingAtOnceLoseNothing) {
  constexpr int kValuesPerProcess = 100;
  std::vector<pid_t> children;
  for (int process = 0; process < 2; ++process) {
    pid_t child = ::fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
      FileRegistryStore store(path, [](const std::string&) {});
      int failures = 0;
      for (int i = 0; i < kValuesPerProcess; ++i) {
        try {
          SetLongSetting(store, "P" + std::to_string(process) + "_" + std::to_string(i),
                         "Race\\" + std::to_string(i % 3), i);
        } catch (const Error&) {
          ++failures;
        }
      }
      if (!store.WritePendingChanges(std::chrono::seconds(10))) ++failures;
      ::_exit(failures == 0 ? 0 : 1);
    }
    children.push_back(child);
  }
  for (pid_t child : children) {
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
  }
  FileRegistryStore store = MakeStore();
  int missing = 0;
  for (int process = 0; process < 2; ++process) {
    for (int i = 0; i < kValuesPerProcess; ++i) {
      std::string name = "P" + std::to_string(process) + "_" + std::to_string(i);
      if (GetLongSetting(store, name, "Race\\" + std::to_string(i % 3), -1) != i) ++missing;
    }
  }
  EXPECT_EQ(missing, 0);
  EXPECT_TRUE(problems.empty());
  // No temporary file was left behind.
  for (const auto& entry : fs::directory_iterator(fs::path(path).parent_path())) {
    EXPECT_EQ(entry.path().string().find("tav-tmp"), std::string::npos) << entry.path();
  }
}

TEST_F(FileRegistryStoreTest, WriterKilledInsideItsTransactionLeavesTheFileAndLockUsable) {
  FileRegistryStore store = MakeStore();
  SetStringSetting(store, "Kept", "", "yes");
  pid_t child = ::fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    FileRegistryStore dying(path, [](const std::string&) {});
    dying.Update([](RegistryDocument& document) {
      document.SetValue("Software\\Tessavar\\Shared", "Kept", RegistryValue::String("no"));
      ::kill(::getpid(), SIGKILL);  // dies holding the lock
      return kRegistryOk;
    });
    ::_exit(3);
  }
  int status = 0;
  ASSERT_EQ(::waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFSIGNALED(status));
  SetStringSetting(store, "After", "", "written");
  EXPECT_EQ(GetStringSetting(store, "Kept", "", ""), "yes");
  FileRegistryStore fresh = MakeStore();
  EXPECT_EQ(GetStringSetting(fresh, "After", "", ""), "written");
}

// Another program in the middle of its transaction: it holds the lock.
class LockHolder {
 public:
  explicit LockHolder(const std::string& settingsPath)
      : m_fd(::open((settingsPath + ".lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600)) {
    EXPECT_GE(m_fd, 0);
    EXPECT_EQ(::flock(m_fd, LOCK_EX), 0);
  }
  ~LockHolder() { Release(); }
  void Release() {
    if (m_fd >= 0) ::close(m_fd);
    m_fd = -1;
  }

 private:
  int m_fd;
};

TEST_F(FileRegistryStoreTest, AWriteNeverWaitsForTheLockAndIsWrittenWhenItIsFree) {
  VirtualTimerService timers;
  FileRegistryStore store(
      path, [this](const std::string& p) { problems.push_back(p); }, &timers);
  SetStringSetting(store, "Before", "", "1");
  LockHolder other(path);

  auto write = std::async(std::launch::async, [&] { SetStringSetting(store, "During", "", "2"); });
  bool returned = write.wait_for(std::chrono::seconds(3)) == std::future_status::ready;
  if (!returned) other.Release();  // let the stuck write finish before failing
  write.get();
  ASSERT_TRUE(returned) << "the write waited for another program's lock";

  // The store answers with its own change at once; the file has not got it.
  EXPECT_EQ(GetStringSetting(store, "During", "", ""), "2");
  EXPECT_TRUE(store.HasPendingChanges());
  EXPECT_EQ(GetStringSetting(*std::make_unique<FileRegistryStore>(path), "During", "", "-"), "-");
  // The other program writes a value of its own before it lets go.
  WriteRaw(ReadRaw() + "\"Other\"=\"3\"\r\n");
  timers.Advance(1000);
  EXPECT_TRUE(store.HasPendingChanges());

  other.Release();
  timers.Advance(FileRegistryStore::kRetryIntervalMs);
  EXPECT_FALSE(store.HasPendingChanges());
  FileRegistryStore fresh = MakeStore();
  EXPECT_EQ(GetStringSetting(fresh, "Before", "", ""), "1");
  EXPECT_EQ(GetStringSetting(fresh, "During", "", ""), "2");
  EXPECT_EQ(GetStringSetting(fresh, "Other", "", ""), "3");
  EXPECT_EQ(problems.size(), 1u);  // one note that the settings were locked
}

TEST_F(FileRegistryStoreTest, WithoutTimersAPendingWriteIsRetriedByLaterCallsAndAtTheEnd) {
  auto store = std::make_unique<FileRegistryStore>(path);
  SetStringSetting(*store, "Before", "", "1");
  {
    LockHolder other(path);
    SetStringSetting(*store, "During", "", "2");
    EXPECT_TRUE(store->HasPendingChanges());
    EXPECT_FALSE(store->WritePendingChanges(std::chrono::milliseconds(20)));
  }
  EXPECT_EQ(GetStringSetting(*store, "During", "", ""), "2");  // a read tries again
  EXPECT_FALSE(store->HasPendingChanges());

  LockHolder briefly(path);
  SetStringSetting(*store, "Last", "", "3");
  std::thread releaser([&] {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    briefly.Release();
  });
  store.reset();  // waits a bounded time for the lock
  releaser.join();
  EXPECT_EQ(GetStringSetting(*std::make_unique<FileRegistryStore>(path), "Last", "", ""), "3");
}

TEST_F(FileRegistryStoreTest, TemporariesLeftByACrashAreRemovedAtStart) {
  pid_t gone = ::fork();
  ASSERT_GE(gone, 0);
  if (gone == 0) ::_exit(0);
  ASSERT_EQ(::waitpid(gone, nullptr, 0), gone);
  WriteRaw("Windows Registry Editor Version 5.00\r\n");
  std::string stale = TemporaryPrefixFor(path) + std::to_string(gone) + "-x1Y2z3";
  std::ofstream(stale) << "half a settings file";
  FileRegistryStore store = MakeStore();
  EXPECT_FALSE(fs::exists(stale));
  EXPECT_TRUE(fs::exists(path));
}

TEST(PlatformPaths, SettingsFileAndDataFolderFollowTheEnvironment) {
  struct Saved {
    const char* name;
    std::optional<std::string> value;
  };
  std::vector<Saved> saved;
  for (const char* name : {"TAV_REGISTRY_FILE", "XDG_CONFIG_HOME", "XDG_DATA_HOME", "HOME"}) {
    const char* value = std::getenv(name);
    saved.push_back({name, value ? std::optional<std::string>(value) : std::nullopt});
  }
  ::setenv("HOME", "/home/show", 1);
  ::unsetenv("TAV_REGISTRY_FILE");
  ::unsetenv("XDG_CONFIG_HOME");
  ::setenv("XDG_DATA_HOME", "relative/ignored", 1);
  EXPECT_EQ(RegistryFilePath(), "/home/show/.config/tessavar/registry.reg");
  EXPECT_EQ(SystemPathDefaults().userDataFolder, "/home/show/.local/share/tessavar/");
  ::setenv("XDG_CONFIG_HOME", "/cfg", 1);
  ::setenv("XDG_DATA_HOME", "/data", 1);
  EXPECT_EQ(RegistryFilePath(), "/cfg/tessavar/registry.reg");
  EXPECT_EQ(SystemPathDefaults().userDataFolder, "/data/tessavar/");
  ::setenv("TAV_REGISTRY_FILE", "/tmp/x.reg", 1);
  EXPECT_EQ(RegistryFilePath(), "/tmp/x.reg");
  PathDefaults defaults = SystemPathDefaults();
  EXPECT_TRUE(defaults.appFolder.ends_with("/src/platform/")) << defaults.appFolder;
  for (const auto& s : saved) {
    if (s.value) {
      ::setenv(s.name, s.value->c_str(), 1);
    } else {
      ::unsetenv(s.name);
    }
  }
}

}  // namespace
}  // namespace tav
