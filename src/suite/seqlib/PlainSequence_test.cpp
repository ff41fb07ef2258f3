#include "suite/seqlib/PlainSequence.h"

#include <gtest/gtest.h>

#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {
namespace {

const char* kEveryFamily = R"({
  "tessavar_sequence": 1,
  "media": "carol.mp3",
  "shell_command": "echo hi",
  "channels": [
    {"name": "Roof", "tav": {"network": 1, "unit": 2, "circuit": 5},
     "effects": [{"at": 0, "type": "set", "level": 100},
                 {"at": 1000, "type": "fade", "duration": 2000, "from": 100, "to": 0}]},
    {"name": "Porch", "x10": {"house": "c", "unit": 3},
     "effects": [{"at": 500, "type": "twinkle", "duration": 800, "priority": 2}]},
    {"name": "Arch", "fennick": {"network": 2, "channel": 12},
     "effects": [{"at": 250, "type": "shimmer", "duration": 100, "from": 10, "to": 90}]},
    {"dmx": {"universe": 3, "slot": 512}, "effects": [{"at": 4000, "type": "off"}]}
  ],
  "frames": [
    {"dmx": {"universe": 1, "first_slot": 10, "count": 3}, "start_ms": 100, "step_ms": 50,
     "levels": ["ff0001", [1, 2, 3]]},
    {"tav": {"network": 1, "unit": 4, "first_circuit": 1, "count": 2}, "step_ms": 25, "levels": ["0a0b"]}
  ],
  "subsequences": [{"file": "intro.tseq", "offset_ms": 3000}]
})";

TEST(PlainSequence, ReadsEveryFamilyEffectAndTrack) {
  SequenceData data = ParsePlainSequence(kEveryFamily, "show.tseq");
  EXPECT_EQ(data.media, "carol.mp3");
  EXPECT_EQ(data.shellCommand, "echo hi");
  ASSERT_EQ(data.channels.size(), 4u);
  EXPECT_EQ(data.channels[0].address, (ChannelAddress{kFamilyTAV, 1, 2, 5}));
  EXPECT_EQ(data.channels[0].effects[0], (Effect{0, 0, kEffectSet, 100, 100, 0}));
  EXPECT_EQ(data.channels[0].effects[1], (Effect{1000, 2000, kEffectFade, 100, 0, 0}));
  EXPECT_EQ(data.channels[1].address, (ChannelAddress{kFamilyX10, 3, 0, 3}));
  EXPECT_EQ(data.channels[1].effects[0], (Effect{500, 800, kEffectTwinkle, 0, 100, 2}));
  EXPECT_EQ(data.channels[2].address, (ChannelAddress{kFamilyFennick, 2, 0, 12}));
  EXPECT_EQ(data.channels[3].address, (ChannelAddress{kFamilyDMX, 3, 0, 512}));
  EXPECT_EQ(data.channels[3].effects[0].type, kEffectOff);
  ASSERT_EQ(data.tracks.size(), 2u);
  EXPECT_EQ(data.tracks[0].levels, (std::vector<uint8_t>{255, 0, 1, 1, 2, 3}));
  EXPECT_EQ(data.tracks[0].EndMs(), 200);
  EXPECT_EQ(data.tracks[1].family, kFamilyTAV);
  EXPECT_EQ(data.tracks[1].unit, 4);
  EXPECT_EQ(data.subsequences, (std::vector<SubsequenceRef>{{"intro.tseq", 3000}}));
  EXPECT_EQ(data.EffectiveLengthMs(), 4000);
}

TEST(PlainSequence, WritingAndReadingGivesTheSameSequence) {
  SequenceData data = ParsePlainSequence(kEveryFamily, "show.tseq");
  std::string text = WritePlainSequence(data);
  EXPECT_TRUE(LooksLikePlainSequence(text));
  EXPECT_EQ(ParsePlainSequence(text, "again"), data);
}

struct BadFile {
  const char* text;
  const char* words;
};

TEST(PlainSequence, BadFilesSayWhatAndWhere) {
  const BadFile cases[] = {
      {"{\"tessavar_sequence\": 1,\n \"channels\": [}", "line 2, column 15"},
      {"[1, 2]", "expected an object"},
      {R"({"tessavar_sequence": 3e3333})", "not valid JSON (number overflow"},
      {"{}", "no \"tessavar_sequence\""},
      {R"({"tessavar_sequence": 7})", "version 7 is newer"},
      {R"({"tessavar_sequence": 1, "channels": [{"effects": []}]})", "channels[0]: no address"},
      {R"({"tessavar_sequence": 1, "channels": [{"dmx": {"universe": 1, "slot": 1}, "tav": {"network": 1, "unit": 1, "circuit": 1}}]})",
       "more than one address"},
      {R"({"tessavar_sequence": 1, "channels": [{"dmx": {"universe": 1, "slot": 513}}]})",
       "channels[0].dmx.slot: 513 is outside 1-512"},
      {R"({"tessavar_sequence": 1, "channels": [{"x10": {"house": "Q", "unit": 1}}]})",
       "not a letter A-P"},
      {R"({"tessavar_sequence": 1, "channels": [{"fennick": {"network": 1, "channel": 1}, "effects": [{"at": 0, "type": "sparkle"}]}]})",
       "channels[0].effects[0].type: unknown effect \"sparkle\""},
      {R"({"tessavar_sequence": 1, "channels": [{"fennick": {"network": 1, "channel": 1}, "effects": [{"at": 0, "type": "fade", "from": 0, "to": 140}]}]})",
       "effects[0].to: 140 is outside 0-100"},
      {R"({"tessavar_sequence": 1, "channels": [{"fennick": {"network": 1, "channel": 1}, "effects": [{"at": 1.5, "type": "off"}]}]})",
       "expected a whole number"},
      {R"({"tessavar_sequence": 1, "channels": [{"fennick": {"network": 1, "channel": 1}, "effects": [{"type": "off"}]}]})",
       "effects[0]: missing \"at\""},
      {R"({"tessavar_sequence": 1, "frames": [{"dmx": {"universe": 1, "first_slot": 510, "count": 5}, "step_ms": 50, "levels": []}]})",
       "run past slot 512"},
      {R"({"tessavar_sequence": 1, "frames": [{"dmx": {"universe": 1, "first_slot": 1, "count": 2}, "step_ms": 50, "levels": ["ff"]}]})",
       "frames[0].levels[0]: holds 2 hexadecimal digits, 4 expected"},
      {R"({"tessavar_sequence": 1, "frames": [{"dmx": {"universe": 1, "first_slot": 1, "count": 1}, "step_ms": 50, "levels": ["zz"]}]})",
       "'z' is not a hexadecimal digit"},
      {R"({"tessavar_sequence": 1, "frames": [{"dmx": {"universe": 1, "first_slot": 1, "count": 1}, "step_ms": 0, "levels": []}]})",
       "step_ms: 0 is outside"},
      {R"({"tessavar_sequence": 1, "subsequences": [{"file": ""}]})",
       "subsequences[0].file: empty file name"},
  };
  for (const auto& bad : cases) {
    try {
      ParsePlainSequence(bad.text, "show.tseq");
      ADD_FAILURE() << "accepted: " << bad.text;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), seqerrors::kInvalidFileFormat);
      EXPECT_NE(e.Description().find("show.tseq: "), std::string::npos) << e.Description();
      EXPECT_NE(e.Description().find(bad.words), std::string::npos) << e.Description();
    }
  }
}

TEST(PlainSequence, AListOfAddressRunsSharesEachFrame) {
  SequenceData data = ParsePlainSequence(R"({"tessavar_sequence": 1, "frames": [
    {"dmx": [{"universe": 1, "first_slot": 511, "count": 2}, {"universe": 2, "first_slot": 1,
              "count": 1}],
     "start_ms": 40, "step_ms": 20, "levels": ["010203", [4, 5, 6]]}]})",
                                         "g.tseq");
  ASSERT_EQ(data.tracks.size(), 2u);
  EXPECT_EQ(data.tracks[0], (LevelTrack{kFamilyDMX, 1, 0, 511, 2, 40, 20, {1, 2, 4, 5}}));
  EXPECT_EQ(data.tracks[1], (LevelTrack{kFamilyDMX, 2, 0, 1, 1, 40, 20, {3, 6}}));
  // Written back, neighbours of one timing become one entry again.
  std::string text = WritePlainSequence(data);
  EXPECT_NE(text.find("\"dmx\": [{\"universe\":1,"), std::string::npos) << text;
  EXPECT_EQ(ParsePlainSequence(text, "again"), data);

  for (const auto& [bad, words] : std::vector<std::pair<std::string, std::string>>{
           {R"({"tessavar_sequence": 1, "frames": [{"dmx": [], "step_ms": 5, "levels": []}]})",
            "frames[0].dmx: empty list of address runs"},
           {R"({"tessavar_sequence": 1, "frames": [{"tav": [{"network": 1, "unit": 1,
               "first_circuit": 1, "count": 2}, {"network": 1}], "step_ms": 5, "levels": []}]})",
            "frames[0].tav[1]: missing \"unit\""},
           {R"({"tessavar_sequence": 1, "frames": [{"dmx": [{"universe": 1, "first_slot": 1,
               "count": 2}, {"universe": 2, "first_slot": 1, "count": 1}], "step_ms": 5,
               "levels": ["0102"]}]})",
            "frames[0].levels[0]: holds 4 hexadecimal digits, 6 expected"}}) {
    try {
      ParsePlainSequence(bad, "g.tseq");
      ADD_FAILURE() << "accepted: " << bad;
    } catch (const Error& e) {
      EXPECT_NE(e.Description().find(words), std::string::npos) << e.Description();
    }
  }
}

TEST(PlainSequence, RecognisedByContentNotName) {
  EXPECT_TRUE(LooksLikePlainSequence("\xEF\xBB\xBF  \n{\"tessavar_sequence\": 1}"));
  EXPECT_FALSE(LooksLikePlainSequence("PSEQ"));
  EXPECT_FALSE(LooksLikePlainSequence(""));
}

TEST(PlainSequence, ReportsProgressWhileParsingLongTexts) {
  SequenceData data;
  SequenceChannel channel{"c", {kFamilyDMX, 1, 0, 1}, {}};
  for (int i = 0; i < 5000; ++i) channel.effects.push_back({i * 10, 10, kEffectSet, 50, 50, 0});
  data.channels.push_back(channel);
  int calls = 0;
  ParsePlainSequence(WritePlainSequence(data), "long", [&] { ++calls; });
  EXPECT_GT(calls, 1);
}

}  // namespace
}  // namespace tav
