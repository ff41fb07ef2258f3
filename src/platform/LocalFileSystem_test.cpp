// The sequence library's file system on the local disk: a file written piece
// by piece replaces the old one only when committed, all at once.

#include "platform/LocalFileSystem.h"

#include <gtest/gtest.h>

#include <filesystem>

#include "support/testing/Failure.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

TEST(LocalFileSystem, APieceByPieceFileReplacesTheOldOneOnlyWhenCommitted) {
  TempFolder dir;
  auto fs = LocalFileSystem();
  std::string path = dir.Path() + "out.tcs";
  fs->WriteAll(path, "old");
  {
    auto file = fs->OpenForWrite(path);
    file->Append("HEADER");
    file->Append(" and the rest");
    file->WriteAt(0, "header");
    EXPECT_EQ(file->Size(), 19u);
    EXPECT_EQ(fs->ReadAll(path), "old");  // not yet
    file->Commit();
  }
  EXPECT_EQ(fs->ReadAll(path), "header and the rest");

  {
    auto abandoned = fs->OpenForWrite(path);
    abandoned->Append("half");
    EXPECT_NE(testing::FailureOf([&] { abandoned->WriteAt(2, "past the end"); }).number, 0);
  }
  EXPECT_EQ(fs->ReadAll(path), "header and the rest");
  // Nothing left behind but the file itself.
  size_t entries = 0;
  for (const auto& entry : std::filesystem::directory_iterator(dir.Path())) {
    (void)entry;
    ++entries;
  }
  EXPECT_EQ(entries, 1u);
  EXPECT_NE(testing::FailureOf([&] { fs->OpenForWrite(dir.Path() + "no/such/folder/x"); }).number,
            0);
}

}  // namespace
}  // namespace tav
