#pragma once
// The text form of a trigger, as it stands in a group binding and as a show's
// startup trigger: "( 5,x, 2, 1)" is input 5, name "x", unit 2, network 1.
// The numbers carry the sign blank of stored whole numbers; the name is
// escaped. The reader fails (and the show reader then drops the trigger) on a
// missing field or a number field that is no number.

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "show/Trigger.h"

namespace tav {

// Writes InputNumber, Name, UnitId and Network, in that order.
std::shared_ptr<Trigger> NewTrigger(int32_t network, int32_t unitId, int32_t inputNumber,
                                    std::string name);

// Fields: InputNumber, Name, UnitId, Network. Null fails with error 91.
std::string TriggerToText(const std::shared_ptr<Trigger>& trigger);
std::string TriggerToText(const Trigger& trigger);

// Raises list errors, the subscript error (9) for a missing field and the
// type-mismatch error (13) for a number field that is no number.
std::shared_ptr<Trigger> TriggerFromText(std::string_view text);

}  // namespace tav
