#include "schedule/MonitoredShowEvent.h"

#include <gtest/gtest.h>

#include "support/Error.h"

namespace tav {
namespace {

std::shared_ptr<MonitoredShowEvent> Xmas() {
  auto e = std::make_shared<MonitoredShowEvent>();
  e->SetFilename("Xmas");
  e->Range()->SetStartTime(DateTime::FromParts(2024, 12, 24, 18));
  e->Range()->SetEndTime(DateTime::FromParts(2024, 12, 24, 22));
  e->SetScheduleType(1);
  return e;
}

TEST(MonitoredShowEvent, TextForm) {
  EXPECT_EQ(MonitoredShowEvent().Serialize(), "(,(F,,F,), 0,F)");
  const std::string xmas = "(Xmas,(T,2024-12-24 18:00:00,T,2024-12-24 22:00:00), 1,F)";
  EXPECT_EQ(Xmas()->Serialize(), xmas);
  MonitoredShowEvent read;
  read.Deserialize(xmas);
  EXPECT_EQ(read.Serialize(), xmas);

  auto odd = std::make_shared<MonitoredShowEvent>();
  odd->SetFilename("C:\\Shows\\a (new),*.tss");
  odd->SetScheduleType(-3);
  odd->SetShuttingDown(true);
  MonitoredShowEvent back;
  back.Deserialize(odd->Serialize());
  EXPECT_EQ(back.Filename(), odd->Filename());
  EXPECT_EQ(back.ScheduleType(), -3);
  EXPECT_TRUE(back.ShuttingDown());
}

TEST(MonitoredShowEvent, EqualityAndCopyGoThroughTheText) {
  auto a = std::make_shared<MonitoredShowEvent>(), b = std::make_shared<MonitoredShowEvent>();
  EXPECT_TRUE(a->MemberwiseEquals(b));
  EXPECT_TRUE(a->MemberwiseEquals(nullptr));
  b->SetShuttingDown(true);
  EXPECT_FALSE(a->MemberwiseEquals(b));

  auto source = Xmas();
  MonitoredShowEvent copy;
  copy.CopyFrom(source);
  EXPECT_TRUE(copy.MemberwiseEquals(source));
  EXPECT_NE(copy.Range(), source->Range());  // never shares its range
  copy.CopyFrom(nullptr);
  EXPECT_EQ(copy.Serialize(), "(,(F,,F,), 0,F)");
}

TEST(MonitoredShowEvent, RangeIsSharedAndNeverNull) {
  MonitoredShowEvent e;
  auto range = std::make_shared<TimeRange>();
  e.SetRange(range);
  EXPECT_EQ(e.Range(), range);
  e.SetRange(nullptr);
  ASSERT_NE(e.Range(), nullptr);
  EXPECT_NE(e.Range(), range);
}

TEST(MonitoredShowEvent, BadRecordsFailAndKeepTheState) {
  auto e = Xmas();
  const std::string before = e->Serialize();
  const std::pair<const char*, const char*> cases[] = {
      {"(a,(F,,F,), 1)", "Unexpected number of fields in serialized monitored show event: 3"},
      {"(a,(F,,F), 1,F)", "Unexpected number of fields in serialized time range: 3"},
      {"(a,(F,,F,),x,F)", "Type mismatch"},
  };
  for (auto [text, description] : cases) {
    try {
      e->Deserialize(text);
      ADD_FAILURE() << text;
    } catch (const Error& err) {
      EXPECT_EQ(err.Description(), description) << text;
    }
    EXPECT_EQ(e->Serialize(), before);
  }
}

}  // namespace
}  // namespace tav
