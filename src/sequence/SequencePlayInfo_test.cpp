#include "sequence/SequencePlayInfo.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <functional>
#include <new>
#include <optional>
#include <stdexcept>

#include "platform/LocalFileSystem.h"
#include "ports/testing/FixedProcessMemory.h"
#include "ports/testing/ManualClock.h"
#include "suite/channelio/testing/RecordingChannelIO.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/PlainSequence.h"
#include "suite/seqlib/testing/MemorySequenceLibrary.h"
#include "suite/shellcmd/testing/RecordingShellCommandManager.h"
#include "support/Error.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

class RecordingHost : public SequenceHost {
 public:
  void LogMessage(int32_t level, const std::string& szText,
                  const SequenceIdentity* seqInfo) override {
    lines.push_back(std::to_string(level) + " " + szText + (seqInfo ? " [seq]" : ""));
  }
  void SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) override {
    starts.push_back(seqInfo.Filename() + "#" + std::to_string(seqInfo.Section()));
  }
  void SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) override {
    stops.push_back(seqInfo.Filename());
  }
  std::string CreatePlaybackFileIfNeeded(const std::string& szFilename) override {
    asked.push_back(szFilename);
    return playbackFile ? *playbackFile : szFilename;
  }

  std::vector<std::string> lines, starts, stops, asked;
  std::optional<std::string> playbackFile;
};

// Wraps a library and makes one step throw something that is no tav::Error,
// as a damaged file with an absurd size would (std::bad_alloc).
class ThrowingLibrary : public SequenceLibrary {
 public:
  enum class Step { kNothing, kLoad, kLoadCompressed, kWriteCompressed };

  explicit ThrowingLibrary(std::shared_ptr<SequenceLibrary> inner) : m_inner(std::move(inner)) {}

  std::shared_ptr<Sequence> CreateSequence() override {
    if (throwAt != Step::kLoad) return m_inner->CreateSequence();
    return std::make_shared<Sequence>(
        std::make_shared<ManualClock>(),
        [](const std::string&, const std::function<void()>&)
            -> std::shared_ptr<const SequenceContent> { throw std::bad_alloc(); });
  }
  std::shared_ptr<Sequence> LoadCompressed(const std::string& path) override {
    if (throwAt == Step::kLoadCompressed) throw std::runtime_error("length out of range");
    return m_inner->LoadCompressed(path);
  }
  void WriteCompressed(const Sequence& sequence, const std::string& path) override {
    if (throwAt == Step::kWriteCompressed) throw std::bad_alloc();
    m_inner->WriteCompressed(sequence, path);
  }
  std::optional<uint64_t> CurrentSourceHash(const std::string& sequencePath,
                                            const std::vector<std::string>& included) override {
    return m_inner->CurrentSourceHash(sequencePath, included);
  }

  Step throwAt = Step::kNothing;

 private:
  std::shared_ptr<SequenceLibrary> m_inner;
};

SequenceData TwoChannels(const std::string& media = "") {
  SequenceData data;
  data.media = media;
  data.shellCommand = "echo hello";
  data.channels.push_back({"tree", {kFamilyTAV, 1, 2, 3}, {{0, 0, kEffectSet, 100, 100, 0}}});
  data.channels.push_back({"star", {kFamilyDMX, 1, 0, 10}, {{500, 0, kEffectSet, 50, 50, 0}}});
  return data;
}

// ---- The compressed-export decision, on real files --------------------------

class ExportDecision : public ::testing::Test {
 protected:
  void SetUp() override {
    auto files = LocalFileSystem();
    auto resolver =
        std::make_shared<PathResolver>(files, [dir = m_dir.Path()](int32_t) { return dir; });
    m_library = std::make_shared<FileSequenceLibrary>(m_clock, files, resolver);
    m_throwing = std::make_shared<ThrowingLibrary>(m_library);
    m_services = {m_throwing, resolver, files,
                  &m_host,    nullptr,  [this] { return m_useCompressed; }};
  }

  std::string Path(const std::string& name) const { return m_dir.Path() + name; }

  void WriteFile(const std::string& name, const std::string& bytes, int64_t mtimeSeconds) {
    m_dir.Write(name, bytes);
    SetTime(name, mtimeSeconds);
  }
  void WritePlain(const std::string& name, int64_t mtimeSeconds,
                  SequenceData data = TwoChannels()) {
    WriteFile(name, WritePlainSequence(data), mtimeSeconds);
  }
  // An export written by the library itself, then dated.
  void Export(const std::string& name, int64_t mtimeSeconds) {
    auto sequence = m_library->CreateSequence();
    sequence->LoadFile(Path(name));
    m_library->WriteCompressed(*sequence, Path(name) + ".tcs");
    SetTime(name + ".tcs", mtimeSeconds);
  }
  void SetTime(const std::string& name, int64_t seconds) { m_dir.SetModified(name, seconds); }

  // Prepares a play info for `name` and says what it loaded.
  std::string LoadedFrom(const std::string& name) {
    SequencePlayInfo info(m_services);
    info.SetFilename(Path(name));
    info.SetPlayType(4);
    info.InitializeForPlay();
    if (info.ErrorOccurred()) return "error: " + info.ErrorText();
    if (!info.IsCached()) return "nothing";
    return info.IsCompressed() ? "compressed" : "plain";
  }

  TempFolder m_dir;
  RecordingHost m_host;
  std::shared_ptr<ManualClock> m_clock = std::make_shared<ManualClock>();
  std::shared_ptr<FileSequenceLibrary> m_library;
  std::shared_ptr<ThrowingLibrary> m_throwing;
  SequencePlayServices m_services;
  bool m_useCompressed = true;
};

// Lines logged about loading, without the ones every load writes.
std::vector<std::string> Skipping(const std::vector<std::string>& lines,
                                  const std::string& prefix) {
  std::vector<std::string> kept;
  for (const auto& line : lines) {
    if (line.rfind(prefix, 0) != 0) kept.push_back(line);
  }
  return kept;
}

TEST_F(ExportDecision, PlainFileAloneIsLoadedAndExported) {
  WritePlain("a.json", 1000);
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_THAT(m_host.lines, ElementsAre("1 Loading sequence: " + Path("a.json"),
                                        "1 Exporting compressed sequence for " + Path("a.json")));
  EXPECT_TRUE(std::filesystem::exists(Path("a.json.tcs")));

  // The export just written is newer than the file, so it is used next time.
  m_host.lines.clear();
  EXPECT_EQ(LoadedFrom("a.json"), "compressed");
  EXPECT_THAT(m_host.lines, ElementsAre("1 Loading compressed sequence: " + Path("a.json.tcs")));
}

TEST_F(ExportDecision, OnlyAStrictlyNewerExportIsUsed) {
  struct Case {
    int64_t plainTime, exportTime;
    bool setting;
    const char* expected;
  };
  const Case cases[] = {
      {1000, 2000, true, "compressed"},
      {1000, 1000, true, "plain"},  // equal times load the file
      {2000, 1000, true, "plain"},
      {1000, 2000, false, "plain"},  // setting off
  };
  for (const auto& c : cases) {
    WritePlain("a.json", c.plainTime);
    Export("a.json", c.exportTime);
    m_useCompressed = c.setting;
    m_host.lines.clear();
    EXPECT_EQ(LoadedFrom("a.json"), c.expected) << c.plainTime << " " << c.exportTime;
    // The export still records the file's content, so it is never rewritten.
    for (const auto& line : m_host.lines) EXPECT_EQ(line.find("Exporting"), std::string::npos);
  }
}

TEST_F(ExportDecision, StaleExportOfChangedFileIsWrittenAgain) {
  WritePlain("a.json", 1000);
  Export("a.json", 1000);  // same time: not trusted
  SequenceData changed = TwoChannels();
  changed.channels.pop_back();
  WritePlain("a.json", 1000, changed);
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_EQ(m_host.lines.back(), "1 Exporting compressed sequence for " + Path("a.json"));
}

TEST_F(ExportDecision, ExportAloneIsLoadedAfterAskingForAPlaybackFile) {
  WritePlain("a.json", 1000);
  Export("a.json", 2000);
  std::filesystem::remove(Path("a.json"));
  EXPECT_EQ(LoadedFrom("a.json"), "compressed");
  EXPECT_THAT(m_host.asked, ElementsAre(Path("a.json")));
  EXPECT_EQ(m_host.lines.front(), "1 Checking Q7 sequence: " + Path("a.json"));
}

TEST_F(ExportDecision, NameWithTheExportSuffixMeansThePlainSequence) {
  WritePlain("a.json", 1000);
  Export("a.json", 2000);
  EXPECT_EQ(LoadedFrom("a.json.tcs"), "compressed");
  EXPECT_THAT(m_host.asked, IsEmpty());
  // Any letter case; "a.json.TCS" is no file here, so the host is asked first.
  EXPECT_EQ(LoadedFrom("a.json.TCS"), "compressed");
  EXPECT_THAT(m_host.asked, ElementsAre(Path("a.json.TCS")));
}

TEST_F(ExportDecision, NewerSubsequenceMakesTheFileLoadInstead) {
  WritePlain("sub.json", 1000);
  SequenceData parent = TwoChannels();
  parent.subsequences.push_back({"sub.json", 1000});
  WritePlain("a.json", 1000, parent);
  Export("a.json", 2000);
  SetTime("sub.json", 3000);
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_THAT(
      m_host.lines,
      ::testing::Contains(
          "1 Compressed sequence uses a more recent subsequence - loading sequence instead"));
}

TEST_F(ExportDecision, BrokenExportFallsBackToTheFile) {
  WritePlain("a.json", 1000);
  WriteFile("a.json.tcs", "not an export at all", 2000);
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_THAT(m_host.lines,
              ::testing::Contains("2 Cannot load compressed sequence file for " + Path("a.json")));
}

TEST_F(ExportDecision, DirectoryInPlaceOfTheExportCountsAsAbsentAndExportFails) {
  WritePlain("a.json", 1000);
  std::filesystem::create_directory(Path("a.json.tcs"));
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_EQ(m_host.lines.back(), "2 Cannot export compressed sequence for " + Path("a.json"));
}

TEST_F(ExportDecision, UnreadableFileIsAnErrorOfPreparation) {
  WriteFile("a.json", "{ this is not json", 1000);
  std::string result = LoadedFrom("a.json");
  EXPECT_EQ(result.rfind("error: ", 0), 0u) << result;
}

TEST_F(ExportDecision, EditedSubsequenceMakesTheFileLoadAndIsExportedAgain) {
  WritePlain("sub.json", 1000);
  SequenceData parent = TwoChannels();
  parent.subsequences.push_back({"sub.json", 1000});
  WritePlain("a.json", 1000, parent);
  Export("a.json", 2000);
  SequenceData edited = TwoChannels();
  edited.channels.pop_back();
  WritePlain("sub.json", 3000, edited);
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_EQ(m_host.lines.back(), "1 Exporting compressed sequence for " + Path("a.json"));
  // The new export is current: later loads take it.
  EXPECT_EQ(LoadedFrom("a.json"), "compressed");
}

TEST_F(ExportDecision, TouchedSubsequenceIsExportedAgainAlthoughUnchanged) {
  WritePlain("sub.json", 1000);
  SequenceData parent = TwoChannels();
  parent.subsequences.push_back({"sub.json", 1000});
  WritePlain("a.json", 1000, parent);
  Export("a.json", 2000);
  SetTime("sub.json", 3000);
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_EQ(LoadedFrom("a.json"), "compressed");
}

TEST_F(ExportDecision, NestedSubsequencesBesideTheirIncludingFileAreChecked) {
  // a.json includes parts/one.json, which includes two.json beside it (not
  // in the sequence folder).
  WritePlain("parts/two.json", 1000);
  SequenceData one = TwoChannels();
  one.subsequences.push_back({"two.json", 500});
  WritePlain("parts/one.json", 1000, one);
  SequenceData parent = TwoChannels();
  parent.subsequences.push_back({"parts/one.json", 1000});
  WritePlain("a.json", 1000, parent);
  Export("a.json", 2000);
  EXPECT_EQ(LoadedFrom("a.json"), "compressed");

  SequenceData edited = TwoChannels();
  edited.channels.pop_back();
  WritePlain("parts/two.json", 3000, edited);
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_EQ(LoadedFrom("a.json"), "compressed");
}

TEST_F(ExportDecision, FilesRestoredWithOlderTimesAreNotCoveredByTheExport) {
  // A backup restored (rsync -a, unzip) keeps its old modification time,
  // older than the export made from the newer content.
  SequenceData older = TwoChannels();
  older.channels.pop_back();
  struct Case {
    const char* restored;
  } cases[] = {{"a.json"}, {"sub.json"}};
  for (const auto& c : cases) {
    WritePlain("sub.json", 1000);
    SequenceData parent = TwoChannels();
    parent.subsequences.push_back({"sub.json", 1000});
    WritePlain("a.json", 1000, parent);
    Export("a.json", 2000);
    if (std::string(c.restored) == "a.json") {
      older.subsequences = parent.subsequences;
      WritePlain("a.json", 500, older);
      older.subsequences.clear();
    } else {
      WritePlain("sub.json", 500, older);
    }
    m_host.lines.clear();
    EXPECT_EQ(LoadedFrom("a.json"), "plain") << c.restored;
    EXPECT_THAT(m_host.lines,
                ElementsAre("1 Loading compressed sequence: " + Path("a.json.tcs"),
                            "1 Compressed sequence does not match its sequence file - loading "
                            "sequence instead",
                            "1 Loading sequence: " + Path("a.json"),
                            "1 Exporting compressed sequence for " + Path("a.json")))
        << c.restored;
    EXPECT_EQ(LoadedFrom("a.json"), "compressed") << c.restored;
  }
}

TEST_F(ExportDecision, FailuresOfAnyKindFallBackOrMarkTheSequenceFailed) {
  WritePlain("a.json", 1000);
  Export("a.json", 2000);
  m_throwing->throwAt = ThrowingLibrary::Step::kLoadCompressed;
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_THAT(m_host.lines,
              ::testing::Contains("2 Cannot load compressed sequence file for " + Path("a.json")));

  SetTime("a.json.tcs", 500);  // the file is newer: it is loaded and exported
  m_throwing->throwAt = ThrowingLibrary::Step::kWriteCompressed;
  m_host.lines.clear();
  WritePlain("a.json", 1000, SequenceData{});
  EXPECT_EQ(LoadedFrom("a.json"), "plain");
  EXPECT_EQ(m_host.lines.back(), "2 Cannot export compressed sequence for " + Path("a.json"));

  m_throwing->throwAt = ThrowingLibrary::Step::kLoad;
  m_host.lines.clear();
  EXPECT_EQ(LoadedFrom("a.json"), "error: std::bad_alloc");
  EXPECT_THAT(Skipping(m_host.lines, "1 Loading compressed"),
              ElementsAre("1 Loading sequence: " + Path("a.json")));
}

// ---- Everything else, on sequences held in memory ---------------------------

class PlayInfo : public ::testing::Test {
 protected:
  PlayInfo() {
    auto files = LocalFileSystem();
    m_resolver = std::make_shared<PathResolver>(files, [](int32_t kind) {
      return kind == PathResolver::kKindMedia ? std::string("/media/") : std::string("/seq/");
    });
    m_services = {m_library, m_resolver, files, &m_host, m_memory, [] { return false; }};
  }

  // A play info for a sequence the memory library holds. The file-exists
  // check fails for these names, so the host is asked for a playback file
  // and answers with the same name.
  std::unique_ptr<SequencePlayInfo> Make(const std::string& name, int32_t playType,
                                         SequenceData data = TwoChannels("song.mp3")) {
    m_library->AddSequence(m_resolver->ResolvePath(name, PathResolver::kKindSequence),
                           std::move(data), true);
    auto info = std::make_unique<SequencePlayInfo>(m_services);
    info->SetFilename(name);
    info->SetPlayType(playType);
    return info;
  }

  RecordingHost m_host;
  std::shared_ptr<ManualClock> m_clock = std::make_shared<ManualClock>();
  std::shared_ptr<MemorySequenceLibrary> m_library =
      std::make_shared<MemorySequenceLibrary>(m_clock);
  std::shared_ptr<FixedProcessMemory> m_memory = std::make_shared<FixedProcessMemory>(1000);
  std::shared_ptr<PathResolver> m_resolver;
  SequencePlayServices m_services;
};

TEST_F(PlayInfo, SectionFollowsPlayType) {
  const std::pair<int32_t, int32_t> cases[] = {{0, 0}, {1, 1}, {2, 6}, {3, 2}, {4, 3},
                                               {5, 4}, {6, 5}, {7, 7}, {9, 0}, {-1, 0}};
  SequencePlayInfo info(m_services);
  for (auto [playType, section] : cases) {
    info.SetPlayType(playType);
    EXPECT_EQ(info.Section(), section) << playType;
  }
}

TEST_F(PlayInfo, MediaOnlyForSectionsThatPlayIt) {
  for (int32_t playType : {5, 2, 3, 7}) {
    EXPECT_EQ(Make("m.json", playType)->MediaFilename(), "/media/song.mp3") << playType;
  }
  for (int32_t playType : {0, 1, 4, 6}) {
    auto info = Make("m.json", playType);
    EXPECT_EQ(info->MediaFilename(), "") << playType;
    EXPECT_FALSE(info->IsCached()) << "no load for play type " << playType;
  }
  EXPECT_EQ(Make("quiet.json", 5, TwoChannels(""))->MediaFilename(), "");
}

TEST_F(PlayInfo, EmptyFilenameIsAnErrorWithoutRaising) {
  SequencePlayInfo info(m_services);
  info.InitializeForPlay();
  EXPECT_TRUE(info.ErrorOccurred());
  EXPECT_EQ(info.ErrorText(), "No filename specified");
}

TEST_F(PlayInfo, NoPlaybackFileIsAFailureAskedOnceAndHarmlessToPlay) {
  m_host.playbackFile = "";
  SequencePlayInfo info(m_services);
  info.SetFilename("missing.json");
  info.SetPlayType(5);
  info.InitializeForPlay();
  EXPECT_TRUE(info.ErrorOccurred());
  EXPECT_EQ(info.ErrorText(), "No playable file for missing.json");
  EXPECT_FALSE(info.IsCached());
  EXPECT_EQ(info.Filename(), "");
  EXPECT_EQ(info.MediaFilename(), "");
  info.InitializeForPlay();
  EXPECT_EQ(info.ErrorText(), "No playable file for missing.json");
  EXPECT_THAT(m_host.lines, ElementsAre("1 Checking Q7 sequence: missing.json"));
  EXPECT_THAT(m_host.asked, ElementsAre("missing.json"));

  info.StartPlay();
  info.StopPlay();
  EXPECT_EQ(info.TimesPlayed(), 0);
  EXPECT_THAT(m_host.starts, IsEmpty());
  EXPECT_EQ(info.SequencePlayState(), 0);
  PlayEvent event;
  EXPECT_FALSE(info.GetEvent(event));
  EXPECT_FALSE(info.MillisecondsUntilDue());
  EXPECT_FALSE(info.UsesTAV());
}

TEST_F(PlayInfo, StartingASequenceThatHoldsNothingDoesNothing) {
  auto info = Make("a.json", 5);
  info->StartPlay();
  EXPECT_EQ(info->TimesPlayed(), 0);
  EXPECT_THAT(m_host.starts, IsEmpty());
}

TEST_F(PlayInfo, StartCountsEveryStartAndTellsTheTray) {
  auto info = Make("a.json", 5);
  info->InitializeForPlay();
  for (int i = 0; i < 3; ++i) info->StartPlay();
  EXPECT_EQ(info->TimesPlayed(), 3);
  EXPECT_THAT(m_host.starts, ElementsAre("a.json#4", "a.json#4", "a.json#4"));
}

TEST_F(PlayInfo, PlaysEventsThroughTheHeldSequenceAndStopsViaStopping) {
  auto info = Make("a.json", 4);
  info->InitializeForPlay();
  EXPECT_TRUE(info->UsesTAV());
  EXPECT_FALSE(info->UsesX10());
  EXPECT_FALSE(info->UsesFennick());
  info->StartPlay();
  EXPECT_NE(info->SequencePlayState(), 0);

  int32_t type = -1, dev = -1, net = -1, circuit = -1, effect = -1, duration = -1, from = -1,
          to = -1, priority = -1, start = -1, count = -1;
  uint8_t unit = 0;
  std::string name;
  std::vector<uint8_t> blob{9, 9};
  ASSERT_TRUE(info->GetEvent(type, dev, net, unit, circuit, name, effect, duration, from, to,
                             priority, start, count, blob));
  EXPECT_EQ(type, kPlayEventEffect);
  EXPECT_EQ(dev, kFamilyTAV);
  EXPECT_EQ(unit, 2);
  EXPECT_EQ(circuit, 3);
  EXPECT_EQ(name, "tree");
  EXPECT_THAT(blob, ElementsAre(9, 9));  // untouched: not a level block
  // The star's effect at 500 is next, 5 ms early.
  EXPECT_EQ(info->MillisecondsUntilDue(), 495);

  info->StopPlay();
  EXPECT_EQ(info->MillisecondsUntilDue(), 0);
  for (int i = 0; i < 100 && info->SequencePlayState() != 0; ++i) {
    m_clock->AdvanceMilliseconds(10);
    PlayEvent drained;
    while (info->GetEvent(drained)) {
    }
  }
  EXPECT_EQ(info->SequencePlayState(), 0);
}

TEST_F(PlayInfo, LevelBlocksAreCopiedOut) {
  SequenceData data;
  LevelTrack track;
  track.family = kFamilyDMX;
  track.network = 1;
  track.count = 3;
  track.levels = {10, 20, 30};
  data.tracks.push_back(track);
  auto info = Make("levels.json", 4, data);
  info->InitializeForPlay();
  info->StartPlay();
  int32_t type = 0, dev, net, circuit, effect, duration, from, to, priority, start = 0, count = 0;
  uint8_t unit;
  std::string name;
  std::vector<uint8_t> blob;
  ASSERT_TRUE(info->GetEvent(type, dev, net, unit, circuit, name, effect, duration, from, to,
                             priority, start, count, blob));
  EXPECT_EQ(type, kPlayEventLevels);
  EXPECT_EQ(count, 3);
  EXPECT_THAT(blob, ElementsAre(10, 20, 30));
}

TEST_F(PlayInfo, DecacheReleasesAndTheNextUseLoadsAgain) {
  auto info = Make("a.json", 5);
  info->InitializeForPlay();
  ASSERT_TRUE(info->IsCached());
  info->Decache();
  EXPECT_FALSE(info->IsCached());
  EXPECT_EQ(info->MediaFilename(), "/media/song.mp3");
  EXPECT_TRUE(info->IsCached());
  EXPECT_EQ(m_library->Loads().size(), 2u);
}

TEST_F(PlayInfo, FootprintIsTheGrowthAcrossThePlainLoad) {
  m_memory->QueueValues({1000, 5000});
  auto info = Make("a.json", 4);
  EXPECT_EQ(info->LoadMemoryFootprint(), 0);
  info->InitializeForPlay();
  EXPECT_EQ(info->LoadMemoryFootprint(), 4000);

  info->Decache();
  m_memory->QueueValues({5000, 3000});  // memory fell during the load
  info->InitializeForPlay();
  EXPECT_EQ(info->LoadMemoryFootprint(), 0);
}

TEST_F(PlayInfo, AFailedMeasurementMakesTheFootprintUnknown) {
  auto info = Make("a.json", 4);
  m_memory->Set(50000);
  m_memory->QueueFailure();  // before the load
  info->InitializeForPlay();
  EXPECT_EQ(info->LoadMemoryFootprint(), 0);

  info->Decache();
  m_memory->QueueValues({1000});
  m_memory->QueueFailure();  // after the load
  info->InitializeForPlay();
  EXPECT_EQ(info->LoadMemoryFootprint(), 0);
}

TEST_F(PlayInfo, KeepAliveReachesTheChannelIOWhileLoading) {
  auto cio = std::make_shared<RecordingChannelIO>();
  auto info = Make("a.json", 4);
  info->SetCIO(cio);
  info->InitializeForPlay();
  EXPECT_GE(cio->CountOf("KeepAlive"), 1u);
}

TEST_F(PlayInfo, AFailedLoadIsHeldAndNotTriedAgain) {
  auto info = Make("bad.json", 5);
  m_library->FailLoading(m_resolver->ResolvePath("bad.json", PathResolver::kKindSequence));
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(info->MediaFilename(), "");
    info->InitializeForPlay();
  }
  EXPECT_TRUE(info->ErrorOccurred());
  EXPECT_NE(info->ErrorText().find("made to fail"), std::string::npos) << info->ErrorText();
  EXPECT_TRUE(info->IsCached());
  EXPECT_EQ(m_library->Loads().size(), 1u);
  EXPECT_EQ(Skipping(m_host.lines, "1 Checking Q7"),
            std::vector<std::string>{"1 Loading sequence: bad.json"});
  info->StartPlay();
  EXPECT_EQ(info->TimesPlayed(), 0);
  EXPECT_EQ(info->SequencePlayState(), 0);

  // Released by a decache, it is tried again on next use.
  info->Decache();
  EXPECT_FALSE(info->IsCached());
  info->InitializeForPlay();
  EXPECT_EQ(m_library->Loads().size(), 2u);
}

TEST_F(PlayInfo, AStillStoppingSequenceIsForcedToStopWhenPreparedAgain) {
  auto info = Make("a.json", 4);
  info->SetLightsOffAtEnd(true);
  info->InitializeForPlay();
  info->StartPlay();
  info->StopPlay();
  ASSERT_EQ(info->SequencePlayState(), 3);
  m_host.lines.clear();
  info->InitializeForPlay();
  EXPECT_THAT(m_host.lines, ElementsAre("0 Forcing stop of still-stopping sequence [seq]"));
  EXPECT_NE(info->SequencePlayState(), 3);
}

TEST_F(PlayInfo, AKeepAliveThatFailsDoesNotFailTheLoad) {
  auto cio = std::make_shared<RecordingChannelIO>();
  cio->FailNext("KeepAlive", 91, "no client");
  auto info = Make("a.json", 4);
  info->SetCIO(cio);
  info->InitializeForPlay();
  EXPECT_FALSE(info->ErrorOccurred());
  EXPECT_TRUE(info->IsCached());
}

TEST_F(PlayInfo, ShellCommandIsPreparedCompletedAndRun) {
  RecordingShellCommandManager manager;
  auto info = Make("a.json", 4);
  info->ExecuteShellCommand(&manager);  // nothing held yet: nothing runs
  EXPECT_THAT(manager.Prepared(), IsEmpty());
  info->InitializeForPlay();
  info->ExecuteShellCommand(&manager);
  EXPECT_THAT(manager.Prepared(), ElementsAre("echo hello"));
  ASSERT_EQ(manager.Ran().size(), 1u);
  EXPECT_FALSE(manager.Ran()[0].environment.empty());  // completed by the sequence

  manager.FailNextRun();
  EXPECT_NO_THROW(info->ExecuteShellCommand(&manager));
  EXPECT_NO_THROW(info->ExecuteShellCommand(nullptr));
}

}  // namespace
}  // namespace tav
