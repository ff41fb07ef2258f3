#include "suite/seqlib/CompressedSequence.h"

#include <gtest/gtest.h>

#include "suite/seqlib/PlainSequence.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {
namespace {

CompiledSequence Sample() {
  SequenceData data;
  data.media = "tune.ogg";
  data.shellCommand = "logger show";
  data.subsequences = {{"a.tseq", 100}};
  data.channels.push_back({"Roof",
                           {kFamilyTAV, 1, 2, 3},
                           {{500, 100, kEffectFade, 0, 100, 1}, {0, 0, kEffectSet, 30, 30, 0}}});
  data.channels.push_back({"Porch", {kFamilyX10, 1, 0, 16}, {{250, 0, kEffectOff, 0, 0, 0}}});
  data.tracks.push_back({kFamilyDMX, 4, 0, 1, 3, 40, 50, {1, 2, 3, 4, 5, 6}});
  CompiledSequence compiled = Compile(data, [](const SubsequenceRef&) { return nullptr; });
  compiled.sourceHash = 0x0123456789abcdefull;
  return compiled;
}

TEST(CompressedSequence, RoundTripKeepsEverything) {
  CompiledSequence original = Sample();
  std::string bytes = WriteCompressedSequence(original);
  EXPECT_TRUE(LooksLikeCompressedSequence(bytes));
  EXPECT_EQ(ReadCompressedSourceHash(bytes.substr(0, kCompressedHeaderBytes)),
            0x0123456789abcdefull);
  CompiledSequence back = ReadCompressedSequence(bytes, "a.tcs");
  EXPECT_EQ(back, original);
  // Effects are stored in play order.
  ASSERT_EQ(back.effects.size(), 3u);
  EXPECT_EQ(back.effects[0].atMs, 0);
  EXPECT_EQ(back.effects[1].atMs, 250);
  EXPECT_EQ(back.effects[2].atMs, 500);
}

TEST(CompressedSequence, ManyEffectsAndNothingAfterThemReadBack) {
  SequenceData data;
  SequenceChannel channel{"c", {kFamilyFennick, 1, 0, 2}, {}};
  for (int i = 0; i < 40; ++i) channel.effects.push_back({i * 5, 5, kEffectShimmer, 0, 100, -3});
  data.channels.push_back(channel);
  CompiledSequence compiled = Compile(data, [](const SubsequenceRef&) { return nullptr; });
  EXPECT_EQ(ReadCompressedSequence(WriteCompressedSequence(compiled), "many.tcs"), compiled);
}

TEST(CompressedSequence, EveryTruncationAndEveryFlippedByteIsAnErrorOrHarmless) {
  std::string bytes = WriteCompressedSequence(Sample());
  for (size_t length = 0; length < bytes.size(); ++length) {
    EXPECT_THROW(ReadCompressedSequence(bytes.substr(0, length), "a.tcs"), Error) << length;
  }
  for (size_t i = 0; i < bytes.size(); ++i) {
    std::string damaged = bytes;
    damaged[i] = static_cast<char>(damaged[i] ^ 0x41);
    try {
      ReadCompressedSequence(damaged, "a.tcs");
    } catch (const Error& e) {
      EXPECT_NE(e.Description().find("a.tcs"), std::string::npos);
    }
  }
}

TEST(CompressedSequence, ALargeExportReportsProgressWhileCompressing) {
  SequenceData data;
  LevelTrack track{kFamilyDMX, 1, 0, 1, 512, 0, 25, {}};
  for (int frame = 0; frame < 5000; ++frame) {
    for (int slot = 0; slot < 512; ++slot) track.levels.push_back((frame * 7 + slot) & 0xFF);
  }
  data.tracks.push_back(track);
  CompiledSequence compiled = Compile(data, [](const SubsequenceRef&) { return nullptr; });
  int calls = 0;
  std::string bytes = WriteCompressedSequence(compiled, 3, [&] { ++calls; });
  EXPECT_GE(calls, 2);  // 2.5 MB of levels: more than one block of about a mebibyte
  EXPECT_EQ(ReadCompressedSequence(bytes, "large.tcs"), compiled);
}

TEST(CompressedSequence, RefusesOtherFiles) {
  EXPECT_FALSE(ReadCompressedSourceHash("PSEQ............").has_value());
  try {
    ReadCompressedSequence("{\"tessavar_sequence\": 1}", "x.tcs");
    FAIL();
  } catch (const Error& e) {
    EXPECT_NE(e.Description().find("not a compressed sequence"), std::string::npos);
  }
}

TEST(Compile, MergesSubsequencesAtTheirOffsetsAndSharesChannels) {
  SequenceData sub;
  sub.lengthMs = 1000;
  sub.channels.push_back({"Roof", {kFamilyTAV, 1, 2, 3}, {{0, 0, kEffectSet, 50, 50, 0}}});
  sub.tracks.push_back({kFamilyDMX, 1, 0, 1, 1, 0, 100, {9}});
  auto compiledSub = std::make_shared<CompiledSequence>(
      Compile(sub, [](const SubsequenceRef&) { return nullptr; }));

  SequenceData main;
  main.channels.push_back({"Roof",
                           {kFamilyTAV, 1, 2, 3},
                           {{100, 0, kEffectSet, 10, 10, 0}, {9000, 0, kEffectOff, 0, 0, 0}}});
  main.subsequences = {{"sub", 5000}, {"sub", 200}};
  std::vector<std::string> asked;
  CompiledSequence c = Compile(main, [&](const SubsequenceRef& ref) {
    asked.push_back(ref.file);
    return compiledSub;
  });
  EXPECT_EQ(asked.size(), 2u);
  EXPECT_EQ(c.channels.size(), 1u);
  std::vector<int64_t> times;
  for (const auto& e : c.effects) times.push_back(e.atMs);
  EXPECT_EQ(times, (std::vector<int64_t>{100, 200, 5000, 9000}));
  ASSERT_EQ(c.tracks.size(), 2u);
  EXPECT_EQ(c.tracks[0].startMs, 5000);
  EXPECT_EQ(c.tracks[1].startMs, 200);
  EXPECT_EQ(c.lengthMs, 9000);

  SequenceData back = Decompile(c);
  EXPECT_EQ(back.channels[0].effects.size(), 4u);
  EXPECT_TRUE(back.subsequences.empty());
}

}  // namespace
}  // namespace tav
