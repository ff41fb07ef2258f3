#include "schedule/Schedule.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <random>
#include <vector>

#include "schedule/testing/MemoryTextFiles.h"
#include "schedule/testing/ScheduleTestUtil.h"

namespace tav {
namespace {

using testing::Describe;
using testing::FailureOf;
using testing::T;
using testing::Tiles;

struct Show {
  const char* name;
  const char* start;
  const char* end;
};

std::shared_ptr<Schedule> Build(std::initializer_list<Show> shows) {
  auto schedule = std::make_shared<Schedule>();
  for (const Show& s : shows) schedule->AddShowEventByFile(s.name, T(s.start), T(s.end));
  EXPECT_TRUE(Tiles(*schedule));
  return schedule;
}

std::shared_ptr<Node> NodeOf(const Schedule& schedule, const std::string& name) {
  for (auto node = schedule.FirstNode(); node; node = node->NextNode()) {
    if (node->Obj()->Filename() == name) return node;
  }
  ADD_FAILURE() << "no show " << name << " in " << Describe(schedule);
  return nullptr;
}

const Show kXmas{"Xmas", "Mon 18:00", "Mon 22:00"};
const char* const kXmasWeek =
    "Sun 00:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | Mon 22:00-Sun 00:00 wait";

TEST(Schedule, NewScheduleIsOneWaitFillingTheWeek) {
  Schedule schedule;
  EXPECT_EQ(schedule.Count(), 1);
  EXPECT_EQ(Describe(schedule), "Sun 00:00-Sun 00:00 wait");
  EXPECT_FALSE(schedule.Modified());
  for (const char* t : {"Sun 00:00", "Wed 12:00", "Sat 23:59:59"}) {
    EXPECT_EQ(schedule.GetNodeByTime(*T(t)), schedule.FirstNode());
  }
  EXPECT_FALSE(schedule.FirstShowEvent());
  EXPECT_FALSE(schedule.LastShowEvent());
  EXPECT_TRUE(Tiles(schedule));
}

struct AddCase {
  const char* what;
  std::initializer_list<Show> before;
  Show added;
  const char* after;
};

TEST(Schedule, AddShowEventCarvesTheShowOutOfItsWait) {
  const AddCase cases[] = {
      {"into the empty week", {}, kXmas, kXmasWeek},
      {"touching the end of a show",
       {kXmas},
       {"B", "Mon 22:00", "Mon 23:00"},
       "Sun 00:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | Mon 22:00-Mon 23:00 B | "
       "Mon 23:00-Sun 00:00 wait"},
      {"touching the start of a show",
       {kXmas},
       {"A", "Mon 17:00", "Mon 18:00"},
       "Sun 00:00-Mon 17:00 wait | Mon 17:00-Mon 18:00 A | Mon 18:00-Mon 22:00 Xmas | "
       "Mon 22:00-Sun 00:00 wait"},
      {"filling a wait exactly replaces it",
       {kXmas},
       {"Late", "Mon 22:00", "Sun 00:00"},
       "Sun 00:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | Mon 22:00-Sun 00:00 Late"},
      {"at the start of the first wait",
       {kXmas},
       {"Early", "Sun 00:00", "Sun 06:00"},
       "Sun 00:00-Sun 06:00 Early | Sun 06:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | "
       "Mon 22:00-Sun 00:00 wait"},
      {"inside a wait",
       {kXmas},
       {"Fri", "Fri 10:00", "Fri 11:30"},
       "Sun 00:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | Mon 22:00-Fri 10:00 wait | "
       "Fri 10:00-Fri 11:30 Fri | Fri 11:30-Sun 00:00 wait"},
      {"across the week end, the week-end rule",
       {kXmas},
       {"Night", "Sat 23:00", "Sun 01:00"},
       "Sun 01:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | Mon 22:00-Sat 23:00 wait | "
       "Sat 23:00-Sun 01:00 Night"},
      {"across the week end, emptying the first wait",
       {{"A", "Sun 01:00", "Mon 00:00"}},
       {"Night", "Sat 23:00", "Sun 01:00"},
       "Sun 01:00-Mon 00:00 A | Mon 00:00-Sat 23:00 wait | Sat 23:00-Sun 01:00 Night"},
      {"across the week end into the empty week",
       {},
       {"Night", "Sat 23:00", "Sun 01:00"},
       "Sun 01:00-Sat 23:00 wait | Sat 23:00-Sun 01:00 Night"},
      {"ending at the week end into the empty week",
       {},
       {"Eve", "Sat 20:00", "Sun 00:00"},
       "Sun 00:00-Sat 20:00 wait | Sat 20:00-Sun 00:00 Eve"},
      {"starting at the week origin into the empty week",
       {},
       {"Dawn", "Sun 00:00", "Sun 02:00"},
       "Sun 02:00-Sun 00:00 wait | Sun 00:00-Sun 02:00 Dawn"},
  };
  for (const AddCase& c : cases) {
    SCOPED_TRACE(c.what);
    auto schedule = Build(c.before);
    schedule->SetModified(false);
    schedule->AddShowEventByFile(c.added.name, T(c.added.start), T(c.added.end));
    EXPECT_EQ(Describe(*schedule), c.after);
    EXPECT_TRUE(Tiles(*schedule));
    EXPECT_TRUE(schedule->Modified());
  }
}

TEST(Schedule, AddShowEventRejectsConflicts) {
  struct Case {
    const char* what;
    std::initializer_list<Show> before;
    Show added;
    int32_t number;
    bool modified;
  } cases[] = {
      {"starting inside a show", {kXmas}, {"B", "Mon 21:00", "Mon 23:00"}, 1, false},
      {"starting where a show starts", {kXmas}, {"B", "Mon 18:00", "Mon 19:00"}, 1, false},
      {"running into a show", {kXmas}, {"B", "Mon 17:00", "Mon 19:00"}, 2, true},
      {"running across the week end into a show",
       {kXmas, {"Dawn", "Sun 00:00", "Sun 02:00"}},
       {"Night", "Sat 23:00", "Sun 01:00"},
       2,
       true},
      {"running all the way round", {kXmas}, {"Long", "Tue 10:00", "Tue 09:00"}, 2, true},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    auto schedule = Build(c.before);
    schedule->SetModified(false);
    std::string before = Describe(*schedule);
    auto failure = FailureOf(
        [&] { schedule->AddShowEventByFile(c.added.name, T(c.added.start), T(c.added.end)); });
    EXPECT_EQ(failure.number, c.number);
    EXPECT_EQ(failure.source, "Schedule.AddShowEvent");
    EXPECT_EQ(failure.description, "Can't add event -- event conflict");
    EXPECT_EQ(Describe(*schedule), before);
    EXPECT_EQ(schedule->Modified(), c.modified);
  }
}

struct RemoveCase {
  const char* what;
  std::initializer_list<Show> shows;
  const char* removed;
  const char* after;
};

TEST(Schedule, RemoveShowEventMergesWithNeighbouringWaits) {
  const Show early{"Early", "Sun 00:00", "Sun 06:00"};
  const Show mid{"Mid", "Sun 06:00", "Mon 18:00"};
  const Show fri{"Fri", "Fri 10:00", "Fri 11:00"};
  const RemoveCase cases[] = {
      {"the only show", {kXmas}, "Xmas", "Sun 00:00-Sun 00:00 wait"},
      {"the only show, after the week origin moved",
       {{"Night", "Sat 23:00", "Sun 01:00"}},
       "Night",
       "Sun 00:00-Sun 00:00 wait"},
      {"between two waits",
       {kXmas, fri},
       "Xmas",
       "Sun 00:00-Fri 10:00 wait | Fri 10:00-Fri 11:00 Fri | Fri 11:00-Sun 00:00 wait"},
      {"between two shows",
       {kXmas, early, mid},
       "Mid",
       "Sun 00:00-Sun 06:00 Early | Sun 06:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | "
       "Mon 22:00-Sun 00:00 wait"},
      {"a show before, a wait after", {kXmas, {"B", "Mon 22:00", "Mon 23:00"}}, "B", kXmasWeek},
      {"a wait before, a show after", {kXmas, {"A", "Mon 17:00", "Mon 18:00"}}, "A", kXmasWeek},
      {"first, a wait after", {kXmas, early}, "Early", kXmasWeek},
      {"first, a show after",
       {kXmas, early, mid},
       "Early",
       "Sun 00:00-Sun 06:00 wait | Sun 06:00-Mon 18:00 Mid | Mon 18:00-Mon 22:00 Xmas | "
       "Mon 22:00-Sun 00:00 wait"},
      {"last, a wait before",
       {kXmas, {"Night", "Sat 23:00", "Sun 01:00"}},
       "Night",
       "Sun 01:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | Mon 22:00-Sun 01:00 wait"},
      {"last, a show before: first and last wait stay apart",
       {kXmas, {"Late", "Mon 22:00", "Sun 00:00"}},
       "Late",
       kXmasWeek},
  };
  for (const RemoveCase& c : cases) {
    SCOPED_TRACE(c.what);
    auto schedule = Build(c.shows);
    schedule->SetModified(false);
    schedule->RemoveShowEvent(NodeOf(*schedule, c.removed));
    EXPECT_EQ(Describe(*schedule), c.after);
    EXPECT_TRUE(Tiles(*schedule));
    EXPECT_TRUE(schedule->Modified());
  }
}

TEST(Schedule, RemovingAWaitFails) {
  auto schedule = Build({kXmas});
  schedule->SetModified(false);
  auto failure = FailureOf([&] { schedule->RemoveShowEvent(schedule->FirstNode()); });
  EXPECT_EQ(failure.number, 1);
  EXPECT_EQ(failure.source, "Schedule.RemoveShowEvent");
  EXPECT_EQ(failure.description, "Can not remove non-show event");
  EXPECT_EQ(Describe(*schedule), kXmasWeek);
  EXPECT_FALSE(schedule->Modified());
}

TEST(Schedule, CheckAddTellsWhyAShowWouldNotFit) {
  auto schedule = Build({kXmas});
  schedule->SetModified(false);
  struct Case {
    const char* start;
    const char* end;
    int32_t code;
  } cases[] = {
      {"Tue 10:00", "Tue 11:00", 0},
      {"Mon 22:00", "Sun 00:00", 0},
      {"Mon 19:00", "Mon 20:00", 1},
      {"Mon 18:00", "Mon 20:00", 1},
      {"Mon 17:00", "Mon 19:00", 2},
      {"Tue 10:00", "Tue 09:00", 3},
      // The week-end rule of AddShowEvent is not considered.
      {"Sat 23:00", "Sun 01:00", 2},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.start) + " to " + c.end);
    EXPECT_EQ(schedule->CheckAdd(*T(c.start), *T(c.end)), c.code);
  }
  EXPECT_EQ(Describe(*schedule), kXmasWeek);
  EXPECT_FALSE(schedule->Modified());
}

TEST(Schedule, AmalgamatedShowEventJoinsTheWaitSplitAtTheWeekOrigin) {
  auto schedule = Build({kXmas});
  auto first = schedule->FirstNode()->Obj();
  auto last = schedule->LastNode()->Obj();
  for (const auto& wait : {first, last}) {
    auto joined = schedule->AmalgamatedShowEvent(wait);
    ASSERT_NE(joined, wait);
    EXPECT_EQ(joined->EventType(), kEventTypeWait);
    EXPECT_EQ(testing::Text(*joined->StartTime()), "Mon 22:00");
    EXPECT_EQ(testing::Text(*joined->EndTime()), "Mon 18:00");
  }
  EXPECT_EQ(Describe(*schedule), kXmasWeek);  // unchanged

  auto show = NodeOf(*schedule, "Xmas")->Obj();
  EXPECT_EQ(schedule->AmalgamatedShowEvent(show), show);
  EXPECT_EQ(schedule->AmalgamatedShowEvent(nullptr), nullptr);
  Schedule empty;
  EXPECT_EQ(empty.AmalgamatedShowEvent(empty.FirstNode()->Obj()), empty.FirstNode()->Obj());
  // A wait that does not touch the origin, or whose neighbour across it is a
  // show, stays as it is.
  auto middle = Build({kXmas, {"Fri", "Fri 10:00", "Fri 11:00"}});
  auto inner = NodeOf(*middle, "Xmas")->NextNode()->Obj();
  EXPECT_EQ(middle->AmalgamatedShowEvent(inner), inner);
  auto lateShow = Build({kXmas, {"Late", "Mon 22:00", "Sun 00:00"}});
  EXPECT_EQ(lateShow->AmalgamatedShowEvent(lateShow->FirstNode()->Obj()),
            lateShow->FirstNode()->Obj());
}

TEST(Schedule, DebugDumpGoesToTheSinkOnly) {
  auto schedule = Build({kXmas});
  std::vector<std::string> lines;
  schedule->SetDebugSink([&](std::string_view line) { lines.emplace_back(line); });
  schedule->DebugDump();
  EXPECT_EQ(lines, (std::vector<std::string>{"BEGIN SCHEDULE DUMP", "Sun000 - Mon1800 WAIT",
                                             "Mon1800 - Mon2200 Xmas", "Mon2200 - Sun000 WAIT",
                                             "END SCHEDULE DUMP"}));
  lines.clear();
  schedule->RemoveShowEvent(NodeOf(*schedule, "Xmas"));  // dumps before and after
  EXPECT_EQ(std::count(lines.begin(), lines.end(), "BEGIN SCHEDULE DUMP"), 2);
  EXPECT_EQ(lines.back(), "END SCHEDULE DUMP");
}

TEST(ScheduleFile, WeekFileIsTheListOfShowRecords) {
  EXPECT_EQ(ScheduleToText(Schedule()), "");
  EXPECT_EQ(ScheduleToText(*Build({kXmas})), "((165600,2,(, 0,Xmas),151200))");
  EXPECT_EQ(ScheduleToText(*Build({kXmas, {"Night", "Sat 23:00", "Sun 01:00"}})),
            "((165600,2,(, 0,Xmas),151200),(3600,2,(, 0,Night),601200))");
}

TEST(ScheduleFile, ReadingAddsTheShowsInOrder) {
  auto schedule =
      ScheduleFromText("((165600,2,(, 0,Xmas),151200),(3600,2,(, 0,Night),601200))\r\n");
  EXPECT_EQ(Describe(*schedule),
            "Sun 01:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | Mon 22:00-Sat 23:00 wait | "
            "Sat 23:00-Sun 01:00 Night");
  EXPECT_EQ(schedule->FirstShowEvent()->Filename(), "Xmas");
  EXPECT_EQ(schedule->LastShowEvent()->Filename(), "Night");
  EXPECT_EQ(Describe(*ScheduleFromText("")), "Sun 00:00-Sun 00:00 wait");
  EXPECT_EQ(Describe(*ScheduleFromText("\r\n")), "Sun 00:00-Sun 00:00 wait");
  // A lone show across the week end reads back as it was written.
  auto night = Build({{"Night", "Sat 23:00", "Sun 01:00"}});
  EXPECT_EQ(Describe(*ScheduleFromText(ScheduleToText(*night))), Describe(*night));
}

TEST(ScheduleFile, ReadingStopsAtTheFirstBadRecord) {
  struct Case {
    const char* text;
    int32_t number;
    const char* source;
  } cases[] = {
      {"((165600,2,(, 0,A),151200),(162000,2,(, 0,B),158400))", 1, "Schedule.AddShowEvent"},
      {"((165600,2,(, 0,A),151200),(172800,2,(, 0,B),144000))", 2, "Schedule.AddShowEvent"},
      {"((165600,2,(, 0,A)))", 9, ""},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    auto failure = FailureOf([&] { ScheduleFromText(c.text); });
    EXPECT_EQ(failure.number, c.number);
    if (*c.source) {
      EXPECT_EQ(failure.source, c.source);
    }
  }
}

TEST(ScheduleFile, SaveWritesTheTextAndALineEnd) {
  testing::MemoryTextFiles files;
  auto schedule = Build({kXmas});
  EXPECT_TRUE(schedule->Save("weeksched.tsc", files));
  EXPECT_EQ(files.files["weeksched.tsc"], "((165600,2,(, 0,Xmas),151200))\r\n");
  EXPECT_FALSE(schedule->Modified());
  Schedule empty;
  EXPECT_TRUE(empty.Save("empty.tsc", files));
  EXPECT_EQ(files.files["empty.tsc"], "\r\n");
}

TEST(ScheduleFile, FailedSaveKeepsThePreviousFileAndStillClearsModified) {
  testing::MemoryTextFiles files;
  files.files["weeksched.tsc"] = "((165600,2,(, 0,Xmas),151200))\r\n";
  auto schedule = Build({kXmas, {"Fri", "Fri 10:00", "Fri 11:00"}});
  files.failWrites = true;
  EXPECT_FALSE(schedule->Save("weeksched.tsc", files));
  EXPECT_EQ(files.writes, 1);
  EXPECT_FALSE(schedule->Modified());
  EXPECT_EQ(files.files["weeksched.tsc"], "((165600,2,(, 0,Xmas),151200))\r\n");
}

TEST(ScheduleFile, LoadWeekScheduleTreatsAMissingFileAsAnEmptyWeek) {
  testing::MemoryTextFiles files;
  auto missing = LoadWeekSchedule("nowhere.tsc", files);
  EXPECT_EQ(missing->Count(), 1);
  EXPECT_FALSE(missing->Modified());
  files.files["w.tsc"] = "((165600,2,(, 0,Xmas),151200))\r\n";
  auto loaded = LoadWeekSchedule("w.tsc", files);
  EXPECT_EQ(Describe(*loaded), kXmasWeek);
  EXPECT_FALSE(loaded->Modified());
  files.failReads = true;
  EXPECT_EQ(FailureOf([&] { LoadWeekSchedule("w.tsc", files); }).number, 70);
}

// Random adds and removes against the plainest possible model: one byte per
// second of the week, 0 for wait time, otherwise the number of the show.
class WeekModel {
 public:
  WeekModel() : m_seconds(kSecondsPerWeek, 0), m_painted(kSecondsPerWeek, 0) {}

  bool Free(int32_t start, int32_t length) const {
    static const std::vector<uint8_t> kZeros(kSecondsPerWeek, 0);
    int32_t first = std::min(length, kSecondsPerWeek - start);
    return std::memcmp(m_seconds.data() + start, kZeros.data(), static_cast<size_t>(first)) == 0 &&
           std::memcmp(m_seconds.data(), kZeros.data(), static_cast<size_t>(length - first)) == 0;
  }
  void Fill(int32_t start, int32_t length, uint8_t id) {
    Paint(m_seconds, start, length, id);
    m_spans[id] = {start, length};
  }
  void Clear(uint8_t id) {
    Paint(m_seconds, m_spans[id].first, m_spans[id].second, 0);
    m_spans.erase(id);
  }
  uint8_t At(int32_t second) const { return m_seconds[static_cast<size_t>(second)]; }

  // Whether the schedule's events paint the same week.
  bool Matches(const Schedule& schedule) const {
    // One buffer for every comparison: large allocations are slow under ASan.
    std::vector<uint8_t>& week = m_painted;
    std::memset(week.data(), 0, week.size());
    for (auto node = schedule.FirstNode(); node; node = node->NextNode()) {
      const ShowEvent& e = *node->Obj();
      if (e.EventType() != kEventTypeShow) continue;
      int32_t length = e.EndTime()->Minus(*e.StartTime());
      Paint(week, e.StartTime()->TimeVal(), length == 0 ? kSecondsPerWeek : length,
            static_cast<uint8_t>(std::stoi(e.Filename())));
    }
    return std::memcmp(week.data(), m_seconds.data(), week.size()) == 0;
  }

 private:
  static void Paint(std::vector<uint8_t>& week, int32_t start, int32_t length, uint8_t id) {
    int32_t first = std::min(length, kSecondsPerWeek - start);
    std::memset(week.data() + start, id, static_cast<size_t>(first));
    std::memset(week.data(), id, static_cast<size_t>(length - first));
  }

  std::vector<uint8_t> m_seconds;
  std::map<uint8_t, std::pair<int32_t, int32_t>> m_spans;
  mutable std::vector<uint8_t> m_painted;
};

TEST(ScheduleModel, RandomAddsAndRemovesMatchASecondBySecondWeek) {
  for (uint32_t seed = 1; seed <= 12; ++seed) {
    SCOPED_TRACE(::testing::Message() << "seed " << seed);
    std::mt19937 random(seed);
    auto pick = [&](int32_t n) {
      return static_cast<int32_t>(random() % static_cast<uint32_t>(n));
    };
    Schedule schedule;
    WeekModel model;
    std::vector<uint8_t> live;
    uint8_t nextId = 1;
    int added = 0, refused = 0, removed = 0;

    for (int step = 0; step < 250; ++step) {
      if (live.empty() || pick(3) != 0) {
        // Coarse units make touching and equal bounds common.
        static const int32_t kUnits[] = {1, 60, 900, 3600, 86400};
        int32_t unit = kUnits[pick(5)];
        int32_t start = pick(kSecondsPerWeek / unit) * unit;
        int32_t length = (1 + pick(std::max(1, 2 * kSecondsPerDay / unit))) * unit;
        if (length >= kSecondsPerWeek) length = kSecondsPerWeek - unit;
        bool free = model.Free(start, length);
        std::string before = Describe(schedule);
        auto startTime = std::make_shared<WeekTime>();
        startTime->SetTimeVal(start);
        auto failure = FailureOf([&] {
          schedule.AddShowEventByFile(std::to_string(nextId), startTime,
                                      startTime->PlusDuration(length));
        });
        if (failure.number == 0) {
          ASSERT_TRUE(free) << "added over a show: " << start << "+" << length << " into "
                            << before;
          model.Fill(start, length, nextId);
          live.push_back(nextId);
          nextId = static_cast<uint8_t>(nextId % 250 + 1);
          ++added;
        } else {
          ASSERT_FALSE(free) << "refused " << start << "+" << length << " into " << before << ": "
                             << failure.source << " " << failure.description;
          ASSERT_EQ(failure.description, "Can't add event -- event conflict");
          ++refused;
        }
      } else {
        size_t index = static_cast<size_t>(pick(static_cast<int32_t>(live.size())));
        uint8_t id = live[index];
        schedule.RemoveShowEvent(NodeOf(schedule, std::to_string(id)));
        model.Clear(id);
        live.erase(live.begin() + static_cast<std::ptrdiff_t>(index));
        ++removed;
      }
      ASSERT_TRUE(Tiles(schedule)) << "after step " << step;
      ASSERT_TRUE(model.Matches(schedule)) << "after step " << step << ": " << Describe(schedule);
      // Lookups agree with the model at a few random seconds.
      for (int probe = 0; probe < 8; ++probe) {
        auto t = std::make_shared<WeekTime>();
        t->SetTimeVal(pick(kSecondsPerWeek));
        auto node = schedule.GetNodeByTime(*t);
        ASSERT_TRUE(node);
        uint8_t expected = model.At(t->TimeVal());
        EXPECT_EQ(
            node->Obj()->EventType() == kEventTypeShow ? std::stoi(node->Obj()->Filename()) : 0,
            expected);
      }
    }
    // The file holds the same week.
    auto reread = ScheduleFromText(ScheduleToText(schedule));
    EXPECT_TRUE(Tiles(*reread));
    EXPECT_TRUE(model.Matches(*reread));
    // Every kind of step happened.
    EXPECT_GT(added, 10);
    EXPECT_GT(refused, 10);
    EXPECT_GT(removed, 10);
  }
}

}  // namespace
}  // namespace tav
