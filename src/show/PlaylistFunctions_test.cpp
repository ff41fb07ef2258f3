#include "show/PlaylistFunctions.h"

#include <gtest/gtest.h>

#include "support/Error.h"

namespace tav {
namespace {

int32_t ReadError(std::string_view text) {
  try {
    PlaylistFromText(text);
  } catch (const Error& e) {
    return e.Number();
  }
  return 0;
}

std::vector<std::string> Entries(const Playlist& p) {
  return {p.List().begin(), p.List().end()};
}

TEST(PlaylistText, NewPlaylistsWritePlainNumbers) {
  EXPECT_EQ(PlaylistToText(NewAnimationPlaylist(1)), "(1,0,1,0,,,T,F,F)");
  EXPECT_EQ(PlaylistToText(NewAnimationPlaylist(-1)), "(-1,0,1,0,,,T,F,F)");
  EXPECT_EQ(PlaylistToText(NewMusicalPlaylist(1, 0)), "(0,1,2,0,,,T,F,F)");
  EXPECT_EQ(PlaylistToText(NewMusicalPlaylist(2, 15)), "(0,2,2,15,,,T,F,F)");
}

TEST(PlaylistText, EverythingSurvivesAWriteAndARead) {
  auto p = NewMusicalPlaylist(2, 30);
  p->SetCleanUp("off (all),*.tss");
  p->List().Add("intro.tss");
  p->List().Add("");
  p->List().Add("C:\\Shows\\Carol (live), take *2*.tss");
  p->SetLightsOffAtEnd(false);
  p->SetShuffleWithReplacement(true);

  std::string text = PlaylistToText(p);
  EXPECT_EQ(text,
            "(0,2,2,30,off *Oall*C*S*E.tss,(intro.tss,,C:\\Shows\\Carol *Olive*C*S take "
            "*E2*E.tss),F,F,T)");
  auto back = PlaylistFromText(text);
  EXPECT_EQ(back->CleanUp(), p->CleanUp());
  EXPECT_EQ(Entries(*back), Entries(*p));
  EXPECT_EQ(PlaylistToText(back), text);
}

TEST(PlaylistText, TheStoredTypeDropsTheOtherKindsOrderFields) {
  auto main = PlaylistFromText("(2,3,1,5,,)");
  EXPECT_EQ(main->AnimationType(), 2);
  EXPECT_EQ(main->MusicalType(), 0);
  EXPECT_EQ(main->Delay(), 0);
  auto musical = PlaylistFromText("(2,3,2,5,,)");
  EXPECT_EQ(musical->AnimationType(), 0);
  EXPECT_EQ(musical->MusicalType(), 3);
  EXPECT_EQ(musical->Delay(), 5);
}

TEST(PlaylistText, NumberFieldsAreReadLeniently) {
  struct Case {
    const char* field;
    int32_t delay;
  } cases[] = {
      {"7", 7},   {" 7", 7},  {"7s", 7},  {"", 0},      {"abc", 0},
      {"-3", -3}, {"2.5", 2}, {"3.5", 4}, {"1e2", 100}, {"*E5", 0},
  };
  for (const auto& c : cases) {
    std::string text = std::string("(0,1,2,") + c.field + ",,)";
    EXPECT_EQ(PlaylistFromText(text)->Delay(), c.delay) << c.field;
  }
}

TEST(PlaylistText, NamesFieldEmptyOrEmptyList) {
  EXPECT_EQ(PlaylistFromText("(1,0,1,0,,)")->Count(), 0);
  auto one = PlaylistFromText("(1,0,1,0,,())");
  EXPECT_EQ(Entries(*one), (std::vector<std::string>{""}));
  EXPECT_EQ(PlaylistToText(one), "(1,0,1,0,,(),T,T,T)");
}

TEST(PlaylistText, OlderTextsFillTheTrailingFlags) {
  struct Case {
    const char* text;
    const char* written;
  } cases[] = {
      // Absent shuffle flags read as true, unlike a new playlist's.
      {"(1,0,1,0,,)", "(1,0,1,0,,,T,T,T)"},      {"(1,0,1,0,,,F)", "(1,0,1,0,,,F,T,T)"},
      {"(1,0,1,0,,,F,F)", "(1,0,1,0,,,F,F,T)"},  {"(1,0,1,0,,,F,F,F)", "(1,0,1,0,,,F,F,F)"},
      {"(1,0,1,0,,,t,x,)", "(1,0,1,0,,,T,F,F)"},
  };
  for (const auto& c : cases) EXPECT_EQ(PlaylistToText(PlaylistFromText(c.text)), c.written);
}

TEST(PlaylistText, FailuresOfTheFirstSixFields) {
  struct Case {
    const char* text;
    int32_t number;
  } cases[] = {
      {"", 9},                         // no list at all
      {"(1,0,1,0)", 9},                // CleanUp missing
      {"(1,0,1,0,)", 9},               // names missing
      {"(1,0,1,0,,(a)", 2},            // the names list never closes
      {"(1,0,1,0,,(a)(b,c))", 3},      // names field "(a)(b,c)" is no list
      {"(1,0,1,0,,a))", 9},            // a stray ")" swallows the rest
      {"(1,0,1,0,,,T,F,F", 1},         // the text is no list
      {"(1,0,1,0,,(a,(b)),T)", 0},     // nested names are taken raw
      {"(1,0,1,0,,,T,F,F,extra)", 0},  // later fields are ignored
  };
  for (const auto& c : cases) EXPECT_EQ(ReadError(c.text), c.number) << c.text;
  EXPECT_THROW(PlaylistToText(std::shared_ptr<Playlist>()), Error);
}

}  // namespace
}  // namespace tav
