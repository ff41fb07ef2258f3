#include "show/Show.h"

#include <gtest/gtest.h>

#include "show/ShowFunctions.h"
#include "show/TriggerFunctions.h"

namespace tav {
namespace {

const std::string kNewShowText =
    "((0,1,2,0,,,T,F,F),(0,1,2,0,,,T,F,F),(1,0,1,0,,,T,F,F),(0,1,2,0,,,T,F,F),,"
    "(2,0,1,0,,,T,F,F),, 0,,F)";

TEST(Show, NewShowDefaults) {
  Show show;
  EXPECT_EQ(ShowToText(show), kNewShowText);
  EXPECT_EQ(show.Startup()->PlaylistType(), 2);
  EXPECT_EQ(show.Background()->AnimationType(), 2);
  ASSERT_NE(show.InteractiveGroups(), nullptr);
  EXPECT_TRUE(show.InteractiveGroups()->empty());
  EXPECT_EQ(show.StartupTrigger(), nullptr);
  ASSERT_NE(show.Monitoring(), nullptr);
  EXPECT_EQ(show.Monitoring()->Serialize(), "(,(F,,F,), 0,F)");
  // Each section has its own playlist.
  EXPECT_NE(show.Startup(), show.Shutdown());
  EXPECT_NE(show.Startup(), show.Musical());
}

TEST(Show, MonitoringIsNeverNull) {
  Show show;
  auto event = std::make_shared<MonitoredShowEvent>();
  event->SetFilename("Xmas.tsh");
  show.SetMonitoring(event);
  EXPECT_EQ(show.Monitoring(), event);
  show.SetMonitoring(nullptr);
  ASSERT_NE(show.Monitoring(), nullptr);
  EXPECT_NE(show.Monitoring(), event);
  EXPECT_EQ(show.Monitoring()->Filename(), "");
}

TEST(Show, PartsAreSharedByReference) {
  Show show;
  show.Main()->List().Add("a.tss");
  show.InteractiveGroups()->push_back(nullptr);
  EXPECT_EQ(show.Main()->Count(), 1);
  EXPECT_EQ(show.InteractiveGroups()->size(), 1u);
}

TEST(Show, HasSameContentsComparesTheWrittenText) {
  auto a = std::make_shared<Show>(), b = std::make_shared<Show>();
  b->Monitoring()->SetFilename("other");
  EXPECT_TRUE(a->HasSameContents(b));  // Monitoring is not in the text

  // Both spellings of StartupType 0 compare equal after re-writing.
  std::string withoutBlank = kNewShowText;
  withoutBlank.replace(withoutBlank.find(", 0,"), 4, ",0,");
  EXPECT_TRUE(ShowFromText(withoutBlank)->HasSameContents(ShowFromText(kNewShowText)));

  b->SetPreloadSequences(true);
  EXPECT_FALSE(a->HasSameContents(b));
  b->SetPreloadSequences(false);
  b->SetStartupTrigger(NewTrigger(1, 2, 3, ""));
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
  EXPECT_FALSE(std::make_shared<Show>()->HasSameContents(b));
}

}  // namespace
}  // namespace tav
