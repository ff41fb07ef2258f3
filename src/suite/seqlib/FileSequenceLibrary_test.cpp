#include "suite/seqlib/FileSequenceLibrary.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>

#include "platform/LocalFileSystem.h"
#include "ports/testing/ManualClock.h"
#include "suite/seqlib/CompressedSequenceWriter.h"
#include "suite/seqlib/FseqWriter.h"
#include "suite/seqlib/PlainSequence.h"
#include "suite/seqlib/SeqErrors.h"
#include "support/testing/TempFolder.h"
#include "support/testing/TestData.h"

namespace tav {
namespace {

std::string TestDataFile(const std::string& name) {
  return testing::TestDataFile("fseq/" + name);
}

const char* kMain = R"({
  "tessavar_sequence": 1,
  "media": "tune.ogg",
  "shell_command": "echo go",
  "channels": [{"name": "Roof", "tav": {"network": 1, "unit": 2, "circuit": 3},
                "effects": [{"at": 0, "type": "set", "level": 60}, {"at": 900, "type": "off"}]}],
  "subsequences": [{"file": "intro.tseq", "offset_ms": 300}]
})";

const char* kIntro = R"({
  "tessavar_sequence": 1,
  "length_ms": 1000,
  "channels": [{"name": "Porch", "x10": {"house": "B", "unit": 4},
                "effects": [{"at": 100, "type": "fade", "duration": 200, "from": 0, "to": 100}]}],
  "frames": [{"dmx": {"universe": 2, "first_slot": 5, "count": 2}, "step_ms": 100, "levels": ["0102", "0304"]}]
})";

class Library : public ::testing::Test {
 protected:
  std::vector<PlayEvent> PlayAll(Sequence& sequence, uint32_t ms) {
    std::vector<PlayEvent> events;
    sequence.InitializeForPlay(false);
    sequence.StartPlay();
    PlayEvent e;
    for (uint32_t t = 0; t <= ms; ++t) {
      while (sequence.GetEvent(e)) events.push_back(e);
      clock->AdvanceMilliseconds(1);
    }
    return events;
  }

  TempFolder dir;
  std::shared_ptr<ManualClock> clock = std::make_shared<ManualClock>();
  std::shared_ptr<FileSystem> fs = LocalFileSystem();
  std::shared_ptr<PathResolver> resolver =
      std::make_shared<PathResolver>(fs, PathResolver::DefaultFolders(dir.Path()));
  FileSequenceLibrary library{clock, fs, resolver};
};

TEST_F(Library, LoadsAPlainSequenceWithItsSubsequence) {
  std::string path = dir.Write("show/main.tseq", kMain);
  dir.Write("Sequences/intro.tseq", kIntro);  // found through the resolver
  auto sequence = library.CreateSequence();
  sequence->LoadFile(path);
  EXPECT_EQ(sequence->Info().format, "plain");
  EXPECT_EQ(sequence->MediaFilename(), "tune.ogg");
  EXPECT_EQ(sequence->ShellCommand(), "echo go");
  EXPECT_EQ(sequence->SubsequenceNames(), std::vector<std::string>{"intro.tseq"});
  EXPECT_TRUE(sequence->UsesTAV());
  EXPECT_TRUE(sequence->UsesX10());
  EXPECT_FALSE(sequence->UsesFennick());
  EXPECT_TRUE(sequence->UsesDMX());
  EXPECT_EQ(sequence->Info().lengthMs, 1300);

  auto events = PlayAll(*sequence, 1300);
  std::vector<std::pair<int64_t, int32_t>> got;
  for (const auto& e : events) got.emplace_back(e.lDueTime, e.devType);
  EXPECT_EQ(got, (std::vector<std::pair<int64_t, int32_t>>{{0, kFamilyTAV},
                                                           {300, kFamilyDMX},
                                                           {400, kFamilyX10},
                                                           {400, kFamilyDMX},
                                                           {900, kFamilyTAV}}));
  EXPECT_EQ(events[2].lNetwork, 2);  // house B
  EXPECT_EQ(events[2].lCircuit, 4);
  EXPECT_EQ(events[1].byteIntensityBlob, (std::vector<uint8_t>{1, 2}));
  EXPECT_EQ(events[1].nIntensityBlobStartAddress, 5);
}

TEST_F(Library, EveryFormatOpensAsAStreamOfTheSameFrames) {
  std::string plain = dir.Write("show/main.tseq", kMain);
  dir.Write("Sequences/intro.tseq", kIntro);
  std::string fseq = TestDataFile("v2_sparse.fseq");
  struct {
    std::string path;
    const char* format;
  } files[] = {{plain, "plain"}, {fseq, "fseq"}};
  for (const auto& f : files) {
    EXPECT_EQ(library.FormatOf(f.path), f.format);
    // Written as an export by streaming, then read back as one.
    auto out = fs->OpenForWrite(dir / "copy.tcs");
    auto source = library.OpenStreamed(f.path, true);
    WriteCompressedSequence(*source, *out);
    out->Commit();
    EXPECT_EQ(library.FormatOf(dir / "copy.tcs"), "tcs");
    auto whole = library.LoadCompiled(f.path);
    CompiledSequence copy = ReadWhole(*library.OpenStreamed(dir / "copy.tcs"));
    EXPECT_EQ(copy.tracks, whole->tracks) << f.path;
    EXPECT_EQ(copy.effects, whole->effects) << f.path;
    EXPECT_EQ(copy.sourceHash, whole->sourceHash) << f.path;
  }
  // Without asking, an FSEQ file is not read through for its hash.
  EXPECT_EQ(library.OpenStreamed(fseq)->Head().sourceHash, 0u);
  EXPECT_EQ(library.LoadContent(fseq)->info.frameCount, 120u);
  EXPECT_EQ(library.LoadContent(fseq)->info.levelBlockCount, 360u);
}

TEST_F(Library, SubsequenceBesideTheIncludingFileWins) {
  std::string path = dir.Write("show/main.tseq", kMain);
  dir.Write("Sequences/intro.tseq", "{\"tessavar_sequence\": 1, \"length_ms\": 50}");
  dir.Write("show/intro.tseq", kIntro);
  auto content = library.LoadContent(path);
  EXPECT_EQ(content->info.lengthMs, 1300);
}

TEST_F(Library, SubsequenceProblemsAreNamed) {
  std::string path = dir.Write("main.tseq", kMain);
  try {
    library.LoadContent(path);
    FAIL();
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), seqerrors::kFileNotFound);
    EXPECT_NE(e.Description().find("intro.tseq (subsequence of " + path + ")"), std::string::npos)
        << e.Description();
  }
  dir.Write("intro.tseq", R"({"tessavar_sequence": 1, "subsequences": [{"file": "main.tseq"}]})");
  try {
    library.LoadContent(path);
    FAIL();
  } catch (const Error& e) {
    EXPECT_NE(e.Description().find("subsequences include each other"), std::string::npos)
        << e.Description();
  }
}

TEST_F(Library, RefusesWhatIsNoSequence) {
  try {
    library.LoadContent(dir.Write("notes.txt", "shopping list"));
    FAIL();
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), seqerrors::kInvalidFileFormat);
  }
  try {
    library.LoadContent(dir.Path() + "absent.tseq");
    FAIL();
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), seqerrors::kFileNotFound);
  }
  try {
    library.LoadContent(dir.Path());
    FAIL();
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), seqerrors::kFileNotFound);
  }
}

TEST_F(Library, ExportRoundTripAndTheExportedFlag) {
  std::string path = dir.Write("main.tseq", kMain);
  dir.Write("intro.tseq", kIntro);
  auto sequence = library.CreateSequence();
  sequence->LoadFile(path);
  EXPECT_FALSE(sequence->HasBeenExported());
  library.WriteCompressed(*sequence, path + ".tcs");
  EXPECT_TRUE(sequence->HasBeenExported());

  auto compressed = library.LoadCompressed(path + ".tcs");
  EXPECT_EQ(compressed->Info().format, "tcs");
  // The export lists the files it was made from, where they were found.
  EXPECT_EQ(compressed->SubsequenceNames(), std::vector<std::string>{dir.Path() + "intro.tseq"});
  EXPECT_EQ(compressed->MediaFilename(), "tune.ogg");
  EXPECT_EQ(*compressed->Content()->compiled, *sequence->Content()->compiled);

  // An edited source or subsequence, loaded afresh, is no longer exported.
  dir.Write("intro.tseq", std::string(kIntro) + " ");
  auto afterSubEdit = library.CreateSequence();
  afterSubEdit->LoadFile(path);
  EXPECT_FALSE(afterSubEdit->HasBeenExported());
  dir.Write("intro.tseq", kIntro);
  dir.Write("main.tseq", std::string(kMain) + " ");
  auto again = library.CreateSequence();
  again->LoadFile(path);
  EXPECT_FALSE(again->HasBeenExported());
  // A damaged export does not count either.
  dir.Write("main.tseq.tcs", "TCS");
  EXPECT_FALSE(again->HasBeenExported());

  EXPECT_THROW(library.LoadCompressed(path), Error);
}

TEST_F(Library, FseqPlaysFromDiskOntoUniverses) {
  auto sequence = library.CreateSequence();
  sequence->LoadFile(TestDataFile("v2_sparse.fseq"));
  EXPECT_EQ(sequence->Info().format, "fseq");
  EXPECT_TRUE(sequence->UsesDMX());
  EXPECT_FALSE(sequence->UsesTAV());
  EXPECT_TRUE(sequence->HasBeenExported());
  EXPECT_EQ(sequence->Info().lengthMs, 6000);
  sequence->InitializeForPlay(false);
  sequence->StartPlay();
  // Channels 100-399 are universe 1 slots 101-400; 2000-2511 are universe 4
  // slots 465-512 and universe 5 slots 1-464.
  std::vector<PlayEvent> frame;
  PlayEvent e;
  while (sequence->GetEvent(e)) frame.push_back(e);
  ASSERT_EQ(frame.size(), 3u);
  struct Expect {
    int32_t universe, slot, count, channel;
  };
  const Expect expected[] = {{1, 101, 300, 100}, {4, 465, 48, 2000}, {5, 1, 464, 2048}};
  for (size_t i = 0; i < 3; ++i) {
    EXPECT_EQ(frame[i].playEventType, kPlayEventLevels);
    EXPECT_EQ(frame[i].devType, kFamilyDMX);
    EXPECT_EQ(frame[i].lNetwork, expected[i].universe);
    EXPECT_EQ(frame[i].nIntensityBlobStartAddress, expected[i].slot);
    EXPECT_EQ(frame[i].nIntensityBlobCount, expected[i].count);
    for (int32_t k = 0; k < expected[i].count; ++k) {
      ASSERT_EQ(frame[i].byteIntensityBlob[k], ((expected[i].channel + k) * 7 + 201) % 256);
    }
  }
  // Frame 60 is due at 3000 ms.
  clock->AdvanceMilliseconds(3000);
  for (int skipped = 0; skipped < 59 * 3; ++skipped) ASSERT_TRUE(sequence->GetEvent(e));
  ASSERT_TRUE(sequence->GetEvent(e));
  EXPECT_EQ(e.lDueTime, 3000);
  EXPECT_EQ(e.byteIntensityBlob[0], (100 * 7 + 60 * 13 + 201) % 256);
}

TEST_F(Library, UniverseMapFromThePreferences) {
  library.SetUniverseMap(UniverseMap::FromSpans({{10, 0, 100}, {11, 2000, 170}}));
  auto content = library.LoadContent(TestDataFile("v2_sparse.fseq"));
  auto stream = content->openStream();
  stream->Seek(0);
  PlayEvent e;
  std::vector<std::tuple<int32_t, int32_t, int32_t>> got;
  while (stream->NextTime() == 0) {
    stream->Next(e);
    got.emplace_back(e.lNetwork, e.nIntensityBlobStartAddress, e.nIntensityBlobCount);
  }
  EXPECT_EQ(got, (std::vector<std::tuple<int32_t, int32_t, int32_t>>{{11, 1, 170}}));
}

TEST_F(Library, FseqConvertsToAnExportThatPlaysTheSame) {
  auto fseq = library.CreateSequence();
  fseq->LoadFile(TestDataFile("v2_zlib.fseq"));
  library.WriteCompressed(*fseq, dir.Path() + "zlib.tcs");
  auto tcs = library.LoadCompressed(dir.Path() + "zlib.tcs");
  EXPECT_EQ(tcs->Info().lengthMs, fseq->Info().lengthMs);
  auto a = PlayAll(*fseq, 7500);
  auto b = PlayAll(*tcs, 7500);
  ASSERT_EQ(a.size(), b.size());
  ASSERT_EQ(a.size(), 150u * 2);  // 600 channels: universe 1 and part of 2
  for (size_t i = 0; i < a.size(); ++i) {
    ASSERT_EQ(a[i].lDueTime, b[i].lDueTime) << i;
    ASSERT_EQ(a[i].byteIntensityBlob, b[i].byteIntensityBlob) << i;
  }
}

TEST_F(Library, KeepAliveIsRaisedWhileALargeFileLoads) {
  SequenceData data;
  for (int c = 0; c < 50; ++c) {
    SequenceChannel channel{"c" + std::to_string(c), {kFamilyDMX, 1, 0, c + 1}, {}};
    for (int i = 0; i < 400; ++i) channel.effects.push_back({i * 25, 25, kEffectFade, 0, 100, 0});
    data.channels.push_back(channel);
  }
  std::string path = dir.Write("big.tseq", WritePlainSequence(data));
  // Time passes while the loop is busy loading: each look at the clock
  // finds it 20 ms later.
  struct BusyClock : Clock {
    DateTime Now() const override { return DateTime(); }
    uint32_t TickCount() const override { return m_tick += 20; }
    mutable uint32_t m_tick = 0;
  };
  FileSequenceLibrary busy(std::make_shared<BusyClock>(), fs, resolver);
  auto sequence = busy.CreateSequence();
  int raised = 0;
  sequence->SetKeepAlive([&] { ++raised; });
  sequence->LoadFile(path);
  EXPECT_GE(raised, 3);
  EXPECT_EQ(sequence->Info().effectCount, 20000u);
}

TEST_F(Library, KeepAliveIsRaisedWhileTheExportIsCompressedAndWritten) {
  SequenceData data;
  for (int c = 0; c < 50; ++c) {
    SequenceChannel channel{"c" + std::to_string(c), {kFamilyDMX, 1, 0, c + 1}, {}};
    for (int i = 0; i < 40; ++i) channel.effects.push_back({i * 25, 25, kEffectFade, 0, 100, 0});
    data.channels.push_back(channel);
  }
  std::string path = dir.Write("big.tseq", WritePlainSequence(data));
  // Each step of the export takes longer than the keep-alive interval.
  struct BusyClock : Clock {
    DateTime Now() const override { return DateTime(); }
    uint32_t TickCount() const override { return m_tick += 60; }
    mutable uint32_t m_tick = 0;
  };
  FileSequenceLibrary busy(std::make_shared<BusyClock>(), fs, resolver);
  auto sequence = busy.CreateSequence();
  int raised = 0;
  sequence->SetKeepAlive([&] { ++raised; });
  sequence->LoadFile(path);
  raised = 0;
  busy.WriteCompressed(*sequence, path + ".tcs");
  // While compressing, and around writing and syncing the file.
  EXPECT_GE(raised, 3);
  EXPECT_TRUE(sequence->HasBeenExported());
}

TEST_F(Library, NestedIncludesAreListedAndHashedWhereTheyWereFound) {
  // main includes parts/one (at 1000), which includes two beside it (at 50).
  std::string two = dir.Write("parts/two.tseq", R"({"tessavar_sequence": 1, "length_ms": 10})");
  std::string one = dir.Write(
      "parts/one.tseq",
      R"({"tessavar_sequence": 1, "subsequences": [{"file": "two.tseq", "offset_ms": 50}]})");
  std::string main = dir.Write(
      "main.tseq",
      R"({"tessavar_sequence": 1, "subsequences": [{"file": "parts/one.tseq", "offset_ms": 1000}]})");
  auto sequence = library.CreateSequence();
  sequence->LoadFile(main);
  EXPECT_EQ(sequence->SubsequenceNames(), std::vector<std::string>{"parts/one.tseq"});
  library.WriteCompressed(*sequence, main + ".tcs");
  auto exported = library.LoadCompressed(main + ".tcs");
  ASSERT_EQ(exported->Info().subsequences.size(), 2u);
  EXPECT_EQ(exported->Info().subsequences[0].file, one);
  EXPECT_EQ(exported->Info().subsequences[0].offsetMs, 1000);
  EXPECT_EQ(exported->Info().subsequences[1].file, two);
  EXPECT_EQ(exported->Info().subsequences[1].offsetMs, 1050);

  uint64_t recorded = exported->Info().sourceHash;
  EXPECT_EQ(library.CurrentSourceHash(main, exported->SubsequenceNames()), recorded);
  dir.Write("parts/two.tseq", R"({"tessavar_sequence": 1, "length_ms": 20})");
  EXPECT_NE(library.CurrentSourceHash(main, exported->SubsequenceNames()), recorded);
  std::filesystem::remove(two);
  EXPECT_EQ(library.CurrentSourceHash(main, exported->SubsequenceNames()), std::nullopt);
}

TEST_F(Library, MemoryWhilePlayingAnFseqIsOneBlockWhateverTheLength) {
  constexpr uint32_t kChannels = 8192, kBlockFrames = 16;
  std::vector<size_t> held;
  for (uint32_t frames : {200u, 400u}) {
    FseqWriter::Options options;
    options.framesPerBlock = kBlockFrames;
    FseqWriter writer(kChannels, options);
    std::vector<uint8_t> frame(kChannels);
    for (uint32_t f = 0; f < frames; ++f) {
      for (uint32_t c = 0; c < frame.size(); ++c) frame[c] = static_cast<uint8_t>(c * 7 + f * 13);
      writer.AddFrame(frame.data());
    }
    std::string path = dir.Write("f" + std::to_string(frames) + ".fseq", writer.Finish());
    auto sequence = library.CreateSequence();
    sequence->LoadFile(path);
    PlayAll(*sequence, frames * 50);
    held.push_back(sequence->MemoryHeld());
  }
  // One decompressed block, a read chunk and the decoder's own state.
  EXPECT_LT(held[0], kBlockFrames * kChannels + 320u * 1024);
  EXPECT_LT(held[1], held[0] + 1024);
}

}  // namespace
}  // namespace tav
