#include "show/Playlist.h"

#include <gtest/gtest.h>

#include "show/PlaylistFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

// AnimationType, MusicalType, PlaylistType, Delay: the fields the type rules
// govern, in the order of the text form.
std::vector<int32_t> Orders(const Playlist& p) {
  return {p.AnimationType(), p.MusicalType(), p.PlaylistType(), p.Delay()};
}

TEST(Playlist, TheTypeDecidesWhichOrderFieldsCanBeWritten) {
  Playlist animation;
  EXPECT_EQ(Orders(animation), (std::vector<int32_t>{1, 0, 1, 0}));
  animation.SetMusicalType(3);  // ignored, no error
  animation.SetDelay(5);        // ignored
  animation.SetAnimationType(2);
  EXPECT_EQ(Orders(animation), (std::vector<int32_t>{2, 0, 1, 0}));

  auto musical = NewMusicalPlaylist(3, 5);
  musical->SetAnimationType(2);  // ignored
  EXPECT_EQ(Orders(*musical), (std::vector<int32_t>{0, 3, 2, 5}));
}

TEST(Playlist, ChangingTheTypeResetsTheOrderFields) {
  struct Case {
    const char* what;
    std::vector<int32_t> path;  // PlaylistType writes after NewMusicalPlaylist(3, 5)
    std::vector<int32_t> expected;
  } cases[] = {
      {"same type does nothing", {2}, {0, 3, 2, 5}},
      {"to animation", {1}, {1, 0, 1, 0}},
      {"unknown type resets nothing", {7}, {0, 3, 7, 5}},
      {"back to musical keeps the delay", {7, 2}, {0, 1, 2, 5}},
      {"through animation loses the delay", {1, 2}, {0, 1, 2, 0}},
  };
  for (const auto& c : cases) {
    auto p = NewMusicalPlaylist(3, 5);
    for (int32_t type : c.path) p->SetPlaylistType(type);
    EXPECT_EQ(Orders(*p), c.expected) << c.what;
  }
  // Under an unknown type no order field is live.
  auto p = NewAnimationPlaylist(2);
  p->SetPlaylistType(0);
  p->SetAnimationType(9);
  p->SetMusicalType(9);
  p->SetDelay(9);
  EXPECT_EQ(Orders(*p), (std::vector<int32_t>{2, 0, 0, 0}));
}

TEST(Playlist, ListIsNumberedFromOne) {
  Playlist p;
  TextCollection& list = p.List();
  list.Add("b");
  list.Insert(1, "a");
  list.Add("c");
  list.Remove(2);
  EXPECT_EQ(p.Count(), 2);
  EXPECT_EQ(list.Item(1), "a");
  EXPECT_EQ(list.Item(2), "c");
  for (int32_t bad : {0, 3}) {
    try {
      list.Item(bad);
      ADD_FAILURE() << bad;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), 9);
    }
    EXPECT_THROW(list.Remove(bad), Error);
  }
}

}  // namespace
}  // namespace tav
