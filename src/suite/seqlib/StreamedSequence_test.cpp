// Sequences read and written a block of frames at a time: the export's
// streaming reader and writer, FSEQ files as streams, the plain writer, and
// the track groups they move frames in.

#include "suite/seqlib/StreamedSequence.h"

#include <gtest/gtest.h>

#include "suite/seqlib/CompressedSequence.h"
#include "suite/seqlib/CompressedSequenceReader.h"
#include "suite/seqlib/CompressedSequenceWriter.h"
#include "suite/seqlib/FseqConversion.h"
#include "suite/seqlib/FseqWriter.h"
#include "suite/seqlib/PlainSequence.h"
#include "suite/seqlib/PlainSequenceWriter.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SequenceSummary.h"
#include "support/testing/Failure.h"

namespace tav {
namespace {

using testing::FailureOf;

// Counts the bytes read, to show what a reader touches.
class CountingFile : public RandomAccessFile {
 public:
  explicit CountingFile(std::string bytes) : m_file(std::move(bytes), "counted.tcs") {}
  uint64_t Size() const override { return m_file.Size(); }
  size_t ReadAt(uint64_t offset, void* buffer, size_t count) const override {
    size_t got = m_file.ReadAt(offset, buffer, count);
    m_read += got;
    return got;
  }
  const std::string& Name() const override { return m_file.Name(); }
  uint64_t BytesRead() const { return m_read; }

 private:
  MemoryFile m_file;
  mutable uint64_t m_read = 0;
};

// Sets the header's count of bytes after it to what the file holds.
void KeepHeaderSizeRight(std::string& bytes) {
  uint64_t after = bytes.size() - kCompressedHeaderBytes;
  for (int i = 0; i < 8; ++i) bytes[24 + i] = static_cast<char>(after >> (8 * i));
}

LevelTrack Track(int32_t family, int32_t network, int32_t first, int32_t count, int64_t start,
                 int32_t step, uint32_t frames, uint8_t seed) {
  LevelTrack t{family, network, family == kFamilyTAV ? 3 : 0, first, count, start, step, {}};
  // Levels that do not compress away, so blocks have real size.
  uint32_t state = seed * 2654435761u + 1;
  for (uint32_t k = 0; k < frames * static_cast<uint32_t>(count); ++k) {
    state = state * 1664525u + 1013904223u;
    t.levels.push_back(static_cast<uint8_t>(state >> 24));
  }
  return t;
}

// Three groups: two DMX tracks sharing their frames, a TAV track of its own
// timing, and a DMX track at the first timing again (not next to its kind).
CompiledSequence Sample(uint32_t frames = 30) {
  CompiledSequence s;
  s.lengthMs = 5000;
  s.media = "song.mp3";
  s.sourceHash = 42;
  s.subsequences = {{"intro.tseq", 100}};
  s.channels.push_back({{kFamilyTAV, 1, 2, 3}, "Roof"});
  s.effects.push_back({0, 0, 0, kEffectSet, 50, 50, 0});
  s.effects.push_back({1000, 0, 2000, kEffectFade, 50, 0, 0});
  s.tracks.push_back(Track(kFamilyDMX, 1, 1, 512, 0, 25, frames, 1));
  s.tracks.push_back(Track(kFamilyDMX, 2, 1, 300, 0, 25, frames, 2));
  s.tracks.push_back(Track(kFamilyTAV, 1, 1, 4, 1000, 100, 7, 3));
  s.tracks.push_back(Track(kFamilyDMX, 3, 10, 20, 0, 25, frames, 4));
  return s;
}

TEST(TrackGroup, NeighboursOfOneKindAndTimingShareFrames) {
  auto groups = GroupTracks(Sample().tracks);
  ASSERT_EQ(groups.size(), 3u);
  EXPECT_EQ(groups[0].tracks.size(), 2u);
  EXPECT_EQ(groups[0].FrameBytes(), 812u);
  EXPECT_TRUE(groups[0].tracks[0].levels.empty());
  EXPECT_EQ(groups[1].startMs, 1000);
  EXPECT_EQ(groups[2].tracks[0].network, 3);
}

TEST(TrackGroup, TimelineFramesCountEachMomentOnce) {
  auto alike = GroupTracks(
      {Track(kFamilyDMX, 1, 1, 1, 0, 50, 4, 0), Track(kFamilyTAV, 1, 1, 1, 0, 50, 6, 0)});
  EXPECT_EQ(TimelineFrameCount(alike), 6u);
  EXPECT_EQ(LevelBlockCount(alike), 10u);
  EXPECT_EQ(CommonStepMs(alike), 50);
  // 0, 50, 100 and 75, 100, 125: five moments.
  auto mixed = GroupTracks(
      {Track(kFamilyDMX, 1, 1, 1, 0, 50, 3, 0), Track(kFamilyDMX, 2, 1, 1, 75, 25, 3, 0)});
  EXPECT_EQ(TimelineFrameCount(mixed), 5u);
  EXPECT_EQ(CommonStepMs(mixed), 0);
  struct {
    size_t index;
    int64_t time;
  } times[] = {{0, 0}, {1, 50}, {2, 75}, {3, 100}, {4, 125}, {5, -1}};
  for (auto c : times) EXPECT_EQ(TimelineFrameTime(mixed, c.index), c.time) << c.index;
  struct {
    int64_t ms;
    int64_t frame;
  } at[] = {{-1, -1}, {0, 0}, {74, 1}, {75, 2}, {130, 4}, {9999, 4}};
  for (auto c : at) EXPECT_EQ(TimelineFrameAt(mixed, c.ms), c.frame) << c.ms;
  EXPECT_EQ(TimelineFrameAt(alike, 125), 2);
}

TEST(SequenceSummary, CountsEveryAddressOnceAndFramesOnTheTimeline) {
  CompiledSequence s = Sample(10);
  // A DMX effect channel inside a track's slots, and one beside them.
  s.channels.push_back({{kFamilyDMX, 1, 0, 5}, "inside"});
  s.channels.push_back({{kFamilyDMX, 9, 0, 5}, "beside"});
  SequenceSummary summary = Summarize(s, GroupTracks(s.tracks));
  EXPECT_EQ(summary.effectCount, 2u);
  EXPECT_EQ(summary.frameTracks, 4u);
  EXPECT_EQ(summary.levelBlocks, 3u * 10 + 7);
  EXPECT_EQ(summary.timelineFrames, 10u + 7);  // 0-225 by 25, 1000-1600 by 100
  EXPECT_EQ(summary.stepMs, 0);
  EXPECT_EQ(summary.addressesPerFamily[kFamilyDMX], 512u + 300 + 20 + 1);
  EXPECT_EQ(summary.addressesPerFamily[kFamilyTAV], 4u + 1);
  EXPECT_EQ(summary.dmxUniverses, (std::set<int32_t>{1, 2, 3, 9}));
}

TEST(CompressedExport, GroupsAndBlocksReadBackTrackForTrack) {
  CompiledSequence s = Sample(3000);
  std::string bytes = WriteCompressedSequence(s);
  CompressedSequenceReader reader(std::make_shared<MemoryFile>(bytes, "a.tcs"));
  ASSERT_EQ(reader.Groups().size(), 3u);
  EXPECT_GT(reader.FramesPerBlock()[0], 1u);
  EXPECT_LT(reader.FramesPerBlock()[0], 3000u);  // the big group spans several blocks
  EXPECT_EQ(ReadWhole(reader), s);
  EXPECT_EQ(ReadCompressedSequence(bytes, "a.tcs"), s);
}

TEST(CompressedExport, OpeningReadsTheHeadAndNoFrames) {
  std::string bytes = WriteCompressedSequence(Sample(3000));
  auto file = std::make_shared<CountingFile>(bytes);
  CompressedSequenceReader reader(file);
  EXPECT_EQ(reader.Head().media, "song.mp3");
  EXPECT_EQ(reader.Head().effects.size(), 2u);
  EXPECT_EQ(reader.Head().sourceHash, 42u);
  EXPECT_TRUE(reader.Head().tracks.empty());
  // The head lies in the first few hundred bytes; one read chunk at most.
  EXPECT_LE(file->BytesRead(), 64u * 1024 + 64);
  EXPECT_LT(file->BytesRead(), bytes.size());
  EXPECT_LT(reader.MemoryHeld(), 512u * 1024);
}

TEST(CompressedExport, FramesAtHoldsTheFrameOnShowOfEachTrack) {
  auto shared = std::make_shared<CompiledSequence>(Sample(40));
  CompressedSequenceReader reader(
      std::make_shared<MemoryFile>(WriteCompressedSequence(*shared), "a.tcs"));
  CompiledSequence at = FramesAt(reader, 1230);
  EXPECT_EQ(at.effects, shared->effects);
  // DMX tracks end at 1000; the TAV track runs 1000-1700 and shows frame 2.
  ASSERT_EQ(at.tracks.size(), 1u);
  EXPECT_EQ(at.tracks[0].startMs, 1200);
  const LevelTrack& tav = shared->tracks[2];
  EXPECT_EQ(at.tracks[0].levels,
            std::vector<uint8_t>(tav.levels.begin() + 8, tav.levels.begin() + 12));

  CompiledStreamedSequence memory(shared);
  CompiledSequence early = FramesAt(memory, 510);
  ASSERT_EQ(early.tracks.size(), 3u);  // the three DMX tracks, frame 20
  EXPECT_EQ(early.tracks[1].levels[0], shared->tracks[1].levels[20 * 300]);
}

TEST(CompressedExport, DamageNamesTheFramesOfTheBlock) {
  std::string bytes = WriteCompressedSequence(Sample(3000));
  std::string damaged = bytes;
  damaged[damaged.size() - 40] ^= 0x5A;  // inside the last block
  CompressedSequenceReader reader(std::make_shared<MemoryFile>(damaged, "bad.tcs"));
  auto failure = FailureOf([&] { ReadWhole(reader); });
  EXPECT_NE(failure.number, 0);
  EXPECT_NE(failure.description.find("bad.tcs: frames "), std::string::npos) << failure.description;
  EXPECT_NE(failure.description.find("of track group 2"), std::string::npos) << failure.description;

  auto stray = FailureOf([&] {
    std::string longer = bytes + "x";
    KeepHeaderSizeRight(longer);  // so that only the stray byte is wrong
    CompressedSequenceReader r(std::make_shared<MemoryFile>(longer, "x.tcs"));
    ReadWhole(r);
  });
  EXPECT_NE(stray.description.find("stray bytes after the last block"), std::string::npos)
      << stray.description;
}

TEST(CompressedExport, OlderAndNewerVersionsAreRefusedAndCountAsOutOfDate) {
  std::string bytes = WriteCompressedSequence(Sample());
  for (char version : {1, 3}) {
    std::string other = bytes;
    other[4] = version;
    auto failure = FailureOf([&] { ReadCompressedSequence(other, "x.tcs"); });
    EXPECT_NE(failure.description.find("version " + std::to_string(version) +
                                       " is not one this program reads"),
              std::string::npos);
    EXPECT_FALSE(ReadCompressedSourceHash(other.substr(0, 40)).has_value());
  }
  EXPECT_EQ(ReadCompressedSourceHash(bytes.substr(0, 40)), 42u);
}

TEST(CompressedExport, AHeadPromisingMoreLevelsThanTheFileCanHoldIsRefused) {
  CompiledSequence s;
  s.tracks.push_back(Track(kFamilyDMX, 1, 1, 512, 0, 25, 2, 0));
  std::string bytes = WriteCompressedSequence(s);
  // Rewrite the head with a frame count of 4 billion.
  CompressedSequenceReader reader(std::make_shared<MemoryFile>(bytes, "a.tcs"));
  CompiledSequence head = reader.Head();
  std::vector<TrackGroup> groups = reader.Groups();
  groups[0].frameCount = 4000000000u;
  MemoryWritableFile out;
  CompressedSequenceWriter writer(out, head, groups);
  std::string forged =
      bytes.substr(0, 40) + out.Bytes().substr(40) + bytes.substr(reader.Position());
  KeepHeaderSizeRight(forged);
  auto failure = FailureOf(
      [&] { CompressedSequenceReader(std::make_shared<MemoryFile>(forged, "forged.tcs")); });
  EXPECT_NE(failure.description.find("promise 2048000000000 bytes of levels"), std::string::npos)
      << failure.description;
}

TEST(CompressedExport, WriterRefusesTooFewOrTooManyFrames) {
  CompiledSequence s = Sample(4);
  std::vector<uint8_t> frame(812);
  MemoryWritableFile out;
  CompressedSequenceWriter writer(out, s, GroupTracks(s.tracks));
  writer.AddFrame(frame.data());
  EXPECT_NE(FailureOf([&] { writer.Finish(); }).number, 0);

  CompiledSequence none;
  MemoryWritableFile empty;
  CompressedSequenceWriter nothing(empty, none, {});
  EXPECT_NE(FailureOf([&] { nothing.AddFrame(frame.data()); }).number, 0);
  nothing.Finish();
  EXPECT_EQ(ReadCompressedSequence(empty.Bytes(), "empty.tcs"), none);
}

TEST(PlainStream, WritesEachGroupAsItComesAndReadsBackTheSameTracks) {
  CompiledSequence s = Sample(5);
  s.tracks.push_back(Track(kFamilyTAV, 2, 1, 3, 40, 10, 0, 9));  // a track of no frames
  s.subsequences.clear();
  auto shared = std::make_shared<const CompiledSequence>(s);
  CompiledStreamedSequence source(shared);
  MemoryWritableFile out;
  WritePlainSequence(source, out);
  SequenceData back = ParsePlainSequence(out.Bytes(), "p.tseq");
  EXPECT_EQ(back.tracks, s.tracks);
  EXPECT_EQ(Compile(back, {}).effects, s.effects);
  EXPECT_EQ(back.media, "song.mp3");
  // Four frame entries: the two DMX tracks share one.
  size_t entries = 0;
  for (size_t at = out.Bytes().find("\"step_ms\""); at != std::string::npos;
       at = out.Bytes().find("\"step_ms\"", at + 1)) {
    ++entries;
  }
  EXPECT_EQ(entries, 4u);

  PlainSequenceWriter writer(out, {}, GroupTracks(s.tracks));
  EXPECT_NE(FailureOf([&] { writer.Finish(); }).number, 0);  // frames still to come
}

// A sparse FSEQ file of 3 universe pieces, frame f channel c = f * 3 + c.
std::string SparseFseq(uint32_t frames) {
  FseqWriter::Options options;
  options.stepMs = 40;
  options.framesPerBlock = 7;
  options.media = "tune.ogg";
  options.ranges = {{500, 30}, {2000, 10}};
  FseqWriter writer(40, options);
  std::vector<uint8_t> frame(40);
  for (uint32_t f = 0; f < frames; ++f) {
    for (uint32_t c = 0; c < 40; ++c) frame[c] = static_cast<uint8_t>(f * 3 + c);
    writer.AddFrame(frame.data());
  }
  return writer.Finish();
}

TEST(FseqStream, ConvertsBlockByBlockToWhatTheWholeReadGives) {
  std::string fseq = SparseFseq(50);
  auto open = [&] {
    return std::make_unique<FseqFile>(std::make_shared<MemoryFile>(fseq, "s.fseq"));
  };
  auto map = UniverseMap::Uniform();
  FseqStreamedSequence stream(open(), map, 7);
  ASSERT_EQ(stream.Groups().size(), 1u);
  EXPECT_EQ(stream.Groups()[0].tracks.size(), 3u);  // 500-511 | 512-529 | 2000-2009
  EXPECT_EQ(stream.Head().media, "tune.ogg");
  EXPECT_EQ(stream.Head().lengthMs, 2000);

  MemoryWritableFile tcs;
  WriteCompressedSequence(stream, tcs);
  auto fromFile = open();
  CompiledSequence whole = Compile(FseqToSequenceData(*fromFile, map), {});
  whole.sourceHash = 7;
  EXPECT_EQ(ReadCompressedSequence(tcs.Bytes(), "s.tcs"), whole);

  CompressedSequenceReader reader(std::make_shared<MemoryFile>(tcs.Bytes(), "s.tcs"));
  MemoryWritableFile plain;
  WritePlainSequence(reader, plain);
  EXPECT_NE(plain.Bytes().find("\"dmx\": [{\"universe\":1,\"first_slot\":501,\"count\":12},"),
            std::string::npos);
  SequenceData back = ParsePlainSequence(plain.Bytes(), "s.tseq");
  EXPECT_EQ(back.tracks, whole.tracks);
  EXPECT_EQ(back.media, "tune.ogg");
}

TEST(FseqStream, SkipsStraightToTheFrameAsked) {
  std::string fseq = SparseFseq(50);
  FseqStreamedSequence stream(
      std::make_unique<FseqFile>(std::make_shared<MemoryFile>(fseq, "s.fseq")),
      UniverseMap::Uniform());
  CompiledSequence at = FramesAt(stream, 40 * 33 + 5);
  ASSERT_EQ(at.tracks.size(), 3u);
  EXPECT_EQ(at.tracks[0].startMs, 40 * 33);
  EXPECT_EQ(at.tracks[0].levels[0], static_cast<uint8_t>(33 * 3));
  EXPECT_EQ(at.tracks[2].levels[0], static_cast<uint8_t>(33 * 3 + 30));
  EXPECT_EQ(stream.NextFrame()[0], static_cast<uint8_t>(34 * 3));
}

}  // namespace
}  // namespace tav
