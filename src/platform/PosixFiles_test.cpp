#include "platform/PosixFiles.h"

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>

#include "support/testing/TempFolder.h"

namespace tav {
namespace {

namespace fs = std::filesystem;

TEST(ReplaceFileContents, WritesThroughSymbolicLinksToTheirTarget) {
  TempFolder dir("tav-posixfiles");
  std::string target = dir.Write("real/settings.reg", "old");
  fs::create_symlink("real/settings.reg", dir / "link1");  // relative to the link's folder
  fs::create_symlink(dir / "link1", dir / "link2");        // a chain of links
  ASSERT_EQ(ReplaceFileContents(dir / "link2", "new"), 0);
  EXPECT_TRUE(fs::is_symlink(dir / "link2"));
  EXPECT_TRUE(fs::is_symlink(dir / "link1"));
  EXPECT_EQ(dir.Read("real/settings.reg"), "new");
  // The temporary went beside the target and is gone.
  EXPECT_EQ(std::distance(fs::directory_iterator(dir / "real"), fs::directory_iterator()), 1);

  // A link whose target does not exist yet makes the target.
  fs::create_symlink("made-later.reg", dir / "dangling");
  ASSERT_EQ(ReplaceFileContents(dir / "dangling", "first"), 0);
  EXPECT_TRUE(fs::is_symlink(dir / "dangling"));
  EXPECT_EQ(dir.Read("made-later.reg"), "first");

  // Links that go round in a circle are refused, and nothing is written.
  fs::create_symlink("loop-b", dir / "loop-a");
  fs::create_symlink("loop-a", dir / "loop-b");
  EXPECT_NE(ReplaceFileContents(dir / "loop-a", "x"), 0);
  EXPECT_TRUE(fs::is_symlink(dir / "loop-a"));
}

TEST(RemoveStaleTemporaries, RemovesOnlyTheTemporariesOfWritersThatAreGone) {
  TempFolder dir("tav-posixfiles");
  pid_t gone = ::fork();
  ASSERT_GE(gone, 0);
  if (gone == 0) ::_exit(0);
  ASSERT_EQ(::waitpid(gone, nullptr, 0), gone);

  std::string prefix = TemporaryPrefixFor("a.tseq.tcs");
  std::string stale = dir.Write(prefix + std::to_string(gone) + "-Ab12Cd", "half");
  std::string live = dir.Write(prefix + std::to_string(::getpid()) + "-Ab12Cd", "busy");
  const std::string kept[] = {
      dir.Write("a.tseq.tcs", "export"),
      dir.Write("a.tseq.backup", "a user's file"),
      dir.Write(prefix + "notapid-Ab12Cd", "not ours"),
      dir.Write(".a.tseq.tcs.tav-tmp-", "not ours"),
  };
  EXPECT_EQ(RemoveStaleTemporaries(dir.Path()), 1);
  EXPECT_FALSE(fs::exists(stale));
  EXPECT_TRUE(fs::exists(live));
  for (const auto& path : kept) EXPECT_TRUE(fs::exists(path)) << path;
  EXPECT_EQ(RemoveStaleTemporaries(dir / "no-such-folder"), 0);
}

TEST(ReplaceFileContents, ReportsProgressWhileWritingAndSyncing) {
  TempFolder dir("tav-posixfiles");
  int calls = 0;
  std::string bytes(3 * 1024 * 1024 + 5, 'x');
  ASSERT_EQ(ReplaceFileContents(dir / "big", bytes, nullptr, [&] { ++calls; }), 0);
  // Every mebibyte written, then after the sync, the rename and the folder's sync.
  EXPECT_GE(calls, 4 + 3);
  EXPECT_EQ(fs::file_size(dir / "big"), bytes.size());
}

}  // namespace
}  // namespace tav
