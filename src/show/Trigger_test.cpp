#include "show/Trigger.h"

#include <gtest/gtest.h>

#include "show/TriggerFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

int32_t ErrorNumberOf(std::string_view text) {
  try {
    TriggerFromText(text);
  } catch (const Error& e) {
    return e.Number();
  }
  return 0;
}

TEST(Trigger, EqualsComparesTheInputButNotTheName) {
  auto a = NewTrigger(1, 2, 5, "front door");
  EXPECT_TRUE(a->Equals(NewTrigger(1, 2, 5, "something else")));
  EXPECT_FALSE(a->Equals(NewTrigger(9, 2, 5, "front door")));
  EXPECT_FALSE(a->Equals(NewTrigger(1, 9, 5, "front door")));
  EXPECT_FALSE(a->Equals(NewTrigger(1, 2, 9, "front door")));
  EXPECT_FALSE(a->Equals(nullptr));
}

TEST(Trigger, NewTriggerPutsEachArgumentInItsField) {
  auto t = NewTrigger(1, 2, 5, "x");
  EXPECT_EQ(t->Network(), 1);
  EXPECT_EQ(t->UnitId(), 2);
  EXPECT_EQ(t->InputNumber(), 5);
  EXPECT_EQ(t->Name(), "x");
}

TEST(Trigger, CopyTakesAllFourFieldsAndRefusesNull) {
  Trigger target;
  target.Copy(NewTrigger(3, 4, 7, "porch"));
  EXPECT_EQ(TriggerToText(target), "( 7,porch, 4, 3)");
  try {
    target.Copy(std::shared_ptr<Trigger>());
    FAIL() << "copy from null";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 91);
    EXPECT_EQ(e.Description(), "Object variable or With block variable not set");
  }
}

TEST(TriggerText, WritesSignBlanksAndEscapesTheName) {
  EXPECT_EQ(TriggerToText(NewTrigger(1, 2, 5, "x")), "( 5,x, 2, 1)");
  EXPECT_EQ(TriggerToText(Trigger()), "( 0,, 0, 0)");
  EXPECT_EQ(TriggerToText(NewTrigger(-1, 0, -12, "a(b),*c")), "(-12,a*Ob*C*S*Ec, 0,-1)");
  EXPECT_THROW(TriggerToText(std::shared_ptr<Trigger>()), Error);
}

TEST(TriggerText, ReadsBackWhatItWrites) {
  auto t = TriggerFromText("(-12,a*Ob*C*S*Ec, 0,-1)");
  EXPECT_EQ(t->InputNumber(), -12);
  EXPECT_EQ(t->Name(), "a(b),*c");
  EXPECT_EQ(t->UnitId(), 0);
  EXPECT_EQ(t->Network(), -1);
  // Numbers without the sign blank and with a fraction are read too.
  EXPECT_EQ(TriggerToText(TriggerFromText("(5,x,2.9,1)")), "( 5,x, 2, 1)");
}

TEST(TriggerText, FailuresRaiseTheirNumbers) {
  struct Case {
    const char* text;
    int32_t number;
  } cases[] = {
      {"", 9},                 // no list at all: no fields
      {"( 5,x, 2)", 9},        // network missing
      {"( 5,x, two, 1)", 13},  // unit is no number
      {"( 5,x, 2, )", 13},     // empty number field
      {"( 5,x, 2, 1", 1},      // not a list
      {"( 5,x, 2, 1e10)", 6},  // beyond 32 bits
      {"( 5,x, 2, 1, 9)", 0},  // extra fields are ignored
  };
  for (const auto& c : cases) EXPECT_EQ(ErrorNumberOf(c.text), c.number) << c.text;
}

}  // namespace
}  // namespace tav
