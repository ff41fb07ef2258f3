#include "show/TriggeredSequencesFunctions.h"

#include "show/TriggerFunctions.h"
#include "support/Error.h"
#include "support/Serialize.h"

namespace tav {

std::shared_ptr<TriggeredSequences> NewTriggeredSequences(std::shared_ptr<Trigger> trigger,
                                                          const std::vector<std::string>& names) {
  auto binding = std::make_shared<TriggeredSequences>();
  binding->SetSequences(names);
  binding->SetTrig(std::move(trigger));
  return binding;
}

std::string TriggeredSequencesToText(const std::shared_ptr<TriggeredSequences>& binding) {
  if (!binding) throw errors::ObjectNotSet("TriggeredSequencesFunctions.TriggeredSequencesToText");
  return TriggeredSequencesToText(*binding);
}

std::string TriggeredSequencesToText(const TriggeredSequences& binding) {
  // Sequence(0) is read unconditionally: a binding without names fails here.
  std::vector<std::string> fields;
  fields.reserve(static_cast<size_t>(binding.NumSequences()) + 1);
  fields.push_back(EscapeText(binding.Sequence(0)));
  fields.push_back(TriggerToText(binding.Trig()));
  for (int32_t k = 1; k < binding.NumSequences(); ++k) {
    fields.push_back(EscapeText(binding.Sequence(k)));
  }
  return ListToText(fields);
}

std::shared_ptr<TriggeredSequences> TriggeredSequencesFromText(std::string_view text) {
  TextArray fields = ListFromText(text, 1);
  std::shared_ptr<Trigger> trig = TriggerFromText(fields[2]);
  int32_t n = ArrayCount(fields);
  std::vector<std::string> names;
  if (n - 1 > 0) {
    names.reserve(static_cast<size_t>(n - 1));
    names.push_back(UnescapeText(fields[1]));
    for (int32_t k = 3; k <= n; ++k) names.push_back(UnescapeText(fields[k]));
  }
  return NewTriggeredSequences(std::move(trig), names);
}

}  // namespace tav
