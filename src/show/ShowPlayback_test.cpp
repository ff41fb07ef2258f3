// Real sequence files through the whole engine: FSEQ files written by an
// independent program (testdata/fseq, pattern in its README) and the
// repository's example sequences. What reaches the I/O control at chosen
// moments is checked against what the files hold.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <fstream>
#include <iterator>

#include "show/ShowPlayer.h"
#include "show/testing/ShowRig.h"

namespace tav {
namespace {

using ::testing::Contains;
using ::testing::ElementsAre;

// The value the test files hold at frame f, absolute channel c.
uint8_t Pattern(int64_t frame, int64_t channel, int seed) {
  return static_cast<uint8_t>((channel * 7 + frame * 13 + seed) % 256);
}

struct FseqCase {
  std::string file;
  int seed;
  int32_t stepMs;
  int32_t lastFrame;
  std::vector<int64_t> channels;  // absolute, 0-based
};

class FseqPlayback : public ::testing::TestWithParam<FseqCase> {};

TEST_P(FseqPlayback, EveryFrameReachesItsUniverseSlotsOnTime) {
  const FseqCase& c = GetParam();
  ShowRig rig;
  rig.CopyTestData("fseq/" + c.file, c.file);
  rig.Start();
  ShowParts parts;
  parts.main = {c.file};
  rig.player->SetNextShow(rig.MakeShow("fseq.tsh", parts));
  // The sequence starts on the second tick (2 ms); a frame is handed over
  // 5 ms before it is due.
  uint64_t now = 0;
  for (int32_t frame : {0, 1, 2, c.lastFrame / 2, c.lastFrame}) {
    uint64_t at = 2 + static_cast<uint64_t>(frame) * c.stepMs;
    rig.Advance(at - now);
    now = at;
    for (int64_t channel : c.channels) {
      // Uniform map: universe 1 holds channels 0-511, universe 2 the next 512.
      int32_t universe = static_cast<int32_t>(channel / 512) + 1;
      int32_t slot = static_cast<int32_t>(channel % 512) + 1;
      EXPECT_EQ(rig.cio->DMXLevel(universe, slot), Pattern(frame, channel, c.seed))
          << "frame " << frame << " channel " << channel;
    }
  }
  // Each frame is sealed with its due tick.
  auto sends = rig.timeline.TimedTexts("cio SendAccumulated");
  ASSERT_GE(sends.size(), 2u);
  EXPECT_EQ(sends[0], "2 cio SendAccumulated() @2");
  EXPECT_EQ(sends[1], std::to_string(2 + c.stepMs - 5) + " cio SendAccumulated() @" +
                          std::to_string(2 + c.stepMs));
}

INSTANTIATE_TEST_SUITE_P(
    TestFiles, FseqPlayback,
    ::testing::Values(FseqCase{"v1_basic.fseq", 17, 50, 99, {0, 1, 255, 511}},
                      FseqCase{"v2_none.fseq", 42, 25, 199, {0, 511, 512, 1023}},
                      FseqCase{"v2_zstd.fseq", 99, 25, 399, {0, 600, 1535}},
                      FseqCase{"v2_zlib.fseq", 123, 50, 149, {0, 300, 599}},
                      FseqCase{"v2_sparse.fseq", 201, 50, 119, {100, 399, 2000, 2511}}),
    [](const auto& info) {
      std::string name = info.param.file;
      return name.substr(0, name.find('.'));
    });

TEST(ExamplePlayback, TheFrontYardSequenceDrivesEveryFamilyWithItsMusicAndCommand) {
  ShowRig rig;
  auto copy = [&](const std::string& name) {
    std::ifstream in(std::string(TAV_SOURCE_DIR) + "/examples/sequences/" + name, std::ios::binary);
    std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    ASSERT_FALSE(bytes.empty()) << name;
    rig.WriteFile(name, bytes);
  };
  copy("front-yard.tseq");
  copy("sparkle-intro.tseq");
  rig.media.Script("jingle.mp3", {12.0, "audio", {}, {}});
  rig.Start();
  ShowParts parts;
  parts.musical = {"front-yard.tseq"};
  rig.player->SetNextShow(rig.MakeShow("yard.tsh", parts));
  rig.Advance(2 + 4000);
  EXPECT_EQ(rig.cio->DMXLevel(2, 1), 255);
  EXPECT_EQ(rig.cio->DMXLevel(2, 2), 0);
  rig.Advance(500);
  EXPECT_EQ(rig.cio->DMXLevel(2, 1), 0);
  EXPECT_EQ(rig.cio->DMXLevel(2, 2), 255);
  rig.Advance(2500);  // 7000: the TAV frames
  EXPECT_EQ(rig.cio->TAVLevel(1, 3, 1), 255);
  rig.Advance(250);
  EXPECT_EQ(rig.cio->TAVLevel(1, 3, 1), 0);
  EXPECT_EQ(rig.cio->TAVLevel(1, 3, 2), 255);

  EXPECT_THAT(rig.timeline.Texts("log 1 Initializing"),
              ElementsAre("log 1 Initializing TAV networks", "log 1 Initializing X10 network",
                          "log 1 Initializing Fennick network"));
  EXPECT_THAT(rig.timeline.Texts("media OpenMedia"), ElementsAre("media OpenMedia(jingle.mp3)"));
  EXPECT_THAT(rig.shell.Prepared(), ElementsAre("logger -t tessavar \"front yard started\""));
  auto effects = rig.cio->CallTexts({"OutputEffect"});
  EXPECT_THAT(effects, Contains("OutputEffect(3, 1, 0, 3, Porch lamp, 1, 0, 100, 100, 0)"));
  EXPECT_THAT(effects, Contains("OutputEffect(4, 1, 0, 12, Arch, 3, 4000, 10, 100, 1)"));
  // The included sparkle intro twinkles slot 41 of universe 1.
  EXPECT_THAT(effects, Contains("OutputEffect(7, 1, 0, 41, Tree, 3, 3000, 0, 100, 0)"));
}

}  // namespace
}  // namespace tav
