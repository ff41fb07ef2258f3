#include "show/InteractiveGroup.h"
#include "support/testing/Failure.h"

#include <gtest/gtest.h>

#include "show/InteractiveGroupFunctions.h"
#include "show/TriggerFunctions.h"
#include "show/TriggeredSequencesFunctions.h"
#include "support/Error.h"

namespace tav {
namespace {

const std::string kMagicToy =
    "Any unit/circuit in this group can be associated with any number of sequences, all of which "
    "will play simultaneously whenever that Unit/circuit is triggered.  If any sequences from this "
    "group were already playing, they will immediately stop.\r\n\r\nOnly animation sequences can "
    "be used in this group - musical sequences cannot be used.";
const std::string kSoundboard =
    "Only one sequence from this group can be playing at any given time.  If a unit/circuit from "
    "this group is triggered, but a sequence from this group is already playing, the playing "
    "sequence will immediately stop, and the sequence associated with the triggered unit/circuit "
    "will be played.\r\n\r\nIf a unit/circuit in this group is associated with more than once "
    "sequence, then every time it is triggered, the next such sequence will be played, in a "
    "round-robin fashion.";
const std::string kJukebox =
    "Only one sequence from this group can be playing at any given time.  If a unit/circuit from "
    "this group is triggered, but a sequence from this group is already playing, the trigger will "
    "be ignored.\r\n\r\nIf a unit/circuit in this group is associated with more than one "
    "sequence, then every time it is triggered, the next such sequence will be played, in a "
    "round-robin fashion (unless it is ignored because a sequence from this group is already "
    "playing).";

std::shared_ptr<TriggeredSequences> Binding(int32_t unit, std::vector<std::string> names) {
  return NewTriggeredSequences(NewTrigger(1, unit, 1, ""), names);
}

TEST(InteractiveGroup, NewGroupHasNoTypeUntilAFlagIsWritten) {
  InteractiveGroup group;
  EXPECT_EQ(group.TypeName(), "");
  EXPECT_EQ(group.TypeDesc(), "");
  EXPECT_TRUE(group.MusicalAllowed());
  EXPECT_TRUE(group.LightsOffAtEnd());
  EXPECT_EQ(group.Count(), 0);
  group.SetMusicalAllowed(true);  // unchanged value, still derives the type
  EXPECT_EQ(group.TypeName(), "Jukebox");
  EXPECT_EQ(group.TypeDesc(), kJukebox);
}

TEST(InteractiveGroup, TypeFollowsEveryFlagWrite) {
  InteractiveGroup group;
  struct Step {
    void (InteractiveGroup::*setter)(bool);
    bool value;
    const char* typeName;
    std::string typeDesc;
  } steps[] = {
      {&InteractiveGroup::SetIndependent, true, "Interactive Group", ""},
      {&InteractiveGroup::SetInterruptible, true, "Magic Toy", kMagicToy},
      {&InteractiveGroup::SetIndependent, false, "Soundboard", kSoundboard},
      {&InteractiveGroup::SetInterruptible, false, "Jukebox", kJukebox},
      // Independent alone has no type: the generic name, and the help text of
      // the type before stays.
      {&InteractiveGroup::SetIndependent, true, "Interactive Group", kJukebox},
      {&InteractiveGroup::SetMusicalAllowed, false, "Interactive Group", kJukebox},
      {&InteractiveGroup::SetInterruptible, true, "Magic Toy", kMagicToy},
  };
  int i = 0;
  for (const auto& step : steps) {
    (group.*step.setter)(step.value);
    EXPECT_EQ(group.TypeName(), step.typeName) << "step " << i;
    EXPECT_EQ(group.TypeDesc(), step.typeDesc) << "step " << i;
    ++i;
  }
}

TEST(InteractiveGroup, BindingsAreIndexedFromZeroAndChecked) {
  InteractiveGroup group;
  auto a = Binding(1, {"a"}), b = Binding(2, {"b"}), c = Binding(3, {"c"});
  for (const auto& binding : {a, b, c}) group.AddTriggeredSequences(binding);
  EXPECT_EQ(group.GetTriggeredSequences(2), c);
  EXPECT_EQ(tav::testing::FailureOf([&] { group.GetTriggeredSequences(3); }).number, 9);
  EXPECT_EQ(tav::testing::FailureOf([&] { group.GetTriggeredSequences(-1); }).number, 9);
  group.DeleteTriggeredSequence(0);
  EXPECT_EQ(group.Count(), 2);
  EXPECT_EQ(group.GetTriggeredSequences(0), b);
  EXPECT_EQ(group.GetTriggeredSequences(1), c);
  EXPECT_EQ(tav::testing::FailureOf([&] { group.DeleteTriggeredSequence(2); }).number, 9);
}

TEST(InteractiveGroup, CopySharesNothingAndDerivesTheTypeAgain) {
  auto source =
      InteractiveGroupFromText("( 2,kids,F,T,T,Porch,((a,( 1,, 2, 3),b),(c,( 2,, 2, 3))),F)");
  source->GetTriggeredSequences(0)->BumpRoundRobinIndex();
  InteractiveGroup copy;
  copy.AddTriggeredSequences(Binding(9, {"old"}));
  copy.Copy(source);
  EXPECT_EQ(InteractiveGroupToText(copy), InteractiveGroupToText(source));
  EXPECT_EQ(copy.TypeName(), "Soundboard");
  EXPECT_EQ(copy.TypeDesc(), kSoundboard);
  EXPECT_NE(copy.GetTriggeredSequences(0)->Trig(), source->GetTriggeredSequences(0)->Trig());
  EXPECT_EQ(copy.GetTriggeredSequences(0)->RoundRobinIndex(), 0);
  copy.Copy(copy);  // copying from itself keeps everything
  EXPECT_EQ(InteractiveGroupToText(copy), InteractiveGroupToText(source));
}

}  // namespace
}  // namespace tav
