#include "show/InteractiveGroupFunctions.h"

#include <gtest/gtest.h>

#include "show/TriggerFunctions.h"
#include "show/TriggeredSequencesFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

// Two bindings; the count field deliberately disagrees with them.
const std::string kPorch =
    "( 9,Kids *Oage 3*S up*C,T,F,T,Porch *E1,((a,( 5,x, 2, 1),b),(c,( 6,, 2, 1))),F)";

int32_t ReadError(std::string_view text) {
  try {
    InteractiveGroupFromText(text);
  } catch (const Error& e) {
    return e.Number();
  }
  return 0;
}

TEST(InteractiveGroupText, ReadsFieldsAndCountsTheBindingsItself) {
  auto group = InteractiveGroupFromText(kPorch);
  EXPECT_EQ(group->Description(), "Kids (age 3, up)");
  EXPECT_TRUE(group->Independent());
  EXPECT_FALSE(group->Interruptible());
  EXPECT_TRUE(group->MusicalAllowed());
  EXPECT_EQ(group->Name(), "Porch *1");
  EXPECT_FALSE(group->LightsOffAtEnd());
  EXPECT_EQ(group->TypeName(), "Interactive Group");
  ASSERT_EQ(group->Count(), 2);
  EXPECT_EQ(group->GetTriggeredSequences(0)->NumSequences(), 2);
  EXPECT_EQ(group->GetTriggeredSequences(1)->Trig()->InputNumber(), 6);

  std::string written = InteractiveGroupToText(group);
  EXPECT_EQ(written, "( 2" + kPorch.substr(3));
  EXPECT_EQ(InteractiveGroupToText(InteractiveGroupFromText(written)), written);
}

TEST(InteractiveGroupText, SevenFieldsKeepLightsOffAtEnd) {
  auto group = InteractiveGroupFromText("( 1,,F,T,F,g,((a,( 5,x, 2, 1))))");
  EXPECT_TRUE(group->LightsOffAtEnd());
  EXPECT_EQ(group->TypeName(), "Soundboard");
  EXPECT_EQ(InteractiveGroupToText(group), "( 1,,F,T,F,g,((a,( 5,x, 2, 1))),T)");
}

TEST(InteractiveGroupText, UnguardedEmptyGroups) {
  InteractiveGroup empty;
  try {
    InteractiveGroupToText(empty);
    FAIL() << "a group without bindings was written";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 9);
    EXPECT_EQ(e.Description(), "Subscript out of range");
  }
  struct Case {
    const char* text;
    int32_t number;
  } cases[] = {
      {"( 0,,F,F,T,g,,T)", 9},                    // empty bindings field: no list
      {"( 0,,F,F,T,g,(),T)", 9},                  // "()" is one empty binding
      {"( 0,,F,F,T,g,none,T)", 9},                // not a list either
      {"( 1,,F,F,T,g)", 9},                       // bindings field missing
      {"( 1,,F,F,T,g,((a)),T)", 9},               // binding without a trigger
      {"( 1,,F,F,T,g,((a,( 5,x,u, 1))),T)", 13},  // trigger number
      {"( 1,,F,F,T,g,((a,( 5,x, 2, 1)),T", 4},    // bindings never close
      {"( 1,,F,F,T,g,(a)(b,c),T)", 3},            // bindings field is no list
      {"", 9},
  };
  for (const auto& c : cases) EXPECT_EQ(ReadError(c.text), c.number) << c.text;
}

TEST(InteractiveGroupText, BindingWithoutNamesCannotBeWritten) {
  InteractiveGroup group;
  group.AddTriggeredSequences(NewTriggeredSequences(NewTrigger(1, 2, 3, ""), {}));
  EXPECT_THROW(InteractiveGroupToText(group), Error);
}

}  // namespace
}  // namespace tav
