#include "show/TriggeredSequences.h"
#include "support/testing/Failure.h"

#include <gtest/gtest.h>

#include "show/TriggerFunctions.h"
#include "show/TriggeredSequencesFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

std::shared_ptr<TriggeredSequences> Abc() {
  return NewTriggeredSequences(NewTrigger(1, 2, 5, "x"), {"a", "b", "c"});
}

TEST(TriggeredSequences, RoundRobinWrapsAfterTheLastName) {
  auto binding = Abc();
  std::vector<int32_t> seen;
  for (int i = 0; i < 4; ++i, binding->BumpRoundRobinIndex()) {
    seen.push_back(binding->RoundRobinIndex());
  }
  EXPECT_EQ(seen, (std::vector<int32_t>{0, 1, 2, 0}));
  TriggeredSequences empty;
  empty.BumpRoundRobinIndex();
  EXPECT_EQ(empty.RoundRobinIndex(), 0);
}

TEST(TriggeredSequences, SequenceIndexesAreChecked) {
  auto binding = Abc();
  binding->SetSequence(1, "B");
  EXPECT_EQ(binding->Sequence(1), "B");
  EXPECT_EQ(tav::testing::FailureOf([&] { binding->Sequence(3); }).number, 9);
  EXPECT_EQ(tav::testing::FailureOf([&] { binding->Sequence(-1); }).number, 9);
  EXPECT_EQ(tav::testing::FailureOf([&] { binding->SetSequence(3, "d"); }).number, 9);
}

TEST(TriggeredSequences, CopySharesNothingAndKeepsItsOwnRoundRobinIndex) {
  auto source = Abc();
  TriggeredSequences target;
  target.SetSequences({"old1", "old2"});
  target.BumpRoundRobinIndex();
  target.Copy(source);
  EXPECT_EQ(target.RoundRobinIndex(), 1);
  EXPECT_EQ(TriggeredSequencesToText(target), "(a,( 5,x, 2, 1),b,c)");
  source->Trig()->SetUnitId(99);
  source->SetSequence(0, "z");
  EXPECT_EQ(TriggeredSequencesToText(target), "(a,( 5,x, 2, 1),b,c)");
  target.Copy(target);
  EXPECT_EQ(TriggeredSequencesToText(target), "(a,( 5,x, 2, 1),b,c)");

  auto noTrigger = NewTriggeredSequences(nullptr, {"a"});
  EXPECT_EQ(tav::testing::FailureOf([&] { target.Copy(noTrigger); }).number, 91);
}

TEST(TriggeredSequencesText, FirstNameBeforeTheTriggerTheRestAfter) {
  const std::string text = "(a,( 5,x, 2, 1),b,c)";
  EXPECT_EQ(TriggeredSequencesToText(Abc()), text);
  auto back = TriggeredSequencesFromText(text);
  ASSERT_EQ(back->NumSequences(), 3);
  EXPECT_EQ(back->Sequence(0), "a");
  EXPECT_EQ(back->Sequence(2), "c");
  EXPECT_TRUE(back->Trig()->Equals(Abc()->Trig()));

  const std::string odd = "C:\\Shows\\(new), *best*.tss";
  auto binding = NewTriggeredSequences(NewTrigger(0, 0, 0, ""), {"", odd});
  EXPECT_EQ(TriggeredSequencesToText(binding), "(,( 0,, 0, 0),C:\\Shows\\*Onew*C*S *Ebest*E.tss)");
  EXPECT_EQ(TriggeredSequencesFromText(TriggeredSequencesToText(binding))->Sequence(1), odd);
}

TEST(TriggeredSequencesText, UnwritableAndUnreadableBindings) {
  // Sequence(0) is read unconditionally.
  auto noNames = NewTriggeredSequences(NewTrigger(1, 2, 5, "x"), {});
  EXPECT_EQ(tav::testing::FailureOf([&] { TriggeredSequencesToText(noNames); }).number, 9);
  auto noTrigger = NewTriggeredSequences(nullptr, {"a"});
  EXPECT_EQ(tav::testing::FailureOf([&] { TriggeredSequencesToText(noTrigger); }).number, 91);

  EXPECT_EQ(tav::testing::FailureOf([] { TriggeredSequencesFromText("(a)"); }).number, 9);
  EXPECT_EQ(tav::testing::FailureOf([] { TriggeredSequencesFromText(""); }).number, 9);
  EXPECT_EQ(tav::testing::FailureOf([] { TriggeredSequencesFromText("(a,( 5,x,two, 1))"); }).number,
            13);
}

}  // namespace
}  // namespace tav
