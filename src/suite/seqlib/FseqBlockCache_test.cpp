#include "suite/seqlib/FseqBlockCache.h"

#include <gtest/gtest.h>

#include "platform/LocalFileSystem.h"
#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/FseqFile.h"
#include "support/testing/TestData.h"

namespace tav {
namespace {

// Counts the reads that reach the file behind it.
class CountingFile : public RandomAccessFile {
 public:
  explicit CountingFile(std::shared_ptr<const RandomAccessFile> file) : m_file(std::move(file)) {}
  uint64_t Size() const override { return m_file->Size(); }
  size_t ReadAt(uint64_t offset, void* buffer, size_t count) const override {
    m_bytesRead += count;
    return m_file->ReadAt(offset, buffer, count);
  }
  const std::string& Name() const override { return m_file->Name(); }
  size_t BytesRead() const { return m_bytesRead; }

 private:
  std::shared_ptr<const RandomAccessFile> m_file;
  mutable size_t m_bytesRead = 0;
};

TEST(FseqBlockCache, KeepsTheMostRecentlyUsedWithinItsLimit) {
  FseqBlockCache cache(250);
  cache.Keep("a.fseq", 1000, 0, std::vector<uint8_t>(100, 1));
  cache.Keep("a.fseq", 1000, 500, std::vector<uint8_t>(100, 2));
  ASSERT_NE(cache.Find("a.fseq", 1000, 0), nullptr);  // now the most recent
  cache.Keep("b.fseq", 1000, 0, std::vector<uint8_t>(100, 3));
  EXPECT_EQ(cache.BytesHeld(), 200u);
  EXPECT_EQ(cache.Find("a.fseq", 1000, 500), nullptr) << "the least recently used goes";
  EXPECT_EQ(cache.Find("a.fseq", 1000, 0)->at(0), 1);
  EXPECT_EQ(cache.Find("b.fseq", 1000, 0)->at(0), 3);
  // The same name with another size is another file.
  EXPECT_EQ(cache.Find("b.fseq", 999, 0), nullptr);
  // A block larger than the whole limit is handed back but not kept.
  auto big = cache.Keep("c.fseq", 1000, 0, std::vector<uint8_t>(300, 4));
  EXPECT_EQ(big->size(), 300u);
  EXPECT_EQ(cache.Find("c.fseq", 1000, 0), nullptr);
  EXPECT_EQ(cache.BytesHeld(), 200u);
}

TEST(FseqBlockCache, ASecondReaderOfTheSameFileInflatesNothing) {
  for (const char* name : {"v2_zstd.fseq", "v2_zlib.fseq"}) {
    auto cache = std::make_shared<FseqBlockCache>(64u << 20);
    std::shared_ptr<const RandomAccessFile> disk =
        LocalFileSystem()->OpenForRead(testing::TestDataFile(std::string("fseq/") + name));
    std::vector<std::vector<uint8_t>> frames;
    {
      FseqFile first(std::make_shared<CountingFile>(disk));
      first.SetBlockCache(cache);
      for (uint32_t f = 0; f < first.FrameCount(); ++f)
        frames.emplace_back(first.Frame(f), first.Frame(f) + first.ChannelCount());
    }
    auto counting = std::make_shared<CountingFile>(disk);
    FseqFile second(counting);
    second.SetBlockCache(cache);
    size_t headerBytes = counting->BytesRead();
    // Backwards, so that every block is looked up anew.
    for (uint32_t f = second.FrameCount(); f-- > 0;) {
      const uint8_t* frame = second.Frame(f);
      ASSERT_TRUE(std::equal(frames[f].begin(), frames[f].end(), frame)) << name << " frame " << f;
    }
    EXPECT_EQ(counting->BytesRead(), headerBytes) << name;
  }
}

}  // namespace
}  // namespace tav
