// The decache pass: its marks, its order, and where the engine runs it.

#include "show/DecachePass.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "show/testing/ShowRig.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr int32_t kMiB = 1024 * 1024;

SequenceData Lights(int32_t slot, int64_t lengthMs) {
  SequenceData data;
  data.lengthMs = lengthMs;
  data.channels.push_back({"lamp", {kFamilyDMX, 1, 0, slot}, {{0, 0, kEffectSet, 100, 100, 0}}});
  return data;
}

class DecacheTest : public ::testing::Test {
 protected:
  // A sequence loaded for real, whose load the memory probe says took
  // `footprintMiB`.
  std::shared_ptr<SequencePlayInfo> Loaded(const std::string& name, int32_t footprintMiB) {
    rig.WriteSequence(name, Lights(1, 1000));
    SequencePlayServices services = rig.sequenceServices;
    auto probe = std::make_shared<FixedProcessMemory>();
    probe->QueueValues({0, footprintMiB * kMiB});
    services.memory = probe;
    auto info = std::make_shared<SequencePlayInfo>(services);
    info->SetFilename(rig.PathOf(name));
    info->SetPlayType(4);
    info->InitializeForPlay();
    EXPECT_EQ(info->LoadMemoryFootprint(), footprintMiB * kMiB);
    return info;
  }
  // Runs a pass over the candidates; the log lines it wrote.
  std::vector<std::string> Run(const std::vector<DecacheCandidate>& candidates) {
    DecachePass pass(rig.settings, rig.memory);
    rig.timeline.Clear();
    asked = false;
    pass.Run(
        [&] {
          asked = true;
          return candidates;
        },
        rig.host);
    return rig.timeline.Texts();
  }

  ShowRig rig;
  bool asked = false;
};

TEST_F(DecacheTest, BetweenTheMarksNothingIsReleased) {
  auto a = Loaded("a.tseq", 10);
  for (int32_t memory : {900 * kMiB - 1, 900 * kMiB, 1000 * kMiB, 1024 * kMiB - 1}) {
    rig.memory->Set(memory);
    EXPECT_THAT(Run({{a, 0}}), IsEmpty()) << memory;
    EXPECT_FALSE(asked);
    EXPECT_TRUE(a->IsCached());
  }
}

TEST_F(DecacheTest, AboveTheHighMarkReleasesOneAtATimeUntilBelowTheLowMark) {
  auto small = Loaded("small.tseq", 5);
  auto big = Loaded("big.tseq", 80);
  auto later = Loaded("later.tseq", 200);
  auto spare = Loaded("spare.tseq", 1);
  // Measured once before, then after each release.
  rig.memory->QueueValues({1100 * kMiB, 1000 * kMiB, 899 * kMiB});
  std::vector<std::string> lines = Run({{small, 0}, {later, 1}, {big, 0}, {spare, 0}});
  // Rank first, then the largest load first; it stops at the first
  // measurement below the low mark although candidates remain.
  EXPECT_THAT(lines, ElementsAre("log 1 Decaching <big.tseq>", "log 1 Decaching <small.tseq>"));
  EXPECT_FALSE(big->IsCached());
  EXPECT_FALSE(small->IsCached());
  EXPECT_TRUE(spare->IsCached());
  EXPECT_TRUE(later->IsCached());
}

TEST_F(DecacheTest, SettingsAreReadAtEveryPass) {
  auto a = Loaded("a.tseq", 10);
  rig.memory->Set(2000 * kMiB);
  rig.settings.Set(settings::kMonitorDecache, false);
  EXPECT_THAT(Run({{a, 0}}), IsEmpty());
  rig.settings.Set(settings::kMonitorDecache, true);
  rig.settings.Set(settings::kMonitorDecacheHigh, 2040 * kMiB);
  EXPECT_THAT(Run({{a, 0}}), IsEmpty());
  rig.settings.Set(settings::kMonitorDecacheHigh, 1900 * kMiB);
  EXPECT_THAT(Run({{a, 0}}), ElementsAre("log 1 Decaching <a.tseq>"));
}

TEST_F(DecacheTest, AFailingMemoryQueryEndsThePassAndReachesTheCaller) {
  auto a = Loaded("a.tseq", 10);
  rig.memory->Fail(31);
  DecachePass pass(rig.settings, rig.memory);
  EXPECT_THROW(pass.Run([&] { return std::vector<DecacheCandidate>{{a, 0}}; }, rig.host), Error);
  EXPECT_TRUE(a->IsCached());
}

// In a show: sequences that play or are queued are never released; what
// the show will not play again goes first.
TEST(DecacheInAShow, PreloadedSectionsAreReleasedInTheOrderTheShowNeedsThem) {
  ShowRig rig;
  for (const char* name : {"intro.tseq", "main.tseq", "song.tseq", "bye.tseq"}) {
    rig.WriteSequence(name, Lights(1, 60'000));
  }
  rig.Start();
  ShowParts parts;
  parts.startup = {"intro.tseq"};
  parts.main = {"main.tseq"};
  parts.musical = {"song.tseq"};
  parts.shutdown = {"bye.tseq"};
  parts.preload = true;
  rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts));
  rig.Advance(2);  // prepared (every sequence loaded), the startup playing
  EXPECT_EQ(rig.timeline.Texts("log 1 Loading").size(), 4u);
  rig.timeline.Clear();
  // Memory is over the high mark, and stays there, when the startup ends and
  // Main is queued: the Shutdown sequence goes first (needed last), then the
  // musical piece; Main, queued, stays. The piece is queued next and loads
  // again.
  rig.memory->Set(1100 * kMiB);
  rig.Advance(60'001);
  EXPECT_THAT(rig.timeline.Texts("log 1 Decaching"),
              ElementsAre("log 1 Decaching <bye.tseq>", "log 1 Decaching <song.tseq>"));
  EXPECT_THAT(rig.timeline.Texts("log 1 Loading"),
              ElementsAre("log 1 Loading sequence: song.tseq"));
}

}  // namespace
}  // namespace tav
