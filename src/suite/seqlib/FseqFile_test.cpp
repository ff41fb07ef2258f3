#include "suite/seqlib/FseqFile.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <numeric>

#include "platform/LocalFileSystem.h"
#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/FseqWriter.h"
#include "suite/seqlib/SeqErrors.h"
#include "support/testing/TestData.h"

namespace tav {
namespace {

std::string TestDataFile(const std::string& name) {
  return testing::TestDataFile("fseq/" + name);
}

std::unique_ptr<FseqFile> OpenBytes(std::string bytes) {
  return std::make_unique<FseqFile>(std::make_shared<MemoryFile>(std::move(bytes), "test.fseq"));
}

uint8_t Pattern(uint32_t frame, uint32_t channel, uint32_t seed) {
  return static_cast<uint8_t>((channel * 7 + frame * 13 + seed) % 256);
}

struct PublicFile {
  const char* name;
  uint8_t major;
  uint8_t minor;
  FseqFile::Compression compression;
  uint32_t channels;
  uint32_t frames;
  uint32_t stepMs;
  std::vector<FseqFile::SparseRange> ranges;
  const char* media;
  uint32_t seed;
  size_t blocks;
};

class PublicFseqFiles : public ::testing::TestWithParam<PublicFile> {};

TEST_P(PublicFseqFiles, EveryByteMatchesThePattern) {
  const PublicFile& expected = GetParam();
  FseqFile file(LocalFileSystem()->OpenForRead(TestDataFile(expected.name)));
  EXPECT_EQ(file.MajorVersion(), expected.major);
  EXPECT_EQ(file.MinorVersion(), expected.minor);
  EXPECT_EQ(file.CompressionType(), expected.compression);
  EXPECT_EQ(file.ChannelCount(), expected.channels);
  EXPECT_EQ(file.FrameCount(), expected.frames);
  EXPECT_EQ(file.StepMs(), expected.stepMs);
  EXPECT_EQ(file.MediaFilename(), expected.media);
  EXPECT_EQ(file.BlockCount(), expected.blocks);
  ASSERT_EQ(file.Ranges().size(), expected.ranges.size());
  for (size_t r = 0; r < expected.ranges.size(); ++r) {
    EXPECT_EQ(file.Ranges()[r].start, expected.ranges[r].start);
    EXPECT_EQ(file.Ranges()[r].count, expected.ranges[r].count);
  }

  size_t mismatches = 0;
  for (uint32_t f = 0; f < file.FrameCount(); ++f) {
    const uint8_t* frame = file.Frame(f);
    ASSERT_NE(frame, nullptr) << "frame " << f;
    uint32_t stored = 0;
    for (const auto& range : file.Ranges()) {
      for (uint32_t i = 0; i < range.count; ++i, ++stored) {
        if (frame[stored] != Pattern(f, range.start + i, expected.seed) && ++mismatches < 5) {
          ADD_FAILURE() << expected.name << " frame " << f << " channel " << range.start + i;
        }
      }
    }
    EXPECT_EQ(stored, file.ChannelCount());
  }
  EXPECT_EQ(mismatches, 0u);
  EXPECT_EQ(file.Frame(file.FrameCount()), nullptr);
  EXPECT_EQ(file.Frame(UINT32_MAX), nullptr);
}

TEST_P(PublicFseqFiles, RandomAccessBackwardsGivesTheSameBytes) {
  const PublicFile& expected = GetParam();
  FseqFile file(LocalFileSystem()->OpenForRead(TestDataFile(expected.name)));
  for (uint32_t f = file.FrameCount(); f-- > 0;) {
    const uint8_t* frame = file.Frame(f);
    ASSERT_EQ(frame[0], Pattern(f, file.Ranges()[0].start, expected.seed));
    ASSERT_EQ(
        frame[file.ChannelCount() - 1],
        Pattern(f, file.Ranges().back().start + file.Ranges().back().count - 1, expected.seed));
  }
}

using C = FseqFile::Compression;
INSTANTIATE_TEST_SUITE_P(
    TestData, PublicFseqFiles,
    ::testing::Values(
        PublicFile{"v1_basic.fseq", 1, 0, C::None, 512, 100, 50, {{0, 512}}, "", 17, 0},
        PublicFile{"v2_none.fseq", 2, 0, C::None, 1024, 200, 25, {{0, 1024}}, "song.mp3", 42, 0},
        PublicFile{"v2_zstd.fseq", 2, 0, C::Zstd, 1536, 400, 25, {{0, 1536}}, "song.mp3", 99, 10},
        PublicFile{"v2_zlib.fseq", 2, 0, C::Zlib, 600, 150, 50, {{0, 600}}, "", 123, 2},
        PublicFile{
            "v2_sparse.fseq", 2, 2, C::Zstd, 812, 120, 50, {{100, 300}, {2000, 512}}, "", 201, 2}),
    [](const auto& info) {
      std::string name = info.param.name;
      return name.substr(0, name.find('.'));
    });

TEST(FseqFile, ReadsTheProducerHeader) {
  FseqFile file(LocalFileSystem()->OpenForRead(TestDataFile("v2_zstd.fseq")));
  EXPECT_EQ(file.Producer(), "Falcon Player FSEQ writer (test data)");
}

// A small file of our own, built so each damage below has a known place.
std::string SmallFile(FseqFile::Compression compression, uint32_t frames = 30, uint8_t major = 2) {
  FseqWriter::Options options;
  options.major = major;
  options.compression = compression;
  options.framesPerBlock = 8;
  options.media = "C:\\Shows\\song.mp3";
  FseqWriter writer(64, options);
  std::vector<uint8_t> frame(64);
  for (uint32_t f = 0; f < frames; ++f) {
    for (uint32_t c = 0; c < 64; ++c) frame[c] = Pattern(f, c, 5);
    writer.AddFrame(frame.data());
  }
  return writer.Finish();
}

void ReadAllFrames(FseqFile& file) {
  for (uint32_t f = 0; f < file.FrameCount(); ++f) ASSERT_NE(file.Frame(f), nullptr);
}

TEST(FseqFile, WriterOutputReadsBackInEveryCompression) {
  for (auto compression : {C::None, C::Zstd, C::Zlib}) {
    auto file = OpenBytes(SmallFile(compression));
    EXPECT_EQ(file->MediaFilename(), "C:\\Shows\\song.mp3");
    for (uint32_t f = 0; f < 30; ++f) {
      const uint8_t* frame = file->Frame(f);
      for (uint32_t c = 0; c < 64; ++c) ASSERT_EQ(frame[c], Pattern(f, c, 5));
    }
  }
}

// Every prefix of a valid file is either refused at open or refused when
// the missing frames are read; never a crash or a silent wrong byte.
TEST(FseqFile, EveryTruncationGivesAnError) {
  for (auto compression : {C::None, C::Zstd, C::Zlib}) {
    std::string whole = SmallFile(compression);
    for (size_t length = 0; length < whole.size(); ++length) {
      try {
        auto file = OpenBytes(whole.substr(0, length));
        ReadAllFrames(*file);
        ADD_FAILURE() << "no error for " << length << " of " << whole.size() << " bytes";
      } catch (const Error& e) {
        EXPECT_FALSE(e.Description().empty());
      }
    }
  }
}

struct Damage {
  const char* what;
  std::function<void(std::string&)> apply;
  int32_t number;
  const char* words;
};

TEST(FseqFile, DamagedHeadersAreRefusedWithTheReason) {
  std::vector<Damage> cases = {
      {"bad magic", [](std::string& s) { s[0] = 'X'; }, seqerrors::kInvalidFileFormat,
       "not an FSEQ file"},
      {"major 3", [](std::string& s) { s[7] = 3; }, seqerrors::kInvalidFileFormat,
       "major version 3"},
      {"step 0", [](std::string& s) { s[18] = 0; }, seqerrors::kInvalidFileFormat,
       "step time is 0"},
      {"no channels", [](std::string& s) { s[10] = s[11] = s[12] = s[13] = 0; },
       seqerrors::kInvalidFileFormat, "channel count 0"},
      {"data offset inside header", [](std::string& s) { s[4] = 8, s[5] = 0; },
       seqerrors::kInvalidFileFormat, "lies inside"},
      {"index past data offset", [](std::string& s) { s[21] = static_cast<char>(200); },
       seqerrors::kInvalidFileFormat, "run past the channel data offset"},
      {"second block before first", [](std::string& s) { s[32 + 16] = 5; },
       seqerrors::kInvalidFileFormat, "before the block ahead of it"},
      {"first block not at 0", [](std::string& s) { s[32] = 3; }, seqerrors::kInvalidFileFormat,
       "must start at frame 0"},
      {"block longer than file", [](std::string& s) { s[32 + 6] = 0x10; },
       seqerrors::kPastEndOfFile, "truncated"},
      {"frame count too large", [](std::string& s) { s[17] = 0x7F; }, seqerrors::kInvalidFileFormat,
       "more than this reader accepts"},
  };
  for (const auto& damage : cases) {
    std::string bytes = SmallFile(C::Zstd);
    damage.apply(bytes);
    try {
      OpenBytes(bytes);
      ADD_FAILURE() << damage.what << ": opened";
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), damage.number) << damage.what << ": " << e.Description();
      EXPECT_NE(e.Description().find(damage.words), std::string::npos)
          << damage.what << ": " << e.Description();
      EXPECT_NE(e.Description().find("test.fseq"), std::string::npos) << damage.what;
    }
  }
}

TEST(FseqFile, DamagedBlockDataIsAnErrorWhenRead) {
  for (auto compression : {C::Zstd, C::Zlib}) {
    std::string bytes = SmallFile(compression);
    auto dataOffset = static_cast<uint8_t>(bytes[4]) | (static_cast<uint8_t>(bytes[5]) << 8);
    for (size_t i = dataOffset; i < bytes.size(); ++i)
      bytes[i] = static_cast<char>(bytes[i] ^ 0x5A);
    auto file = OpenBytes(bytes);
    EXPECT_THROW(file->Frame(0), Error);
    EXPECT_THROW(file->Frame(29), Error);
  }
}

TEST(FseqFile, ToleratesWhatOtherWritersLeaveBehind) {
  // Unknown minor version and an unknown compression type read as none.
  std::string bytes = SmallFile(C::None);
  bytes[6] = 9;
  bytes[20] = 7;
  auto file = OpenBytes(bytes);
  EXPECT_EQ(file->CompressionType(), C::None);
  EXPECT_EQ(file->Frame(3)[2], Pattern(3, 2, 5));

  // A variable header whose length runs past the header stops parsing.
  bytes = SmallFile(C::None);
  bytes[32] = static_cast<char>(0xF0);
  file = OpenBytes(bytes);
  EXPECT_EQ(file->MediaFilename(), "");
  EXPECT_EQ(file->Frame(1)[0], Pattern(1, 0, 5));
}

TEST(FseqFile, CompressedFlagWithEmptyIndexReadsTheRestAsOneBlock) {
  FseqWriter::Options options;
  options.framesPerBlock = 1000;
  options.firstBlockFrames = 0;
  options.spareIndexEntries = 0;
  FseqWriter writer(16, options);
  std::vector<uint8_t> frame(16);
  for (uint32_t f = 0; f < 20; ++f) {
    for (uint32_t c = 0; c < 16; ++c) frame[c] = Pattern(f, c, 1);
    writer.AddFrame(frame.data());
  }
  std::string bytes = writer.Finish();
  // Zero the one used entry.
  for (int i = 32; i < 40; ++i) bytes[i] = 0;
  auto file = OpenBytes(bytes);
  EXPECT_EQ(file->BlockCount(), 1u);
  EXPECT_EQ(file->Frame(19)[15], Pattern(19, 15, 1));
}

TEST(FseqFile, ExtendedHeaderSuppliesMediaAndBoundsTheData) {
  // v2.2 file whose `mf` payload lies after the channel data.
  std::string bytes = SmallFile(C::Zstd);
  size_t dataOffset = static_cast<uint8_t>(bytes[4]) | (static_cast<uint8_t>(bytes[5]) << 8);
  // Replace the `mf` header (at 32 + 8 * entries) with an ED pointer.
  uint32_t entries = static_cast<uint8_t>(bytes[21]);
  size_t at = 32 + 8 * entries;
  std::string payload = std::string("/home/show/tune.ogg") + '\0';
  uint64_t payloadOffset = bytes.size();
  std::string ed;
  ed += '\x12';
  ed += '\0';
  ed += "EDmf";
  for (int i = 0; i < 8; ++i) ed += static_cast<char>((payloadOffset >> (8 * i)) & 0xFF);
  for (int i = 0; i < 4; ++i) ed += static_cast<char>((payload.size() >> (8 * i)) & 0xFF);
  ASSERT_LE(at + ed.size(), dataOffset);
  bytes.replace(at, ed.size(), ed);
  for (size_t i = at + ed.size(); i < dataOffset; ++i) bytes[i] = 0;
  bytes[6] = 2;
  bytes += payload;
  auto file = OpenBytes(bytes);
  EXPECT_EQ(file->MediaFilename(), "/home/show/tune.ogg");
  EXPECT_EQ(file->Frame(29)[63], Pattern(29, 63, 5));
}

TEST(FseqFile, ReadsEffectSequences) {
  std::string bytes = "ESEQ";
  bytes += std::string("\x01\0\0\0", 4);
  bytes += std::string("\x03\0\0\0", 4);  // 3 channels per frame
  bytes += std::string("\x0B\0\0\0", 4);  // model starts at channel 11 (1-based)
  bytes += std::string("\x03\0\0\0", 4);
  bytes += "abcdefg";  // two whole frames and a stray byte
  auto file = OpenBytes(bytes);
  EXPECT_TRUE(file->IsEffectSequence());
  EXPECT_EQ(file->FrameCount(), 2u);
  EXPECT_EQ(file->StepMs(), 50u);
  EXPECT_EQ(file->Ranges()[0].start, 10u);
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(file->Frame(1)), 3), "def");
}

TEST(FseqFile, MemoryHeldIsAboutOneBlock) {
  FseqWriter::Options options;
  options.framesPerBlock = 20;
  FseqWriter writer(4096, options);
  std::vector<uint8_t> frame(4096);
  for (uint32_t f = 0; f < 400; ++f) {
    for (uint32_t c = 0; c < 4096; ++c) frame[c] = Pattern(f, c, 2);
    writer.AddFrame(frame.data());
  }
  auto file = OpenBytes(writer.Finish());
  for (uint32_t f = 0; f < 400; ++f) file->Frame(f);
  EXPECT_LT(file->MemoryHeld(), 2u * 20 * 4096 + 256 * 1024);
}

}  // namespace
}  // namespace tav
