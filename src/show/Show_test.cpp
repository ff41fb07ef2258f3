#include "show/Show.h"

#include <gtest/gtest.h>

#include "show/ShowFunctions.h"
#include "show/TriggerFunctions.h"

namespace tav {
namespace {

TEST(Show, MonitoringIsNeverNull) {
  Show show;
  ASSERT_NE(show.Monitoring(), nullptr);
  auto event = std::make_shared<MonitoredShowEvent>();
  event->SetFilename("Xmas.tsh");
  show.SetMonitoring(event);
  EXPECT_EQ(show.Monitoring(), event);
  show.SetMonitoring(nullptr);
  ASSERT_NE(show.Monitoring(), nullptr);
  EXPECT_EQ(show.Monitoring()->Serialize(), "(,(F,,F,), 0,F)");
}

TEST(Show, HasSameContentsComparesTheWrittenText) {
  auto a = std::make_shared<Show>(), b = std::make_shared<Show>();
  b->Monitoring()->SetFilename("other");
  EXPECT_TRUE(a->HasSameContents(b));  // Monitoring is not in the text

  // Both spellings of StartupType 0 compare equal after re-writing.
  const std::string head = "((0,1,2,0,,),(0,1,2,0,,),(1,0,1,0,,),(0,1,2,0,,),,(2,0,1,0,,),,";
  EXPECT_TRUE(ShowFromText(head + "0,,F)")->HasSameContents(ShowFromText(head + " 0,,F)")));

  b->Main()->List().Add("a.tss");  // the show's own playlist, by reference
  EXPECT_FALSE(a->HasSameContents(b));
  a->Main()->List().Add("a.tss");
  a->SetStartupTrigger(NewTrigger(1, 2, 3, ""));
  EXPECT_FALSE(a->HasSameContents(b));
  EXPECT_FALSE(a->HasSameContents(nullptr));
}

TEST(Show, HasSameContentsIsFalseWhenATextCannotBeWritten) {
  auto a = std::make_shared<Show>();
  a->InteractiveGroups()->push_back(std::make_shared<InteractiveGroup>());  // no bindings
  EXPECT_FALSE(a->HasSameContents(a));
  auto b = std::make_shared<Show>();
  b->SetMain(nullptr);
  EXPECT_FALSE(b->HasSameContents(b));
}

}  // namespace
}  // namespace tav
