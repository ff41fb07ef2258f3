// The simulation's timeline: how repeated lines fold, and how the timeline
// and its summary read.

#include <gmock/gmock.h>

#include <string>

#include "simulation/Timeline.h"
#include "simulation/TimelineText.h"

namespace tav::simulation {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

const DateTime kStart = DateTime::FromParts(2024, 12, 24, 18, 0, 0);

TimelineEvent Event(int64_t second, EventKind kind, std::string text) {
  TimelineEvent e;
  e.at = kStart.AddSeconds(second);
  e.kind = kind;
  e.text = std::move(text);
  return e;
}

TEST(Timeline, FoldsARepeatedLineWhileItKeepsComingAndCountsEveryRepeat) {
  Timeline t;
  EXPECT_TRUE(t.Add(Event(0, EventKind::kError, "Cannot read show file: a.show")));
  for (int s = 1; s <= 10; ++s)
    EXPECT_FALSE(t.Add(Event(s, EventKind::kError, "Cannot read show file: a.show")));
  // The same text as a warning, and another error, are lines of their own.
  EXPECT_TRUE(t.Add(Event(10, EventKind::kWarning, "Cannot read show file: a.show")));
  EXPECT_TRUE(t.Add(Event(11, EventKind::kError, "Cannot read show file: b.show")));
  // After a pause longer than the fold span the line starts afresh.
  EXPECT_TRUE(t.Add(
      Event(10 + Timeline::kFoldSeconds + 1, EventKind::kError, "Cannot read show file: a.show")));

  ASSERT_EQ(t.Events().size(), 4u);
  EXPECT_EQ(t.Events()[0].repeats, 10);
  EXPECT_EQ(t.Events()[0].lastAt, kStart.AddSeconds(10));
  EXPECT_EQ(t.Events()[3].repeats, 0);
  EXPECT_EQ(t.Count(EventKind::kError), 13);
  EXPECT_EQ(t.Count(EventKind::kWarning), 1);
  EXPECT_EQ(t.Count(EventKind::kShowStart), 0);
}

TEST(Timeline, KeepsIdenticalLinesApartAcrossAShowEvent) {
  Timeline t;
  t.Add(Event(0, EventKind::kSequenceStop, "Animation: Sequences/a.tseq"));
  t.Add(Event(0, EventKind::kSequenceStart, "Animation: Sequences/a.tseq"));
  t.Add(Event(0, EventKind::kShowWindingDown, "a.show"));
  t.Add(Event(0, EventKind::kSequenceStop, "Animation: Sequences/a.tseq"));
  t.Add(Event(1, EventKind::kSequenceStop, "Animation: Sequences/a.tseq"));
  ASSERT_EQ(t.Events().size(), 4u);
  EXPECT_EQ(t.Events()[0].repeats, 0);
  EXPECT_EQ(t.Events()[3].repeats, 1);
  EXPECT_EQ(t.Lines(EventKind::kSequenceStop), 2);
  EXPECT_EQ(t.Count(EventKind::kSequenceStop), 3);
}

TEST(EventLine, ReadsAsTimeKindAndTextWithTheReasonForAShow) {
  TimelineEvent show = Event(5, EventKind::kShowStart, "xmas.show");
  show.source = "week";
  show.reason = "the week schedule has \"xmas.show\" every Tue 18:00";
  EXPECT_EQ(EventLine(show),
            "2024-12-24 18:00:05  show-start         xmas.show  [week] the week schedule has "
            "\"xmas.show\" every Tue 18:00");

  TimelineEvent error = Event(7, EventKind::kError, "ERROR WITH SEQUENCE (x)");
  EXPECT_EQ(EventLine(error), "2024-12-24 18:00:07  error              ERROR WITH SEQUENCE (x)");
  error.repeats = 1;
  error.lastAt = kStart.AddSeconds(8);
  EXPECT_THAT(EventLine(error), HasSubstr("(and 1 more time until 2024-12-24 18:00:08)"));
  error.repeats = 59;
  EXPECT_THAT(EventLine(error), HasSubstr("(and 59 more times until"));
}

TEST(HeadingText, NamesTheWeekdays) {
  EXPECT_EQ(HeadingText(kStart, kStart.AddDays(1)),
            "Simulated from Tue 2024-12-24 18:00:00 to Wed 2024-12-25 18:00:00");
}

TEST(SummaryText, CountsWhatHappenedAndSaysWhetherAnythingFailed) {
  SimulationReport quiet;
  EXPECT_EQ(SummaryText(quiet),
            "0 shows started, 0 sequences started, 0 warnings, 0 errors\n"
            "Outputs: none driven\n"
            "Result: OK\n");

  SimulationReport busy;
  busy.timeline.Add(Event(0, EventKind::kShowStart, "a.show"));
  busy.timeline.Add(Event(1, EventKind::kSequenceStart, "Animation: a.tseq"));
  busy.timeline.Add(Event(2, EventKind::kWarning, "Cannot load compressed sequence file"));
  busy.outputs.dmxUniverses = {1, 3};
  busy.outputs.tavUnits = {{1, 2}};
  busy.outputs.frames = 1200;
  std::string text = SummaryText(busy);
  EXPECT_THAT(text, HasSubstr("1 show started, 1 sequence started, 1 warning, 0 errors"));
  EXPECT_THAT(text, HasSubstr("Outputs: 2 DMX universes (1 3), 1 TAV unit; 1200 frames"));
  EXPECT_THAT(text, HasSubstr("Result: OK"));

  busy.timeline.Add(Event(3, EventKind::kError, "Cannot read show file: b.show"));
  EXPECT_THAT(SummaryText(busy), HasSubstr("1 warning, 1 error\n"));
  EXPECT_THAT(SummaryText(busy), HasSubstr("Result: FAILED"));
  busy.timeline.Add(Event(4, EventKind::kError, "Cannot read show file: b.show"));
  EXPECT_THAT(SummaryText(busy), HasSubstr("1 warning, 1 error (2 times in all)\n"));

  SimulationReport cut;
  cut.endedEarlyAt = kStart.AddSeconds(90);
  EXPECT_THAT(SummaryText(cut), HasSubstr("The player ended early, at 2024-12-24 18:01:30"));
  EXPECT_THAT(SummaryText(cut), HasSubstr("Result: FAILED"));
  EXPECT_THAT(SummaryText(cut), Not(HasSubstr("Result: OK")));
}

}  // namespace
}  // namespace tav::simulation
