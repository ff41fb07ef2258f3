#include "show/Trigger.h"

#include <gtest/gtest.h>

#include "show/TriggerFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

TEST(Trigger, EqualsComparesTheInputButNotTheName) {
  auto a = NewTrigger(1, 2, 5, "front door");
  EXPECT_TRUE(a->Equals(NewTrigger(1, 2, 5, "something else")));
  EXPECT_FALSE(a->Equals(NewTrigger(9, 2, 5, "front door")));
  EXPECT_FALSE(a->Equals(NewTrigger(1, 9, 5, "front door")));
  EXPECT_FALSE(a->Equals(NewTrigger(1, 2, 9, "front door")));
  EXPECT_FALSE(a->Equals(nullptr));

  Trigger copy;
  copy.Copy(a);
  EXPECT_EQ(TriggerToText(copy), "( 5,front door, 2, 1)");
  EXPECT_THROW(copy.Copy(std::shared_ptr<Trigger>()), Error);
}

TEST(TriggerText, WritesSignBlanksAndEscapesTheNameAndReadsItBack) {
  EXPECT_EQ(TriggerToText(NewTrigger(1, 2, 5, "x")), "( 5,x, 2, 1)");
  EXPECT_EQ(TriggerToText(Trigger()), "( 0,, 0, 0)");
  const std::string odd = "(-12,a*Ob*C*S*Ec, 0,-1)";
  EXPECT_EQ(TriggerToText(NewTrigger(-1, 0, -12, "a(b),*c")), odd);
  auto t = TriggerFromText(odd);
  EXPECT_EQ(t->Name(), "a(b),*c");
  EXPECT_EQ(t->Network(), -1);
  EXPECT_EQ(t->InputNumber(), -12);
  // Numbers without the sign blank and with a fraction are read too.
  EXPECT_EQ(TriggerToText(TriggerFromText("(5,x,2.9,1, extra)")), "( 5,x, 2, 1)");
}

TEST(TriggerText, FailuresRaiseTheirNumbers) {
  struct Case {
    const char* text;
    int32_t number;
  } cases[] = {
      {"", 9},                 // no list at all: no fields
      {"( 5,x, 2)", 9},        // network missing
      {"( 5,x, two, 1)", 13},  // unit is no number
      {"( 5,x, 2, )", 13},     // an empty number field is no number either
      {"( 5,x, 2, 1", 1},      // not a list
      {"( 5,x, 2, 1e10)", 6},  // beyond 32 bits
  };
  for (const auto& c : cases) {
    try {
      TriggerFromText(c.text);
      ADD_FAILURE() << c.text;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), c.number) << c.text;
    }
  }
}

}  // namespace
}  // namespace tav
