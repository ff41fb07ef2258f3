#include "show/TriggeredSequences.h"

#include <gtest/gtest.h>

#include "show/TriggerFunctions.h"
#include "show/TriggeredSequencesFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

std::shared_ptr<TriggeredSequences> Abc() {
  return NewTriggeredSequences(NewTrigger(1, 2, 5, "x"), {"a", "b", "c"});
}

int32_t ErrorNumber(const std::function<void()>& action) {
  try {
    action();
  } catch (const Error& e) {
    return e.Number();
  }
  return 0;
}

TEST(TriggeredSequences, RoundRobinWrapsAfterTheLastName) {
  auto binding = Abc();
  std::vector<int32_t> seen;
  for (int i = 0; i < 4; ++i) {
    seen.push_back(binding->RoundRobinIndex());
    binding->BumpRoundRobinIndex();
  }
  EXPECT_EQ(seen, (std::vector<int32_t>{0, 1, 2, 0}));

  TriggeredSequences empty;
  empty.BumpRoundRobinIndex();
  EXPECT_EQ(empty.RoundRobinIndex(), 0);

  // Names removed since the last bump: the index starts over.
  binding->BumpRoundRobinIndex();  // 2
  binding->SetSequences({"only"});
  binding->BumpRoundRobinIndex();
  EXPECT_EQ(binding->RoundRobinIndex(), 0);
}

TEST(TriggeredSequences, SequenceIndexesAreCheckedBothWays) {
  auto binding = Abc();
  binding->SetSequence(1, "B");
  EXPECT_EQ(binding->Sequence(1), "B");
  EXPECT_EQ(ErrorNumber([&] { binding->Sequence(3); }), 9);
  EXPECT_EQ(ErrorNumber([&] { binding->Sequence(-1); }), 9);
  EXPECT_EQ(ErrorNumber([&] { binding->SetSequence(3, "d"); }), 9);
  binding->ClearSequences();
  EXPECT_EQ(binding->NumSequences(), 0);
  EXPECT_EQ(ErrorNumber([&] { binding->Sequence(0); }), 9);
}

TEST(TriggeredSequences, CopySharesNothingAndKeepsItsOwnRoundRobinIndex) {
  auto source = Abc();
  TriggeredSequences target;
  target.AddSequence("old1");
  target.AddSequence("old2");
  target.BumpRoundRobinIndex();
  target.Copy(source);

  EXPECT_EQ(target.RoundRobinIndex(), 1);
  EXPECT_EQ(TriggeredSequencesToText(target), "(a,( 5,x, 2, 1),b,c)");
  ASSERT_NE(target.Trig(), source->Trig());
  source->Trig()->SetUnitId(99);
  source->SetSequence(0, "z");
  EXPECT_EQ(target.Trig()->UnitId(), 2);
  EXPECT_EQ(target.Sequence(0), "a");

  TriggeredSequences noTrigger;
  noTrigger.AddSequence("a");
  EXPECT_EQ(ErrorNumber([&] { target.Copy(noTrigger); }), 91);
  EXPECT_EQ(ErrorNumber([&] { target.Copy(std::shared_ptr<TriggeredSequences>()); }), 91);
}

TEST(TriggeredSequencesText, FirstNameBeforeTheTriggerTheRestAfter) {
  const std::string text = "(a,( 5,x, 2, 1),b,c)";
  EXPECT_EQ(TriggeredSequencesToText(Abc()), text);

  auto back = TriggeredSequencesFromText(text);
  ASSERT_EQ(back->NumSequences(), 3);
  EXPECT_EQ(back->Sequence(0), "a");
  EXPECT_EQ(back->Sequence(1), "b");
  EXPECT_EQ(back->Sequence(2), "c");
  EXPECT_TRUE(back->Trig()->Equals(NewTrigger(1, 2, 5, "")));
  EXPECT_EQ(back->Trig()->Name(), "x");
  EXPECT_EQ(back->RoundRobinIndex(), 0);
}

TEST(TriggeredSequencesText, OddNamesSurvive) {
  auto binding =
      NewTriggeredSequences(NewTrigger(0, 0, 0, ""), {"", "C:\\Shows\\(new), *best*.tss", ""});
  std::string text = TriggeredSequencesToText(binding);
  EXPECT_EQ(text, "(,( 0,, 0, 0),C:\\Shows\\*Onew*C*S *Ebest*E.tss,)");
  auto back = TriggeredSequencesFromText(text);
  ASSERT_EQ(back->NumSequences(), 3);
  EXPECT_EQ(back->Sequence(1), "C:\\Shows\\(new), *best*.tss");
  EXPECT_EQ(TriggeredSequencesToText(back), text);
}

TEST(TriggeredSequencesText, UnwritableAndUnreadableBindings) {
  // Sequence(0) is read unconditionally.
  auto noNames = NewTriggeredSequences(NewTrigger(1, 2, 5, "x"), {});
  EXPECT_EQ(ErrorNumber([&] { TriggeredSequencesToText(noNames); }), 9);
  auto noTrigger = NewTriggeredSequences(nullptr, {"a"});
  EXPECT_EQ(ErrorNumber([&] { TriggeredSequencesToText(noTrigger); }), 91);

  EXPECT_EQ(ErrorNumber([] { TriggeredSequencesFromText("(a)"); }), 9);
  EXPECT_EQ(ErrorNumber([] { TriggeredSequencesFromText(""); }), 9);
  EXPECT_EQ(ErrorNumber([] { TriggeredSequencesFromText("(a,( 5,x,two, 1))"); }), 13);
  EXPECT_EQ(ErrorNumber([] { TriggeredSequencesFromText("(a,( 5,x, 2, 1)"); }), 2);
}

}  // namespace
}  // namespace tav
