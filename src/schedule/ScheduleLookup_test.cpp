#include "schedule/ScheduleLookup.h"

#include <gtest/gtest.h>

#include "schedule/testing/ScheduleTestUtil.h"

namespace tav {
namespace {

using testing::T;

// December 2024: the 23rd is a Monday, the 28th a Saturday.
DateTime Dec(int day, int hour = 0, int minute = 0) {
  return DateTime::FromParts(2024, 12, day, hour, minute, 0);
}

std::shared_ptr<TimeRange> Span(DateTime start, DateTime end) {
  auto range = std::make_shared<TimeRange>();
  range->SetStartTime(start);
  range->SetEndTime(end);
  return range;
}

std::shared_ptr<MonitoredShowEvent> Requested(const std::string& name,
                                              std::shared_ptr<TimeRange> range) {
  auto event = std::make_shared<MonitoredShowEvent>();
  event->SetFilename(name);
  event->SetRange(std::move(range));
  event->SetScheduleType(kScheduleTypeOnDemand);
  return event;
}

// Weekly: Xmas on Mondays 18:00-22:00, Night from Saturday 23:00 to Sunday
// 01:00. Dated: Eve on the 24th 17:00-23:00, Day from the 25th 23:00 to the
// 26th 01:00. On demand: Demand on the 23rd 19:00-20:00.
class ScheduleLookupTest : public ::testing::Test {
 protected:
  ScheduleLookupTest() {
    auto week = std::make_shared<Schedule>();
    week->AddShowEventByFile("Xmas", T("Mon 18:00"), T("Mon 22:00"));
    week->AddShowEventByFile("Night", T("Sat 23:00"), T("Sun 01:00"));
    auto year = std::make_shared<YearSchedule>();
    year->AddShowEventByFile("Eve", Dec(24, 17), Dec(24, 23));
    year->AddShowEventByFile("Day", Dec(25, 23), Dec(26, 1));
    state.Week = week;
    state.Year = year;
    state.OnDemand = Requested("Demand", Span(Dec(23, 19), Dec(23, 20)));
  }

  // "<source> <file> <start> - <end> type <n>" for compact comparisons.
  static std::string Summary(const ShowDecision& d) {
    if (!d.Event) return ShowSourceName(d.Source) + " none";
    const TimeRange& r = *d.Event->Range();
    return ShowSourceName(d.Source) + " " + d.Event->Filename() + " " +
           (r.HasStart() ? r.StartTime().ToText() : "-") + " - " +
           (r.HasEnd() ? r.EndTime().ToText() : "-") + " type " +
           std::to_string(d.Event->ScheduleType());
  }

  ScheduleState state;
};

TEST_F(ScheduleLookupTest, CurrentEventFollowsThePrecedence) {
  struct Case {
    const char* what;
    DateTime t;
    const char* summary;
  } cases[] = {
      {"on demand over the week", Dec(23, 19, 30),
       "show on demand Demand 2024-12-23 19:00:00 - 2024-12-23 20:00:00 type 3"},
      {"on demand ends, the week show goes on", Dec(23, 20),
       "week schedule Xmas 2024-12-23 18:00:00 - 2024-12-23 22:00:00 type 1"},
      {"a dated show", Dec(24, 18),
       "year schedule Eve 2024-12-24 17:00:00 - 2024-12-24 23:00:00 type 2"},
      {"a dated show past midnight", Dec(26, 0, 30),
       "year schedule Day 2024-12-25 23:00:00 - 2024-12-26 01:00:00 type 2"},
      {"a dated show's end is not part of it", Dec(26, 1),
       "week schedule  2024-12-23 22:00:00 - 2024-12-28 23:00:00 type 1"},
      {"a weekly show across the week end", Dec(29, 0, 30),
       "week schedule Night 2024-12-28 23:00:00 - 2024-12-29 01:00:00 type 1"},
      {"a week wait", Dec(24, 12),
       "week schedule  2024-12-23 22:00:00 - 2024-12-28 23:00:00 type 1"},
      {"the wait after the week end", Dec(29, 5),
       "week schedule  2024-12-29 01:00:00 - 2024-12-30 18:00:00 type 1"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    ShowDecision d = CurrentShowEvent(state, c.t);
    EXPECT_EQ(Summary(d), c.summary);
    EXPECT_FALSE(d.Reason.empty());
  }
  EXPECT_NE(CurrentShowEvent(state, Dec(23, 20)).Reason.find("not at this time"),
            std::string::npos);
}

TEST_F(ScheduleLookupTest, AWaitIsSeenWholeAcrossTheWeekOrigin) {
  auto week = std::make_shared<Schedule>();
  week->AddShowEventByFile("Xmas", T("Mon 18:00"), T("Mon 22:00"));
  state.Week = week;
  state.Year = nullptr;
  for (DateTime t : {Dec(28, 23, 30), Dec(29, 0, 0), Dec(30, 17)}) {
    EXPECT_EQ(Summary(CurrentShowEvent(state, t)),
              "week schedule  2024-12-23 22:00:00 - 2024-12-30 18:00:00 type 1");
  }
  state.Week = std::make_shared<Schedule>();
  EXPECT_EQ(Summary(CurrentShowEvent(state, Dec(24))), "week schedule  - - - type 1");
}

TEST_F(ScheduleLookupTest, OnDemandOnlyIgnoresTheSchedules) {
  state.OnDemandOnly = true;
  EXPECT_EQ(Summary(CurrentShowEvent(state, Dec(23, 19, 30))),
            "show on demand Demand 2024-12-23 19:00:00 - 2024-12-23 20:00:00 type 3");
  ShowDecision idle = CurrentShowEvent(state, Dec(24, 18));
  EXPECT_EQ(Summary(idle), "nothing  - - - type 0");
  EXPECT_NE(idle.Reason.find("on demand only"), std::string::npos);
  EXPECT_EQ(Summary(NextShowEvent(state, idle.Event, Dec(24, 18))), "nothing none");
}

TEST_F(ScheduleLookupTest, ARequestWithoutFileOrWithoutScheduleChangesNothing) {
  state.OnDemand = Requested("", nullptr);
  EXPECT_EQ(Summary(CurrentShowEvent(state, Dec(23, 19, 30))),
            "week schedule Xmas 2024-12-23 18:00:00 - 2024-12-23 22:00:00 type 1");
  state.Week = nullptr;
  state.Year = nullptr;
  EXPECT_EQ(Summary(CurrentShowEvent(state, Dec(23, 19, 30))), "nothing  - - - type 0");
  // An open-ended request holds from its start on.
  state.OnDemand = Requested("Always", nullptr);
  EXPECT_EQ(Summary(CurrentShowEvent(state, Dec(1))), "show on demand Always - - - type 3");
}

TEST_F(ScheduleLookupTest, NextEventIsTheFirstShowAfterTheCurrentOne) {
  struct Case {
    const char* what;
    DateTime t;
    const char* next;
  } cases[] = {
      {"a dated show cuts into the week before the next weekly show", Dec(23, 18, 30),
       "year schedule Eve 2024-12-24 17:00:00 - 2024-12-24 23:00:00 type 2"},
      {"after a dated show", Dec(24, 18),
       "year schedule Day 2024-12-25 23:00:00 - 2024-12-26 01:00:00 type 2"},
      {"after the last dated show", Dec(26, 0, 30),
       "week schedule Night 2024-12-28 23:00:00 - 2024-12-29 01:00:00 type 1"},
      {"across the week end", Dec(29, 0, 30),
       "week schedule Xmas 2024-12-30 18:00:00 - 2024-12-30 22:00:00 type 1"},
      {"during a wait", Dec(24, 12),
       "year schedule Eve 2024-12-24 17:00:00 - 2024-12-24 23:00:00 type 2"},
      {"after a show on demand, into a running weekly show", Dec(23, 19, 30),
       "week schedule Xmas 2024-12-23 18:00:00 - 2024-12-23 22:00:00 type 1"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    ShowDecision current = CurrentShowEvent(state, c.t);
    ShowDecision next = NextShowEvent(state, current.Event, c.t);
    EXPECT_EQ(Summary(next), c.next);
    EXPECT_FALSE(next.Reason.empty());
  }
}

TEST_F(ScheduleLookupTest, NextEventEdgeCases) {
  // A dated show starting with a weekly one wins the tie.
  auto year = std::make_shared<YearSchedule>();
  year->AddShowEventByFile("Dated", Dec(30, 18), Dec(30, 19));
  state.Year = year;
  EXPECT_EQ(Summary(NextShowEvent(state, nullptr, Dec(30, 12))),
            "year schedule Dated 2024-12-30 18:00:00 - 2024-12-30 19:00:00 type 2");
  // The only weekly show follows itself a week later.
  auto single = std::make_shared<Schedule>();
  single->AddShowEventByFile("Xmas", T("Mon 18:00"), T("Mon 22:00"));
  ScheduleState alone;
  alone.Week = single;
  for (DateTime t : {Dec(23, 19), Dec(23, 21, 59)}) {
    EXPECT_EQ(Summary(NextShowEvent(alone, CurrentShowEvent(alone, t).Event, t)),
              "week schedule Xmas 2024-12-30 18:00:00 - 2024-12-30 22:00:00 type 1");
  }
  // Nothing follows a show that never ends.
  ShowDecision forever = NextShowEvent(state, Requested("Always", nullptr), Dec(30, 12));
  EXPECT_EQ(Summary(forever), "nothing none");
  EXPECT_NE(forever.Reason.find("has no end"), std::string::npos);
  // Without schedules nothing is scheduled.
  state.Week = nullptr;
  state.Year = nullptr;
  EXPECT_EQ(Summary(NextShowEvent(state, nullptr, Dec(30, 12))), "nothing none");
  state.Week = std::make_shared<Schedule>();
  EXPECT_EQ(Summary(NextShowEvent(state, nullptr, Dec(30, 12))), "nothing none");
}

TEST_F(ScheduleLookupTest, LookupsChangeNothing) {
  std::string before =
      ScheduleToText(*state.Week) + YearScheduleToText(*state.Year) + state.OnDemand->Serialize();
  for (int hour = 0; hour < 24 * 8; hour += 5) {
    DateTime t = Dec(22).AddSeconds(int64_t{hour} * 3600);
    ShowDecision current = CurrentShowEvent(state, t);
    current.Event->Range()->ClearStart();  // the caller owns what it gets
    NextShowEvent(state, current.Event, t);
  }
  EXPECT_EQ(
      ScheduleToText(*state.Week) + YearScheduleToText(*state.Year) + state.OnDemand->Serialize(),
      before);
}

}  // namespace
}  // namespace tav
