#include "show/ShowFunctions.h"

#include <gtest/gtest.h>

#include "show/InteractiveGroupFunctions.h"
#include "show/PlaylistFunctions.h"
#include "show/TriggerFunctions.h"
#include "show/TriggeredSequencesFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

const std::string kNewShowText =
    "((0,1,2,0,,,T,F,F),(0,1,2,0,,,T,F,F),(1,0,1,0,,,T,F,F),(0,1,2,0,,,T,F,F),,"
    "(2,0,1,0,,,T,F,F),, 0,,F)";

// Every part of a show in use: entries, a cleanup, a delay, shuffle flags,
// two groups, a startup trigger and preloading.
const std::string kFullShowText =
    "((0,1,2,0,,(welcome.tss),T,F,F),(0,1,2,0,,,T,F,F),"
    "(1,0,1,0,off.tss,(a.tss,b *Oslow*C.tss),T,F,F),(0,2,2,10,,(carol.tss),T,T,T),,"
    "(2,0,1,0,,(twinkle.tss),F,F,F),"
    "(( 1,,F,T,T,Door,((bell.tss,( 1,door, 3, 1))),T),"
    "( 1,Kids,T,T,F,Toys,((a.tss,( 2,, 4, 1),b.tss)),F)), 1,( 7,start, 3, 1),T)";

std::string Reread(std::string_view text) {
  auto show = ShowFromText(text);
  return show ? ShowToText(show) : "(null)";
}

std::vector<std::string> GroupNames(const Show& show) {
  std::vector<std::string> names;
  for (const auto& g : *show.InteractiveGroups()) names.push_back(g->Name());
  return names;
}

TEST(ShowText, CanonicalTextsRoundTripByteForByte) {
  EXPECT_EQ(ShowToText(std::make_shared<Show>()), kNewShowText);
  EXPECT_EQ(Reread(kNewShowText), kNewShowText);
  EXPECT_EQ(Reread(kFullShowText), kFullShowText);
}

TEST(ShowText, ReadsEveryPartOfAFullShow) {
  auto show = ShowFromText(kFullShowText);
  ASSERT_NE(show, nullptr);
  EXPECT_EQ(show->Main()->List().Item(2), "b (slow).tss");
  EXPECT_EQ(show->Musical()->Delay(), 10);
  EXPECT_EQ(GroupNames(*show), (std::vector<std::string>{"Door", "Toys"}));
  EXPECT_EQ((*show->InteractiveGroups())[1]->TypeName(), "Magic Toy");
  EXPECT_EQ(show->StartupType(), 1);
  EXPECT_EQ(show->StartupTrigger()->Name(), "start");
  EXPECT_TRUE(show->PreloadSequences());
}

TEST(ShowText, OlderFilesAreBroughtUpToTheCurrentLayout) {
  const std::string four =
      "(0,1,2,0,,,T,F,F),(0,1,2,0,,,T,F,F),(1,0,1,0,,,T,F,F),(0,1,2,0,,,T,F,F)";
  const std::string written = "(" + four + ",,(2,0,1,0,,,F,F,F),";
  struct Case {
    const char* tail;  // after the fourth playlist
    std::string expected;
  } cases[] = {
      // Five fields: Background all at once, no entries, lights off, both
      // shuffle flags true; no groups, StartupType 0, no trigger, no preload.
      {",reserved)", "(" + four + ",,(2,0,1,0,,,T,T,T),, 0,,F)"},
      {",,(2,0,1,0,,,F,F,F))", written + ", 0,,F)"},
      {",,(2,0,1,0,,,F,F,F),)", written + ", 0,,F)"},
      {",,(2,0,1,0,,,F,F,F),, 2)", written + ", 2,,F)"},
      {",,(2,0,1,0,,,F,F,F),, 2,( 1,, 2, 3))", written + ", 2,( 1,, 2, 3),F)"},
      {",,(2,0,1,0,,,F,F,F),, 2,( 1,, 2, 3),T)", written + ", 2,( 1,, 2, 3),T)"},
      {",,(2,0,1,0,,,F,F,F),, 2,( 1,, 2, 3),T,more)", written + ", 2,( 1,, 2, 3),T)"},
  };
  for (const auto& c : cases) EXPECT_EQ(Reread("(" + four + c.tail), c.expected) << c.tail;
}

TEST(ShowText, PlaylistTypesAreForcedBySection) {
  // Main stored as musical, Startup as animation, Background as type 7.
  auto show = ShowFromText("((2,3,1,5,,),(0,1,2,0,,),(2,3,2,5,,),(0,1,2,0,,),,(2,0,7,0,,),, 0,,F)");
  ASSERT_NE(show, nullptr);
  EXPECT_EQ(PlaylistToText(show->Startup()), "(0,1,2,0,,,T,T,T)");
  EXPECT_EQ(PlaylistToText(show->Main()), "(1,0,1,0,,,T,T,T)");
  // Under type 7 no order field was taken; the forced type 1 sets its own.
  EXPECT_EQ(PlaylistToText(show->Background()), "(1,0,1,0,,,T,T,T)");
}

TEST(ShowText, WhatIsDroppedAndWhatFails) {
  const std::string head = "((0,1,2,0,,),(0,1,2,0,,),(1,0,1,0,,),(0,1,2,0,,),,(2,0,1,0,,),";
  const std::string good = "( 1,,F,F,T,Good,((a,( 1,, 2, 3))),T)";
  struct Case {
    const char* what;
    std::string text;
    const char* groups;  // names joined, or "(null)" when no show is returned
    int32_t startupType;
    bool hasTrigger;
  } cases[] = {
      {"group without bindings", head + "(( 1,,F,F,T,Empty,,T)," + good + "), 0,,F)", "Good", 0,
       false},
      {"group with a bad trigger number",
       head + "(" + good + ",( 1,,F,F,T,Bad,((a,( 1,,x, 3))),T)), 0,,F)", "Good", 0, false},
      {"group field \"()\"", head + "(), 0,,F)", "", 0, false},
      {"trigger that is no list", head + ", 0,trigger,F)", "", 0, false},
      {"trigger with a bad number", head + ", 0,( 1,,x, 3),F)", "", 0, false},
      {"StartupType no number", head + ",two,( 1,, 2, 3),F)", "", 0, true},
      {"StartupType rounded down", head + ", 2.7,,F)", "", 2, false},
      {"playlist numbers beyond 32 bits",
       "((0,1,2,99999999999,,),(0,1,2,0,,),(1e10,0,1,0,,),(0,1,2,0,,),,(2,0,1,0,,),, 0,,F)", "", 0,
       false},
      {"playlist field empty", "((0,1,2,0,,),,(1,0,1,0,,),(0,1,2,0,,),)", "(null)", 0, false},
      {"fewer than five fields", "((0,1,2,0,,),(0,1,2,0,,),(1,0,1,0,,))", "(null)", 0, false},
      {"playlist without names field", head.substr(0, head.size() - 12) + "(2,0,1,0,),, 0,,F)",
       "(null)", 0, false},
      {"empty text", "", "(null)", 0, false},
      {"plain text", "no show here", "(null)", 0, false},
  };
  for (const auto& c : cases) {
    auto show = ShowFromText(c.text);
    std::string groups = "(null)";
    if (show) {
      groups.clear();
      for (const auto& name : GroupNames(*show)) groups += name;
      EXPECT_EQ(show->StartupType(), c.startupType) << c.what;
      EXPECT_EQ(show->StartupTrigger() != nullptr, c.hasTrigger) << c.what;
    }
    EXPECT_EQ(groups, c.groups) << c.what;
  }
}

TEST(ShowText, BadlyFormattedListsRaiseToTheCaller) {
  struct Case {
    std::string text;
    int32_t number;
  } cases[] = {
      // Cut short: the last ")" closes a playlist, and the list never closes.
      {"((0,1,2,0,,),(0,1,2,0,,),(1,0,1,0,,),(0,1,2,0,,),", 2},
      {"((0,1,2,0,,),(0,1,2,0,,),(1,0,1,0,,),(0,1,2,0,,),,(2,0,1,0,,),)x(, 0,,F)", 3},
      {"((0,1,2,0,,),(0,1,2,0,,),(1,0,1,0,,),(0,1,2,0,,),,(2,0,1,0,,),(a,(b), 0,,F)", 4},
      {"0,1,2,0,,)", 1},
      // The show list is fine; its groups field "(a)(b,c)" is not.
      {"((0,1,2,0,,),(0,1,2,0,,),(1,0,1,0,,),(0,1,2,0,,),,(2,0,1,0,,),(a)(b,c), 0,,F)", 3},
  };
  for (const auto& c : cases) {
    try {
      ShowFromText(c.text);
      ADD_FAILURE() << c.text;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), c.number) << c.text;
      EXPECT_EQ(e.Source(), "Serialize.ListFromText");
    }
  }
}

TEST(NewShow, SharesItsPartsNormalisesTypesAndRemovesNullGroups) {
  auto startup = NewAnimationPlaylist(2), shutdown = NewMusicalPlaylist(3, 4);
  auto main = NewMusicalPlaylist(1, 9), musical = NewMusicalPlaylist(2, 5);
  auto background = NewAnimationPlaylist(2);
  auto door = InteractiveGroupFromText("( 1,,F,F,T,Door,((a,( 1,, 2, 3))),T)");
  auto toys = InteractiveGroupFromText("( 1,,F,F,T,Toys,((b,( 1,, 2, 4))),T)");
  auto groups = std::make_shared<InteractiveGroupList>(
      InteractiveGroupList{nullptr, door, nullptr, nullptr, toys, nullptr});
  auto trigger = NewTrigger(1, 2, 3, "go");

  auto show = NewShow(startup, shutdown, main, musical, background, groups, 2, trigger, true);
  EXPECT_EQ(show->Startup(), startup);
  EXPECT_EQ(show->Main(), main);
  EXPECT_EQ(show->InteractiveGroups(), groups);
  EXPECT_EQ(show->StartupTrigger(), trigger);
  EXPECT_EQ(*groups, (InteractiveGroupList{door, toys}));
  // The caller's playlists were changed in place.
  EXPECT_EQ(PlaylistToText(startup), "(0,1,2,0,,,T,F,F)");
  EXPECT_EQ(PlaylistToText(main), "(1,0,1,0,,,T,F,F)");
  EXPECT_EQ(PlaylistToText(shutdown), "(0,3,2,4,,,T,F,F)");
  EXPECT_EQ(show->StartupType(), 2);
  EXPECT_TRUE(show->PreloadSequences());
}

TEST(NewShow, NullPartsFail) {
  auto groups = std::make_shared<InteractiveGroupList>();
  for (int nullAt = 0; nullAt <= 5; ++nullAt) {
    std::shared_ptr<Playlist> p[5];
    for (int i = 0; i < 5; ++i) p[i] = i == nullAt ? nullptr : NewAnimationPlaylist(1);
    try {
      NewShow(p[0], p[1], p[2], p[3], p[4], nullAt == 5 ? nullptr : groups, 0, nullptr, false);
      ADD_FAILURE() << nullAt;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), 91) << nullAt;
    }
  }
}

TEST(ShowText, GroupsWithoutBindingsCannotBeWritten) {
  auto show = std::make_shared<Show>();
  auto group = std::make_shared<InteractiveGroup>();
  show->InteractiveGroups()->push_back(group);
  EXPECT_THROW(ShowToText(show), Error);
  group->AddTriggeredSequences(NewTriggeredSequences(NewTrigger(1, 2, 3, ""), {"a"}));
  EXPECT_EQ(ShowToText(show),
            "((0,1,2,0,,,T,F,F),(0,1,2,0,,,T,F,F),(1,0,1,0,,,T,F,F),(0,1,2,0,,,T,F,F),,"
            "(2,0,1,0,,,T,F,F),(( 1,,F,F,T,,((a,( 3,, 2, 1))),T)), 0,,F)");
}

}  // namespace
}  // namespace tav
