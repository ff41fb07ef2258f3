#include "show/TriggerFunctions.h"

#include "support/Error.h"
#include "support/Serialize.h"

namespace tav {

std::shared_ptr<Trigger> NewTrigger(int32_t network, int32_t unitId, int32_t inputNumber,
                                    std::string name) {
  auto trigger = std::make_shared<Trigger>();
  trigger->SetInputNumber(inputNumber);
  trigger->SetName(std::move(name));
  trigger->SetUnitId(unitId);
  trigger->SetNetwork(network);
  return trigger;
}

std::string TriggerToText(const std::shared_ptr<Trigger>& trigger) {
  if (!trigger) throw errors::ObjectNotSet("TriggerFunctions.TriggerToText");
  return TriggerToText(*trigger);
}

std::string TriggerToText(const Trigger& trigger) {
  return ListToText(std::vector<std::string>{
      LongToText(trigger.InputNumber()),
      EscapeText(trigger.Name()),
      LongToText(trigger.UnitId()),
      LongToText(trigger.Network()),
  });
}

std::shared_ptr<Trigger> TriggerFromText(std::string_view text) {
  TextArray fields = ListFromText(text, 1);
  // Read in argument order of NewTrigger, so that a record with several bad
  // fields reports the same one every time.
  int32_t network = LongFromText(fields[4]);
  int32_t unitId = LongFromText(fields[3]);
  int32_t inputNumber = LongFromText(fields[1]);
  std::string name = UnescapeText(fields[2]);
  return NewTrigger(network, unitId, inputNumber, std::move(name));
}

}  // namespace tav
