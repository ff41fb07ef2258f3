#pragma once
// The text form of a group binding. The first sequence name stands before the
// trigger and the others after it: "(a,( 5,x, 2, 1),b,c)". That layout is the
// stored format and is kept as it is. A binding without sequences has no text
// (the writer fails with the subscript error), and the reader needs at least
// the name and the trigger fields.

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "show/TriggeredSequences.h"

namespace tav {

// SetSequences(names), then Trig = trigger.
std::shared_ptr<TriggeredSequences> NewTriggeredSequences(std::shared_ptr<Trigger> trigger,
                                                          const std::vector<std::string>& names);

// Fails with 9 without sequences and with 91 without a trigger (or for null).
std::string TriggeredSequencesToText(const std::shared_ptr<TriggeredSequences>& binding);
std::string TriggeredSequencesToText(const TriggeredSequences& binding);

// Raises list errors, 9 when the trigger field is missing, and the trigger
// reader's errors. RoundRobinIndex starts at 0.
std::shared_ptr<TriggeredSequences> TriggeredSequencesFromText(std::string_view text);

}  // namespace tav
