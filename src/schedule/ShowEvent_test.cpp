#include "schedule/ShowEvent.h"
#include "support/testing/Failure.h"

#include <gtest/gtest.h>

#include "support/Error.h"

namespace tav {
namespace {

DateTime Date(int month, int day, int hour = 0, int minute = 0) {
  return DateTime::FromParts(2024, month, day, hour, minute, 0);
}

TEST(ShowEvent, TypeAndFileNameFollowEachOther) {
  ShowEvent e;
  EXPECT_EQ(e.EventType(), kEventTypeWait);  // new: a wait
  EXPECT_EQ(e.StartTime()->TimeVal(), 0);
  EXPECT_EQ(e.EndTime()->TimeVal(), 0);
  e.SetFilename("Xmas");
  EXPECT_EQ(e.EventType(), kEventTypeShow);
  e.SetFilename("");
  EXPECT_EQ(e.EventType(), kEventTypeWait);
  e.SetFilename("Xmas");
  e.SetEventType(kEventTypeWait);
  EXPECT_EQ(e.Filename(), "");
  e.SetEventType(kEventTypeShow);  // a show without a file: the name stays empty
  EXPECT_EQ(e.EventType(), kEventTypeShow);
  EXPECT_EQ(e.Filename(), "");
  e.SetFilename("A");
  e.SetEventType(7);  // any other value changes nothing else
  EXPECT_EQ(e.Filename(), "A");
}

TEST(ShowEvent, AccessorsReturnTheStoredTimesThemselves) {
  auto start = NewWeekTime(1, 18, 0, 0);
  auto end = NewWeekTime(1, 22, 0, 0);
  auto e = NewShowEvent("Xmas", start, end);
  EXPECT_EQ(e->StartTime(), start);
  EXPECT_EQ(e->EndTime(), end);
  start->SetHour(19);  // changing the object changes the event
  EXPECT_EQ(e->StartTime()->Hour(), 19);
}

TEST(ShowEvent, DurationCarriesTheEndWhenTheEndIsDropped) {
  auto e = NewShowEvent("A", NewWeekTime(1, 10, 0, 0), NewWeekTime(1, 12, 0, 0));
  // Dropping the end fails when the duration is recomputed, but the end is
  // gone and the duration (2 h) stays known.
  EXPECT_EQ(tav::testing::FailureOf([&] { e->SetEndTime(nullptr); }).number, 91);
  EXPECT_FALSE(e->EndTime());
  e->SetStartTime(NewWeekTime(6, 23, 0, 0));
  ASSERT_TRUE(e->EndTime());
  EXPECT_EQ(e->EndTime()->TimeVal(), 3600);  // Sunday 01:00, across the week end
}

TEST(ShowEvent, DerivingAStartFromTheEndFails) {
  auto e = NewShowEvent("A", NewWeekTime(1, 10, 0, 0), NewWeekTime(1, 12, 0, 0));
  // Dropping the start fails when the duration is recomputed, but the start
  // is gone; the next end write then needs MinusDuration, which never works.
  EXPECT_EQ(tav::testing::FailureOf([&] { e->SetStartTime(nullptr); }).number, 91);
  EXPECT_FALSE(e->StartTime());
  EXPECT_EQ(tav::testing::FailureOf([&] { e->SetEndTime(NewWeekTime(2, 0, 0, 0)); }).number, 91);
}

TEST(ShowEvent, SetDurationOfAWeekFillsTheWeek) {
  auto e = NewWaitEvent(NewWeekTime(0, 0, 0, 0), kSecondsPerWeek);
  EXPECT_EQ(e->EventType(), kEventTypeWait);
  EXPECT_EQ(e->EndTime()->TimeVal(), e->StartTime()->TimeVal());
  auto range = e->Range(Date(12, 24, 12));
  EXPECT_FALSE(range->HasStart());
  EXPECT_FALSE(range->HasEnd());

  auto wait = NewWaitEvent(NewWeekTime(6, 22, 0, 0), 4 * 3600);
  EXPECT_EQ(wait->EndTime()->TimeVal(), 2 * 3600);
}

TEST(ShowEvent, RangeGivesTheCurrentOrNextOccurrence) {
  struct Case {
    const char* what;
    int startDay, startHour, endDay, endHour;
    DateTime reference, start, end;
  } cases[] = {
      {"across the week end, seen midweek", 6, 22, 0, 2, Date(12, 25, 12), Date(12, 28, 22),
       Date(12, 29, 2)},
      {"across the week end, seen on Sunday night", 6, 22, 0, 2, Date(12, 29, 1), Date(12, 28, 22),
       Date(12, 29, 2)},
      {"this week's is over", 1, 18, 1, 22, Date(12, 27, 12), Date(12, 30, 18), Date(12, 30, 22)},
      {"running now", 1, 18, 1, 22, Date(12, 23, 19), Date(12, 23, 18), Date(12, 23, 22)},
      {"ends exactly now", 1, 18, 1, 22, Date(12, 23, 22), Date(12, 23, 18), Date(12, 23, 22)},
      {"later this week", 5, 8, 5, 9, Date(12, 23, 0), Date(12, 27, 8), Date(12, 27, 9)},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    auto e = NewShowEvent("A", NewWeekTime(c.startDay, c.startHour, 0, 0),
                          NewWeekTime(c.endDay, c.endHour, 0, 0));
    auto range = e->Range(c.reference);
    ASSERT_TRUE(range->HasStart() && range->HasEnd());
    EXPECT_EQ(range->StartTime().ToText(), c.start.ToText());
    EXPECT_EQ(range->EndTime().ToText(), c.end.ToText());
  }
}

TEST(ShowEvent, RecordWritesEndBeforeStart) {
  auto e = NewShowEvent("Xmas", NewWeekTime(1, 18, 0, 0), NewWeekTime(1, 22, 0, 0));
  EXPECT_EQ(ShowEventToText(*e), "(165600,2,(, 0,Xmas),151200)");
  auto odd = NewShowEvent("a,b(c)*", NewWeekTime(6, 23, 0, 0), NewWeekTime(0, 1, 0, 0));
  EXPECT_EQ(ShowEventToText(*odd), "(3600,2,(, 0,a*Sb*Oc*C*E),601200)");
}

TEST(ShowEvent, RecordReadsBack) {
  auto e = ShowEventFromText("(3600,2,(, 0,a*Sb*Oc*C*E),601200)");
  EXPECT_EQ(e->Filename(), "a,b(c)*");
  EXPECT_EQ(e->EventType(), kEventTypeShow);
  EXPECT_EQ(e->StartTime()->TimeVal(), 601200);
  EXPECT_EQ(e->EndTime()->TimeVal(), 3600);
  // The name decides the type, whatever the type field says.
  EXPECT_EQ(ShowEventFromText("(10,1,(x,9,Show),5)")->EventType(), kEventTypeShow);
  EXPECT_EQ(ShowEventFromText("(10,2,(, 0,),5)")->EventType(), kEventTypeWait);
  // Extra fields are ignored.
  EXPECT_EQ(ShowEventFromText("(10,2,(, 0,A,extra),5,more)")->Filename(), "A");
}

TEST(ShowEvent, MalformedRecordsFailWithTheirErrors) {
  struct Case {
    const char* text;
    int32_t number;
  } cases[] = {
      {"(165600,2,(, 0,Xmas))", 9},         // no start
      {"(165600,2)", 9},                    // no file reference
      {"(165600,2,Xmas,151200)", 9},        // file reference is no list
      {"(165600,2,(, 0),151200)", 9},       // file reference too short
      {"(165600,two,(, 0,X),151200)", 13},  // type is no number
      {"(165600,,(, 0,X),151200)", 13},
      {"(165600,2,(, 0,X,151200", 1},  // list syntax
      {"", 9},                         // no list at all
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    EXPECT_EQ(tav::testing::FailureOf([&] { ShowEventFromText(c.text); }).number, c.number);
  }
}

}  // namespace
}  // namespace tav
