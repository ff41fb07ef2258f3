#include "schedule/TimeRange.h"

#include <gtest/gtest.h>

#include <random>

#include "support/Error.h"

namespace tav {
namespace {

const DateTime kBase = DateTime::FromParts(2024, 12, 24, 18, 0, 0);
DateTime At(int seconds) {
  return kBase.AddSeconds(seconds);
}

std::shared_ptr<TimeRange> Range(std::optional<int> start, std::optional<int> end) {
  auto r = std::make_shared<TimeRange>();
  if (start) r->SetStartTime(At(*start));
  if (end) r->SetEndTime(At(*end));
  return r;
}

TEST(TimeRange, MissingBoundsFailWithError37) {
  TimeRange r;
  try {
    r.StartTime();
    ADD_FAILURE();
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 37);
    EXPECT_EQ(e.Description(), "Time range has no start");
  }
  try {
    r.EndTime();
    ADD_FAILURE();
  } catch (const Error& e) {
    EXPECT_EQ(e.Description(), "Time range has no end");
  }
}

TEST(TimeRange, WritingABoundOnTheWrongSideDropsTheOther) {
  auto r = Range(10, 20);
  r->SetEndTime(At(5));
  EXPECT_FALSE(r->HasStart());
  EXPECT_TRUE(r->HasEnd());

  r = Range(10, 20);
  r->SetStartTime(At(20));  // equal to the end: both kept
  EXPECT_TRUE(r->HasStart() && r->HasEnd());
  r->SetStartTime(At(21));
  EXPECT_FALSE(r->HasEnd());

  r->ClearStart();
  EXPECT_FALSE(r->HasStart());
  r->SetStartTime(At(1));
  EXPECT_EQ(r->StartTime(), At(1));
}

TEST(TimeRange, IncludesHonoursInclusiveness) {
  EXPECT_TRUE(TimeRange().Includes(At(0), false, false));
  auto point = Range(0, 0);
  EXPECT_TRUE(point->Includes(At(0), true, true));
  EXPECT_FALSE(point->Includes(At(0), true, false));
  EXPECT_FALSE(point->Includes(At(0), false, true));
  auto r = Range(0, 10);
  EXPECT_TRUE(r->Includes(At(5), false, false));
  EXPECT_FALSE(r->Includes(At(-1), true, true));
  EXPECT_FALSE(r->Includes(At(11), true, true));
  EXPECT_TRUE(Range(0, std::nullopt)->Includes(At(1000000), false, false));
  EXPECT_TRUE(Range(std::nullopt, 0)->Includes(At(-1000000), false, false));
}

TEST(TimeRange, OverlapsWithOpenEndsFollowsItsOwnRules) {
  struct Case {
    std::optional<int> s1, e1, s2, e2;
    bool ts, te, os, oe;
    bool expected;
  };
  const auto none = std::nullopt;
  const Case cases[] = {
      {none, none, 5, 6, false, false, false, false, true},
      {none, 10, 10, none, true, true, true, false, true},    // touch, TE and OS
      {none, 10, 10, none, true, false, true, false, false},  // touch, TE false
      {none, 10, 10, 20, true, true, false, true, false},     // touch, OS false
      {0, 10, 10, none, false, true, false, false, true},     // OS not consulted
      {0, 10, 10, none, false, false, true, true, false},
      {10, none, 0, 10, true, false, false, true, true},  // OE and TS
      {10, none, 0, 10, false, false, false, true, false},
      {10, 20, none, 10, true, true, true, true, true},
      {10, 20, none, 10, true, true, true, false, false},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(Range(c.s1, c.e1)->Overlaps(Range(c.s2, c.e2), c.ts, c.te, c.os, c.oe), c.expected)
        << (c.s1 ? *c.s1 : -99) << " " << (c.e1 ? *c.e1 : -99) << " vs " << (c.s2 ? *c.s2 : -99)
        << " " << (c.e2 ? *c.e2 : -99);
  }
}

// For two fully bounded ranges that each hold at least one whole second,
// overlap is exactly "some whole second lies in both".
TEST(TimeRange, ClosedRangesOverlapExactlyWhenTheyShareASecond) {
  std::mt19937 rng(1224);
  auto holds = [](int s, int e, bool si, bool ei, int t) {
    return (t > s || (t == s && si)) && (t < e || (t == e && ei));
  };
  auto nonEmpty = [&](int s, int e, bool si, bool ei) {
    for (int t = s; t <= e; ++t)
      if (holds(s, e, si, ei, t)) return true;
    return false;
  };
  int checked = 0;
  for (int i = 0; i < 20000; ++i) {
    int s1 = rng() % 8, e1 = s1 + rng() % 4, s2 = rng() % 8, e2 = s2 + rng() % 4;
    bool ts = rng() % 2, te = rng() % 2, os = rng() % 2, oe = rng() % 2;
    if (!nonEmpty(s1, e1, ts, te) || !nonEmpty(s2, e2, os, oe)) continue;
    bool shared = false;
    for (int t = 0; t <= 12; ++t) shared |= holds(s1, e1, ts, te, t) && holds(s2, e2, os, oe, t);
    ASSERT_EQ(Range(s1, e1)->Overlaps(Range(s2, e2), ts, te, os, oe), shared)
        << s1 << ".." << e1 << " " << ts << te << " vs " << s2 << ".." << e2 << " " << os << oe;
    ++checked;
  }
  EXPECT_GT(checked, 5000);
}

TEST(TimeRange, ExclusiveBoundOneSecondFromTheOtherIsEmpty) {
  auto thisRange = Range(0, 1);  // (0,1) holds no whole second
  auto other = Range(0, 10);
  EXPECT_FALSE(other->IncludesAdjustable(At(0), At(1), false, false, true, true, true));
  EXPECT_TRUE(other->IncludesAdjustable(At(0), At(2), false, false, true, true, true));
}

TEST(TimeRange, EqualsIsDeliberatelyAsymmetric) {
  auto closed = Range(0, 10), open = Range(0, std::nullopt);
  EXPECT_TRUE(closed->Equals(open));
  EXPECT_FALSE(open->Equals(closed));
  EXPECT_TRUE(Range(0, 10)->Equals(closed));
  EXPECT_FALSE(Range(1, 10)->Equals(closed));
  EXPECT_FALSE(closed->Equals(nullptr));
  EXPECT_TRUE(closed->StartsBeforeOtherEnds(nullptr));
  EXPECT_FALSE(Range(10, 20)->StartsBeforeOtherEnds(Range(0, 10)));
}

TEST(TimeRange, TextFormRoundTrips) {
  EXPECT_EQ(TimeRange().Serialize(), "(F,,F,)");
  auto r = std::make_shared<TimeRange>();
  r->SetStartTime(DateTime::FromParts(2024, 12, 24, 18, 30));
  EXPECT_EQ(r->Serialize(), "(T,2024-12-24 18:30:00,F,)");
  TimeRange copy;
  copy.CopyFrom(r);
  EXPECT_EQ(copy.Serialize(), r->Serialize());
  copy.CopyFrom(nullptr);
  EXPECT_EQ(copy.Serialize(), "(F,,F,)");

  // An inverted record goes through the setters: the end wins.
  TimeRange inverted;
  inverted.Deserialize("(T,2024-12-24 18:00:00,T,2024-12-23 18:00:00)");
  EXPECT_FALSE(inverted.HasStart());
  EXPECT_TRUE(inverted.HasEnd());
}

TEST(TimeRange, BadRecordsFailAndKeepTheState) {
  auto r = Range(0, 10);
  const std::string before = r->Serialize();
  struct Case {
    const char* text;
    int32_t number;
    const char* description;
  };
  const Case cases[] = {
      {"(F,,F)", 37, "Unexpected number of fields in serialized time range: 3"},
      {"abc", 37, "Unexpected number of fields in serialized time range: 0"},
      {"(T,soon,F,)", 13, "Type mismatch"},
      {"(T,2024-01-01,T", 1, "Badly formatted list, enclosing parens"},
  };
  for (const auto& c : cases) {
    try {
      r->Deserialize(c.text);
      ADD_FAILURE() << c.text;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), c.number) << c.text;
      EXPECT_EQ(e.Description(), c.description) << c.text;
    }
    EXPECT_EQ(r->Serialize(), before);
  }
}

}  // namespace
}  // namespace tav
