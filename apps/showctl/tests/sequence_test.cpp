// showctl sequence, end to end: inspect, verify, levels and convert on the
// independently written FSEQ files of testdata/ and on what showctl makes
// of them.

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <fstream>
#include <iterator>

#include "ShowctlRunner.h"
#include "support/testing/TestData.h"

namespace tav::showctl::testing {
namespace {

using ::testing::HasSubstr;

// v2_sparse.fseq: channels 100-399 and 2000-2511 (0-based), 120 frames of
// 50 ms; the level of frame f, channel c is (7c + 13f + 201) mod 256.
int SparseLevel(int frame, int channel) {
  return (channel * 7 + frame * 13 + 201) % 256;
}

class SequenceCommand : public ShowctlTest {
 protected:
  std::string Fseq(const std::string& name) const {
    return tav::testing::TestDataFile("fseq/" + name);
  }
  Result Sequence(std::vector<std::string> args) const {
    args.insert(args.begin(), "sequence");
    return Run(args);
  }
};

TEST_F(SequenceCommand, InspectShowsWhatTheFseqHeadersSay) {
  Result r = Sequence({"inspect", Fseq("v2_sparse.fseq")});
  ASSERT_EQ(r.exitCode, 0) << r.err;
  for (const char* line : {"Format:        FSEQ 2.2, zstd-compressed in 2 block(s)",
                           "Frames:        120 at 50 ms (20 per second)",
                           "Level blocks:  360 (3 universe piece(s) per frame)",
                           "Sparse ranges: 101-400 (300), 2001-2512 (512)",
                           "Producer:      Falcon Player FSEQ writer (test data)"}) {
    EXPECT_THAT(r.out, HasSubstr(line));
  }
  Result v1 = Sequence({"inspect", Fseq("v1_basic.fseq")});
  EXPECT_THAT(v1.out, HasSubstr("FSEQ 1.0, uncompressed"));
  EXPECT_THAT(v1.out, HasSubstr("Sparse ranges: none"));
}

TEST_F(SequenceCommand, FramesMeanTheTimelineInEveryFormat) {
  ASSERT_EQ(Sequence({"convert", Fseq("v2_zstd.fseq"), Path("show.tcs")}).exitCode, 0);
  Result plain = Sequence({"convert", Path("show.tcs"), Path("show.tseq")});
  ASSERT_EQ(plain.exitCode, 0) << plain.err;
  EXPECT_THAT(plain.out, HasSubstr("400 frames, 1200 level blocks"));
  for (const std::string& file : {Fseq("v2_zstd.fseq"), Path("show.tcs"), Path("show.tseq")}) {
    Result r = Sequence({"inspect", file});
    EXPECT_THAT(r.out, HasSubstr("Frames:        400 at 25 ms")) << file;
    EXPECT_THAT(r.out, HasSubstr("Level blocks:  1200")) << file;
  }
}

TEST_F(SequenceCommand, LevelsAgreeAcrossFormatsAndWithTheFile) {
  ASSERT_EQ(Sequence({"convert", Fseq("v2_sparse.fseq"), Path("s.tcs")}).exitCode, 0);
  ASSERT_EQ(Sequence({"convert", Path("s.tcs"), Path("s.tseq")}).exitCode, 0);
  std::string expected;
  for (int c = 2000; c < 2004; ++c) {
    std::string level = std::to_string(SparseLevel(77, c));
    expected += std::string(4 - level.size(), ' ') + level;  // right-aligned in four
  }
  for (const std::string& file : {Fseq("v2_sparse.fseq"), Path("s.tcs"), Path("s.tseq")}) {
    for (const std::vector<std::string>& moment : {std::vector<std::string>{"--frame", "77"},
                                                   {"--at", "3.85"},
                                                   {"--at", "0:03.899"},
                                                   {"--at", "3850ms"}}) {
      std::vector<std::string> args{"levels", file, "--channels", "2001-2004"};
      args.insert(args.end(), moment.begin(), moment.end());
      Result r = Sequence(args);
      ASSERT_EQ(r.exitCode, 0) << r.err;
      EXPECT_THAT(r.out, HasSubstr("frame 77 of 120")) << file << " " << moment[1];
      EXPECT_THAT(r.out, HasSubstr("DMX universe 4, slots 465-468 (channels 2001-2004)"));
      EXPECT_THAT(r.out, HasSubstr("465:" + expected)) << r.out;
    }
  }
  Result json = Sequence({"levels", Path("s.tcs"), "--universe", "1", "--frame", "0", "--json"});
  ASSERT_EQ(json.exitCode, 0) << json.err;
  auto doc = nlohmann::json::parse(json.out);
  EXPECT_EQ(doc["time_ms"], 0);
  ASSERT_EQ(doc["dmx"].size(), 1u);
  EXPECT_EQ(doc["dmx"][0]["first_slot"], 101);
  EXPECT_EQ(doc["dmx"][0]["levels"].size(), 300u);
  EXPECT_EQ(doc["dmx"][0]["levels"][0], SparseLevel(0, 100));
}

TEST_F(SequenceCommand, LevelsOfEffectsAreWhereThePlayerResumesThem) {
  Write("fx.tseq", R"({"tessavar_sequence": 1, "length_ms": 5000, "channels": [
    {"name": "Roof", "tav": {"network": 1, "unit": 2, "circuit": 5},
     "effects": [{"at": 1000, "type": "fade", "duration": 2000, "from": 100, "to": 0}]},
    {"name": "Porch", "x10": {"house": "A", "unit": 3},
     "effects": [{"at": 0, "type": "set", "level": 60}, {"at": 4000, "type": "off"}]}]})");
  Result r = Sequence({"levels", Path("fx.tseq"), "--at", "1.5"});
  ASSERT_EQ(r.exitCode, 0) << r.err;
  EXPECT_THAT(r.out, HasSubstr("Roof                 fade      75%  to 0% in 1500 ms"));
  EXPECT_THAT(r.out, HasSubstr("Porch                set       60%"));
  auto doc = nlohmann::json::parse(Sequence({"levels", Path("fx.tseq"), "--json"}).out);
  EXPECT_TRUE(doc["effects"][0]["effect"].is_null());
  EXPECT_EQ(doc["effects"][1]["level"], 60);
}

TEST_F(SequenceCommand, LevelsRefuseWhatTheyCannotShow) {
  std::string file = Fseq("v2_sparse.fseq");
  struct Case {
    std::vector<std::string> args;
    const char* message;
  } cases[] = {
      {{"--at", "soon"}, "--at \"soon\" is not a time"},
      {{"--at", "1:75"}, "is not a time"},
      {{"--at", "6"}, "--at 0:06.000 is past the end"},
      {{"--frame", "120"}, "--frame 120 is not a frame of"},
      {{"--channels", "5-2"}, "--channels \"5-2\" is not a list of channels"},
      {{"--channels", "1-100"}, "has no DMX channels 1-100"},
      {{"--universe", "2"}, "has no DMX universe 2"},
      {{"--at", "1", "--frame", "2"}, "excludes"},
  };
  for (const auto& c : cases) {
    std::vector<std::string> args{"levels", file};
    args.insert(args.end(), c.args.begin(), c.args.end());
    Result r = Sequence(args);
    EXPECT_NE(r.exitCode, 0) << c.message;
    EXPECT_THAT(r.err, HasSubstr(c.message));
  }
}

TEST_F(SequenceCommand, VerifyFindsDamageThatInspectDoesNotRead) {
  ASSERT_EQ(Sequence({"convert", Fseq("v2_zstd.fseq"), Path("good.tcs")}).exitCode, 0);
  Result good = Sequence({"verify", Path("good.tcs")});
  EXPECT_EQ(good.exitCode, 0) << good.err;
  EXPECT_THAT(good.out, HasSubstr("OK (compressed export: every frame read, 400 frames"));
  EXPECT_EQ(Sequence({"verify", Fseq("v2_zstd.fseq")}).exitCode, 0);

  std::string tcs = Read("good.tcs");
  tcs[tcs.size() - 10] ^= 0x33;
  Write("bad.tcs", tcs);
  EXPECT_EQ(Sequence({"inspect", Path("bad.tcs")}).exitCode, 0);
  Result bad = Sequence({"verify", Path("bad.tcs")});
  EXPECT_EQ(bad.exitCode, 1);
  EXPECT_THAT(bad.err, HasSubstr("bad.tcs: damaged at frame"));
  EXPECT_THAT(bad.err, HasSubstr("of 400"));

  // The FSEQ file with its last block's zstd magic broken: the headers read
  // fine, that block does not. The index (at byte 32: first frame, length)
  // says where the block lies.
  std::ifstream in(Fseq("v2_zstd.fseq"), std::ios::binary);
  std::string fseq((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  auto u32 = [&](size_t at) {
    return static_cast<uint8_t>(fseq[at]) | static_cast<uint8_t>(fseq[at + 1]) << 8 |
           static_cast<uint8_t>(fseq[at + 2]) << 16 | static_cast<uint32_t>(fseq[at + 3]) << 24;
  };
  size_t offset = static_cast<uint8_t>(fseq[4]) | static_cast<uint8_t>(fseq[5]) << 8;
  for (int block = 0; block < 9; ++block) offset += u32(32 + 8 * block + 4);
  ASSERT_EQ(u32(32 + 8 * 9), 362u);  // the last block starts at frame 362
  fseq[offset] = 'X';
  Write("bad.fseq", fseq);
  EXPECT_EQ(Sequence({"inspect", Path("bad.fseq")}).exitCode, 0);
  Result badFseq = Sequence({"verify", Path("bad.fseq")});
  EXPECT_EQ(badFseq.exitCode, 1);
  EXPECT_THAT(badFseq.err, HasSubstr("bad.fseq: damaged at frame"));
  EXPECT_THAT(badFseq.err, HasSubstr("damaged at frame 362 of 400"));
}

}  // namespace
}  // namespace tav::showctl::testing
