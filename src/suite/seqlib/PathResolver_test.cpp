#include "suite/seqlib/PathResolver.h"

#include <gtest/gtest.h>

#include <filesystem>

#include "platform/LocalFileSystem.h"
#include "suite/seqlib/PlaybackFileCreator.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

class Resolving : public ::testing::Test {
 protected:
  TempFolder dir;
  std::shared_ptr<FileSystem> fs = LocalFileSystem();
  std::shared_ptr<PathResolver> resolver =
      std::make_shared<PathResolver>(fs, PathResolver::DefaultFolders(dir.Path()));
  std::string seq = dir.Path() + "Sequences/";
  std::string media = dir.Path() + "Media/";
};

TEST_F(Resolving, FindsNamesInTheFolderOfTheirKind) {
  dir.Write("Sequences/carol.fseq", "PSEQ");
  dir.Write("Sequences/sub/intro.tseq", "{}");
  dir.Write("Sequences/only-export.tseq.tcs", "TCS");
  dir.Write("Media/song.mp3", "ID3");
  dir.Write("elsewhere/local.tseq", "{}");
  struct Case {
    std::string name;
    int32_t kind;
    std::string expected;
  };
  const Case cases[] = {
      {"", 2, ""},
      {"carol.fseq", 2, seq + "carol.fseq"},
      {"sub\\intro.tseq", 2, seq + "sub/intro.tseq"},
      {"sub/intro.tseq", 2, seq + "sub/intro.tseq"},
      {dir.Path() + "elsewhere/local.tseq", 2, dir.Path() + "elsewhere/local.tseq"},
      // Written on another machine: found by base name.
      {"C:\\Shows\\carol.fseq", 2, seq + "carol.fseq"},
      {"\\\\server\\share\\carol.fseq", 2, seq + "carol.fseq"},
      {"/home/someone/Shows/carol.fseq", 2, seq + "carol.fseq"},
      {"C:\\Shows\\CAROL.FSEQ", 2, seq + "carol.fseq"},
      // A sequence is there when its export is.
      {"only-export.tseq", 2, seq + "only-export.tseq"},
      {"song.mp3", 3, media + "song.mp3"},
      {"D:\\Music\\song.mp3", 3, media + "song.mp3"},
      {"song.mp3", 2, seq + "song.mp3"},
      // Nothing found: where it would be, or the absolute name as given.
      {"missing.tseq", 2, seq + "missing.tseq"},
      {"C:\\Shows\\missing.tseq", 2, seq + "missing.tseq"},
      {"/nowhere/missing.tseq", 2, "/nowhere/missing.tseq"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(resolver->ResolvePath(c.name, c.kind), c.expected) << c.name << " kind " << c.kind;
  }
}

// The local file system, counting the folder listings asked of it.
class CountingFileSystem : public FileSystem {
 public:
  explicit CountingFileSystem(std::shared_ptr<FileSystem> inner) : m_inner(std::move(inner)) {}
  FileStatus Stat(const std::string& path) const override { return m_inner->Stat(path); }
  std::unique_ptr<RandomAccessFile> OpenForRead(const std::string& path) const override {
    return m_inner->OpenForRead(path);
  }
  void WriteAll(const std::string& path, std::string_view bytes) override {
    m_inner->WriteAll(path, bytes);
  }
  std::vector<std::string> ListDirectory(const std::string& path) const override {
    ++listings;
    return m_inner->ListDirectory(path);
  }
  mutable int listings = 0;

 private:
  std::shared_ptr<FileSystem> m_inner;
};

TEST_F(Resolving, TheFolderIsListedOnceUntilItChanges) {
  dir.Write("Sequences/Carol.tseq", "{}");
  auto counting = std::make_shared<CountingFileSystem>(fs);
  PathResolver cached(counting, PathResolver::DefaultFolders(dir.Path()));
  for (const char* name : {"C:\\a\\missing.tseq", "gone.tseq", "C:\\b\\CAROL.TSEQ", "x.tseq"}) {
    cached.ResolvePath(name, PathResolver::kKindSequence);
  }
  EXPECT_EQ(cached.ResolvePath("carol.tseq", 2), seq + "Carol.tseq");
  EXPECT_EQ(counting->listings, 1);

  // A file added later is found once the folder's time says it changed.
  dir.Write("Sequences/Noel.tseq", "{}");
  dir.SetModified("Sequences", 2000000000);
  EXPECT_EQ(cached.ResolvePath("D:\\x\\noel.TSEQ", 2), seq + "Noel.tseq");
  EXPECT_EQ(cached.ResolvePath("gone.tseq", 2), seq + "gone.tseq");
  EXPECT_EQ(counting->listings, 2);
  // A listed file that went away is not reported as found.
  std::filesystem::remove(seq + "Noel.tseq");
  dir.SetModified("Sequences", 2000000000);
  EXPECT_EQ(cached.ResolvePath("noel.tseq", 2), seq + "noel.tseq");
}

TEST_F(Resolving, FoldersComeFromTheLookupAtEachUse) {
  std::string folder = dir.Path() + "one";
  PathResolver custom(fs, [&](int32_t) { return folder; });
  EXPECT_EQ(custom.ResolvePath("a.tseq", 2), dir.Path() + "one/a.tseq");
  folder = dir.Path() + "two\\";
  EXPECT_EQ(custom.ResolvePath("a.tseq", 2), dir.Path() + "two/a.tseq");
}

TEST_F(Resolving, PlaybackFileForANameThatExistsInTheFolder) {
  dir.Write("Sequences/carol.fseq", "PSEQ");
  PlaybackFileCreator creator(fs, resolver);
  auto as = creator.PreparePlaybackFile(seq + "carol.fseq");
  EXPECT_EQ(as.errorCount, 0);
  EXPECT_FALSE(as.created);
  EXPECT_EQ(as.playbackFilename, seq + "carol.fseq");

  auto foreign = creator.PreparePlaybackFile("C:\\Shows\\carol.fseq");
  EXPECT_EQ(foreign.errorCount, 0);
  EXPECT_TRUE(foreign.created);
  EXPECT_EQ(foreign.playbackFilename, seq + "carol.fseq");
  EXPECT_EQ(foreign.informationMessage, "Playing " + seq + "carol.fseq for C:\\Shows\\carol.fseq");
}

TEST_F(Resolving, PlaybackFileInAnotherFormat) {
  dir.Write("Sequences/Carol.tseq", "{}");
  dir.Write("Sequences/carol.fseq.tcs", "TCS");
  dir.Write("Sequences/other.fseq", "PSEQ");
  PlaybackFileCreator creator(fs, resolver);
  auto result = creator.PreparePlaybackFile("C:\\Shows\\carol.eseq");
  EXPECT_EQ(result.errorCount, 0);
  EXPECT_TRUE(result.created);
  EXPECT_EQ(result.playbackFilename, seq + "Carol.tseq");
  EXPECT_EQ(result.warningCount, 1);
  EXPECT_EQ(result.warningText,
            "Other files could also stand in for C:\\Shows\\carol.eseq: " + seq + "carol.fseq.tcs");
}

TEST_F(Resolving, PlaybackFileErrorWhenNothingStandsIn) {
  dir.Write("Sequences/other.fseq", "PSEQ");
  PlaybackFileCreator creator(fs, resolver);
  auto result = creator.PreparePlaybackFile("carol.fseq");
  EXPECT_EQ(result.errorCount, 1);
  EXPECT_EQ(result.errorText,
            "No playable file found for carol.fseq (looked for carol in " + seq + ")");
  EXPECT_EQ(result.playbackFilename, "");
  EXPECT_EQ(creator.PreparePlaybackFile("").errorCount, 1);
}

}  // namespace
}  // namespace tav
