#include "show/InteractiveGroupFunctions.h"

#include "show/TriggeredSequencesFunctions.h"
#include "support/Error.h"
#include "support/Serialize.h"

namespace tav {

std::string InteractiveGroupToText(const std::shared_ptr<InteractiveGroup>& group) {
  if (!group) throw errors::ObjectNotSet("InteractiveGroupFunctions.InteractiveGroupToText");
  return InteractiveGroupToText(*group);
}

std::string InteractiveGroupToText(const InteractiveGroup& group) {
  // The bindings array is sized 1..Count with no guard for Count 0: an empty
  // group has no valid text, and saying so is better than writing "()", which
  // would read back as one broken binding.
  if (group.Count() < 1) {
    throw errors::SubscriptOutOfRange("InteractiveGroupFunctions.InteractiveGroupToText");
  }
  std::vector<std::string> bindings;
  bindings.reserve(static_cast<size_t>(group.Count()));
  for (int32_t i = 0; i < group.Count(); ++i) {
    bindings.push_back(TriggeredSequencesToText(group.GetTriggeredSequences(i)));
  }
  return ListToText(std::vector<std::string>{
      LongToText(group.Count()),
      EscapeText(group.Description()),
      BoolToText(group.Independent()),
      BoolToText(group.Interruptible()),
      BoolToText(group.MusicalAllowed()),
      EscapeText(group.Name()),
      ListToText(bindings),
      BoolToText(group.LightsOffAtEnd()),
  });
}

std::shared_ptr<InteractiveGroup> InteractiveGroupFromText(std::string_view text) {
  TextArray fields = ListFromText(text, 1);
  auto group = std::make_shared<InteractiveGroup>();
  group->SetDescription(UnescapeText(fields[2]));
  group->SetIndependent(BoolFromText(fields[3]));
  group->SetInterruptible(BoolFromText(fields[4]));
  group->SetMusicalAllowed(BoolFromText(fields[5]));
  group->SetName(UnescapeText(fields[6]));

  // UBound of a never-sized array fails: an empty bindings field (or one that
  // is no list) fails the whole group.
  TextArray bindings = ListFromText(fields[7], 1);
  for (int32_t k = 1, last = bindings.UBound(); k <= last; ++k) {
    group->AddTriggeredSequences(TriggeredSequencesFromText(bindings[k]));
  }
  if (ArrayCount(fields) >= 8) group->SetLightsOffAtEnd(BoolFromText(fields[8]));
  return group;
}

}  // namespace tav
