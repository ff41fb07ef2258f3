#include "show/PlaylistFunctions.h"

#include <gtest/gtest.h>

#include "support/Error.h"

namespace tav {
namespace {

std::vector<std::string> Entries(const Playlist& p) {
  return {p.List().begin(), p.List().end()};
}

TEST(PlaylistText, NewPlaylistsWritePlainNumbers) {
  EXPECT_EQ(PlaylistToText(NewAnimationPlaylist(1)), "(1,0,1,0,,,T,F,F)");
  EXPECT_EQ(PlaylistToText(NewAnimationPlaylist(-1)), "(-1,0,1,0,,,T,F,F)");
  EXPECT_EQ(PlaylistToText(NewMusicalPlaylist(2, 15)), "(0,2,2,15,,,T,F,F)");
}

TEST(PlaylistText, EverythingSurvivesAWriteAndARead) {
  auto p = NewMusicalPlaylist(2, 30);
  p->SetCleanUp("off (all),*.tss");
  for (const char* name : {"intro.tss", "", "C:\\Shows\\Carol (live), take *2*.tss"}) {
    p->List().Add(name);
  }
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

TEST(PlaylistText, ReadingOlderAndOddTexts) {
  struct Case {
    const char* text;
    const char* written;
  } cases[] = {
      // The type is written first, so the other kind's order fields are lost.
      {"(2,3,1,5,,,T,F,F)", "(2,0,1,0,,,T,F,F)"},
      {"(2,3,2,5,,,T,F,F)", "(0,3,2,5,,,T,F,F)"},
      // Lenient numbers: leading number, halves to even, 0 without one.
      {"(0,7s,2, 2.5,,,T,F,F)", "(0,7,2,2,,,T,F,F)"},
      {"(0,abc,2,3.5,,,T,F,F)", "(0,0,2,4,,,T,F,F)"},
      {"(0,1e2,2,*E5,,,T,F,F)", "(0,100,2,0,,,T,F,F)"},
      // Numbers beyond 32 bits are unreadable, so 0, never a failed show.
      {"(0,99999999999,2,1e10,,,T,F,F)", "(0,0,2,0,,,T,F,F)"},
      {"(0,-1e10,2,1e999,,,T,F,F)", "(0,0,2,0,,,T,F,F)"},
      {"(2147483647,0,1,0,,,T,F,F)", "(2147483647,0,1,0,,,T,F,F)"},
      // An empty names field gives no entries, "()" one empty entry.
      {"(1,0,1,0,,(),T,F,F)", "(1,0,1,0,,(),T,F,F)"},
      // Absent trailing flags: LightsOffAtEnd stays true, shuffles read true.
      {"(1,0,1,0,,)", "(1,0,1,0,,,T,T,T)"},
      {"(1,0,1,0,,,F)", "(1,0,1,0,,,F,T,T)"},
      {"(1,0,1,0,,,F,F)", "(1,0,1,0,,,F,F,T)"},
      {"(1,0,1,0,,,t,x,,extra)", "(1,0,1,0,,,T,F,F)"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(PlaylistToText(PlaylistFromText(c.text)), c.written) << c.text;
  }
  EXPECT_EQ(PlaylistFromText("(1,0,1,0,,)")->Count(), 0);
  EXPECT_EQ(PlaylistFromText("(1,0,1,0,,())")->Count(), 1);
}

TEST(PlaylistText, FailuresOfTheFirstSixFields) {
  struct Case {
    const char* text;
    int32_t number;
  } cases[] = {
      {"", 9},                     // no list at all
      {"(1,0,1,0)", 9},            // CleanUp missing
      {"(1,0,1,0,)", 9},           // names missing
      {"(1,0,1,0,,(a)", 2},        // the names list never closes
      {"(1,0,1,0,,(a)(b,c))", 3},  // names field "(a)(b,c)" is no list
      {"(1,0,1,0,,a))", 9},        // a stray ")" swallows the rest: one field
  };
  for (const auto& c : cases) {
    try {
      PlaylistFromText(c.text);
      ADD_FAILURE() << c.text;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), c.number) << c.text;
    }
  }
  EXPECT_THROW(PlaylistToText(std::shared_ptr<Playlist>()), Error);
}

}  // namespace
}  // namespace tav
