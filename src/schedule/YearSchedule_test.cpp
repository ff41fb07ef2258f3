#include "schedule/YearSchedule.h"

#include <gtest/gtest.h>

#include "schedule/testing/MemoryTextFiles.h"
#include "schedule/testing/ScheduleTestUtil.h"

namespace tav {
namespace {

using testing::Describe;
using testing::FailureOf;

// December 2024: the 22nd is a Sunday, the 24th a Tuesday, the 28th a Saturday.
DateTime Dec(int day, int hour = 0, int minute = 0) {
  return DateTime::FromParts(2024, 12, day, hour, minute, 0);
}

const char* const kXmasFile = "((2024-12-24,((252000,2,(, 0,Xmas),237600))))";

TEST(YearSchedule, FileFormatMatchesTheExampleByteForByte) {
  YearSchedule year;
  EXPECT_EQ(YearScheduleToText(year), "");
  year.AddShowEventByFile("Xmas", Dec(24, 18), Dec(24, 22));
  EXPECT_EQ(YearScheduleToText(year), kXmasFile);

  testing::MemoryTextFiles files;
  EXPECT_TRUE(year.Save("yearsched.tsc", files));
  EXPECT_EQ(files.files["yearsched.tsc"], std::string(kXmasFile) + "\r\n");
  EXPECT_FALSE(year.Modified());
}

TEST(YearSchedule, FileReadsBackInKeyOrder) {
  YearSchedule year;
  year.AddShowEventByFile("New Year", Dec(31, 22), Dec(31, 23, 59));
  year.AddShowEventByFile("Xmas, late", Dec(24, 18), Dec(24, 22));
  std::string text = YearScheduleToText(year);
  EXPECT_EQ(text,
            "((2024-12-31,((259140,2,(, 0,New Year),252000))),"
            "(2024-12-24,((252000,2,(, 0,Xmas*S late),237600))))");
  auto back = YearScheduleFromText(text + "\r\n");
  EXPECT_EQ(back->Keys(), (std::vector<std::string>{"2024-12-31", "2024-12-24"}));
  EXPECT_EQ(back->DateSchedule(Dec(24))->FirstShowEvent()->Filename(), "Xmas, late");
  EXPECT_EQ(YearScheduleToText(*back), text);
}

TEST(YearSchedule, AddShowEventByFileRefusesWithItsOwnWords) {
  struct Case {
    const char* what;
    std::vector<std::pair<DateTime, DateTime>> before;
    DateTime start, end;
    int32_t number;
    const char* description;
    bool modified;
  } cases[] = {
      {"equal times", {}, Dec(24, 18), Dec(24, 18), 1, "End time precedes start time", false},
      {"end before start", {}, Dec(24, 18), Dec(24, 17), 1, "End time precedes start time", false},
      {"Monday to Wednesday",
       {},
       Dec(23, 10),
       Dec(25, 9),
       2,
       "Event spans more than two days",
       true},
      {"into the next date's first show",
       {{Dec(25, 0, 30), Dec(25, 2)}},
       Dec(24, 23),
       Dec(25, 1),
       3,
       "End time conficts with event in next day",
       true},
      {"past midnight from before the date's last show ends",
       {{Dec(24, 22), Dec(24, 23, 30)}},
       Dec(24, 23),
       Dec(25, 1),
       4,
       "Start time conflicts with event in previous day",
       true},
      {"overlapping on the same date",
       {{Dec(24, 18), Dec(24, 22)}},
       Dec(24, 21),
       Dec(24, 23),
       4,
       "Event conflict",
       true},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    YearSchedule year;
    for (const auto& [start, end] : c.before) year.AddShowEventByFile("Before", start, end);
    year.SetModified(false);
    std::string before = YearScheduleToText(year);
    auto failure = FailureOf([&] { year.AddShowEventByFile("New", c.start, c.end); });
    EXPECT_EQ(failure.number, c.number);
    EXPECT_EQ(failure.source, "Schedule.AddShowEventByFile");
    EXPECT_EQ(failure.description, c.description);
    EXPECT_EQ(year.Modified(), c.modified);
    EXPECT_EQ(YearScheduleToText(year), before);
  }
}

TEST(YearSchedule, AShowMayRunPastMidnightAndIsKeptUnderItsStartDate) {
  struct Case {
    const char* what;
    std::vector<std::pair<DateTime, DateTime>> before;
    DateTime start, end;
  } cases[] = {
      {"next date without schedule", {}, Dec(24, 23), Dec(25, 1)},
      {"Saturday into Sunday", {}, Dec(28, 23), Dec(29, 1)},
      {"ending where the next date's first show starts",
       {{Dec(25, 0, 30), Dec(25, 2)}},
       Dec(24, 23),
       Dec(25, 0, 30)},
      {"after the date's last show", {{Dec(24, 18), Dec(24, 22)}}, Dec(24, 23), Dec(25, 1)},
      {"more than a day, ending on the next date", {}, Dec(24, 10), Dec(25, 11)},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    YearSchedule year;
    for (const auto& [start, end] : c.before) year.AddShowEventByFile("Before", start, end);
    size_t keys = year.Keys().size();
    bool dateKnown = year.DateSchedule(c.start) != nullptr;
    year.AddShowEventByFile("Late", c.start, c.end);
    auto schedule = year.DateSchedule(c.start);
    ASSERT_TRUE(schedule);
    EXPECT_TRUE(testing::Tiles(*schedule));
    EXPECT_EQ(schedule->LastShowEvent()->Filename(), "Late");
    EXPECT_EQ(year.Keys().size(), dateKnown ? keys : keys + 1);
    // Its occurrence is the one asked for.
    DateTime start;
    auto found = year.FirstShowWithinRange(nullptr, start);
    ASSERT_TRUE(found);
    if (c.before.empty()) {
      EXPECT_EQ(found->Range(c.start.DateOnly())->EndTime(), c.end);
    }
  }
}

TEST(YearSchedule, RemovingTheLastShowOfADateDropsTheDate) {
  YearSchedule year;
  year.AddShowEventByFile("Xmas", Dec(24, 18), Dec(24, 22));
  year.AddShowEventByFile("Eve", Dec(24, 12), Dec(24, 13));
  year.AddShowEventByFile("New Year", Dec(31, 22), Dec(31, 23));
  year.SetModified(false);
  auto node = [&](DateTime date, const std::string& name) {
    for (auto n = year.DateSchedule(date)->FirstNode(); n; n = n->NextNode()) {
      if (n->Obj()->Filename() == name) return n;
    }
    return std::shared_ptr<Node>();
  };
  year.RemoveShowEvent(Dec(24), node(Dec(24), "Xmas"));
  EXPECT_TRUE(year.Modified());
  EXPECT_EQ(year.Keys().size(), 2u);
  year.RemoveShowEvent(Dec(24), node(Dec(24), "Eve"));
  EXPECT_EQ(year.Keys(), std::vector<std::string>{"2024-12-31"});
  EXPECT_FALSE(year.DateSchedule(Dec(24)));
  EXPECT_EQ(YearScheduleToText(year), "((2024-12-31,((255600,2,(, 0,New Year),252000))))");
  // A wait cannot be removed.
  EXPECT_EQ(FailureOf([&] {
              year.RemoveShowEvent(Dec(31), year.DateSchedule(Dec(31))->FirstNode());
            }).description,
            "Can not remove non-show event");
}

TEST(YearSchedule, DateStringToDateRollsOverLikeDateArithmetic) {
  struct Case {
    const char* text;
    DateTime date;
  } cases[] = {
      {"2024-12-24", Dec(24)},
      {"2024-13-01", DateTime::FromParts(2025, 1, 1)},
      {"2024-02-30", DateTime::FromParts(2024, 3, 1)},
      {"2024-00-10", DateTime::FromParts(2023, 12, 10)},
      {"2024-12-00", DateTime::FromParts(2024, 11, 30)},
      {"2024-12-32", DateTime::FromParts(2025, 1, 1)},
      {"24-12-24", Dec(24)},
      {"99-1-2", DateTime::FromParts(1999, 1, 2)},
      {" 2024- 1-2 ", DateTime::FromParts(2024, 1, 2)},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    EXPECT_EQ(YearSchedule::DateStringToDate(c.text), c.date);
  }
  auto failure = FailureOf([] { YearSchedule::DateStringToDate("2024-12"); });
  EXPECT_EQ(failure.number, 37);
  EXPECT_EQ(failure.description, "Unexpected date string format: 2024-12");
  EXPECT_EQ(FailureOf([] { YearSchedule::DateStringToDate("2024-12-24-1"); }).number, 37);
  EXPECT_EQ(FailureOf([] { YearSchedule::DateStringToDate("x-1-1"); }).number, 13);
  EXPECT_EQ(FailureOf([] { YearSchedule::DateStringToDate("2024--1"); }).number, 13);
  EXPECT_EQ(FailureOf([] { YearSchedule::DateStringToDate("40000-1-1"); }).number, 6);
  EXPECT_EQ(YearSchedule::DateToString(Dec(24, 18, 30)), "2024-12-24");
}

TEST(YearSchedule, FirstShowWithinRangeFindsTheEarliestOverlappingShow) {
  YearSchedule year;
  year.AddShowEventByFile("B", Dec(31, 10), Dec(31, 11));
  year.AddShowEventByFile("A", Dec(24, 18), Dec(24, 22));
  year.AddShowEventByFile("N", Dec(25, 23), Dec(26, 1));
  year.AddShowEventByFile("C", Dec(28, 9), Dec(28, 10));
  auto range = [](std::optional<DateTime> start, std::optional<DateTime> end) {
    auto r = std::make_shared<TimeRange>();
    if (start) r->SetStartTime(*start);
    if (end) r->SetEndTime(*end);
    return r;
  };
  struct Case {
    const char* what;
    std::shared_ptr<TimeRange> range;
    const char* found;
    DateTime start;
  } cases[] = {
      {"no range: over all dates", nullptr, "A", Dec(24, 18)},
      {"all time", range({}, {}), "A", Dec(24, 18)},
      {"a show still running at the range start", range(Dec(24, 21), {}), "A", Dec(24, 18)},
      {"a show ending at the range start is over", range(Dec(24, 22), {}), "N", Dec(25, 23)},
      {"a show running past midnight", range(Dec(26, 0, 30), {}), "N", Dec(25, 23)},
      {"later dates", range(Dec(26, 1), {}), "C", Dec(28, 9)},
      {"open start", range({}, Dec(24, 18, 1)), "A", Dec(24, 18)},
      {"nothing before the end", range({}, Dec(24, 18)), "", {}},
      {"a gap between shows", range(Dec(26, 2), Dec(28, 9)), "", {}},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    DateTime start = Dec(1);
    auto show = year.FirstShowWithinRange(c.range, start);
    if (*c.found == '\0') {
      EXPECT_FALSE(show);
      EXPECT_EQ(start, Dec(1));  // left alone
    } else {
      ASSERT_TRUE(show);
      EXPECT_EQ(show->Filename(), c.found);
      EXPECT_EQ(start, c.start);
    }
  }
}

TEST(YearSchedule, ReadingFailsOnBadDayRecords) {
  struct Case {
    const char* text;
    int32_t number;
  } cases[] = {
      {"((2024-12-24,),(2024-12-24 10:00:00,))", 457},  // one date, twice
      {"((2024-12-24))", 9},
      {"(2024-12-24)", 9},
      {"((Christmas,))", 13},
      {"((2024-12-24,((252000,2,(, 0,A),237600),(250000,2,(, 0,B),240000))))", 1},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    EXPECT_EQ(FailureOf([&] { YearScheduleFromText(c.text); }).number, c.number);
  }
  // A date without shows is kept, and written back without them.
  auto year = YearScheduleFromText("((2024-12-24,))");
  EXPECT_EQ(year->Keys(), std::vector<std::string>{"2024-12-24"});
  EXPECT_EQ(YearScheduleToText(*year), "((2024-12-24,))");
}

TEST(YearSchedule, LoadingAndSavingGoThroughTheFilePort) {
  testing::MemoryTextFiles files;
  auto missing = LoadYearSchedule("yearsched.tsc", files);
  EXPECT_TRUE(missing->Keys().empty());
  EXPECT_FALSE(missing->Modified());

  files.files["yearsched.tsc"] = std::string(kXmasFile) + "\r\n";
  auto loaded = LoadYearSchedule("yearsched.tsc", files);
  EXPECT_EQ(loaded->Keys(), std::vector<std::string>{"2024-12-24"});
  EXPECT_FALSE(loaded->Modified());

  loaded->AddShowEventByFile("Eve", Dec(24, 12), Dec(24, 13));
  files.failWrites = true;
  EXPECT_FALSE(loaded->Save("yearsched.tsc", files));
  EXPECT_FALSE(loaded->Modified());
  EXPECT_EQ(files.files["yearsched.tsc"], std::string(kXmasFile) + "\r\n");

  // A file that cannot be read counts as none; one that reads but is broken
  // fails the load.
  files.failReads = true;
  auto unreadable = LoadYearSchedule("yearsched.tsc", files);
  EXPECT_TRUE(unreadable->Keys().empty());
  EXPECT_FALSE(unreadable->Modified());
  files.failReads = false;
  files.files["bad.tsc"] = "((2024-12-24,((252000,2,(, 0,Xmas)))))";
  EXPECT_EQ(FailureOf([&] { LoadYearSchedule("bad.tsc", files); }).number, 9);
}

}  // namespace
}  // namespace tav
