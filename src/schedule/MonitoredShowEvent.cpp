#include "schedule/MonitoredShowEvent.h"

#include "support/Error.h"
#include "support/Serialize.h"

namespace tav {

MonitoredShowEvent::MonitoredShowEvent() : m_range(std::make_shared<TimeRange>()) {}

void MonitoredShowEvent::SetRange(std::shared_ptr<TimeRange> value) {
  m_range = value ? std::move(value) : std::make_shared<TimeRange>();
}

std::string MonitoredShowEvent::Serialize() const {
  return ListToText({EscapeText(m_filename), m_range->Serialize(), LongToText(m_scheduleType),
                     BoolToText(m_shuttingDown)});
}

void MonitoredShowEvent::Deserialize(std::string_view szSerialized) {
  TextArray fields = ListFromText(szSerialized, 0);
  int32_t count = ArrayCount(fields);
  if (count != 4) {
    throw Error(
        37, "MonitoredShowEvent.Deserialize",
        "Unexpected number of fields in serialized monitored show event: " + std::to_string(count));
  }
  std::string filename = UnescapeText(fields[0]);
  auto range = std::make_shared<TimeRange>();
  range->Deserialize(fields[1]);
  int32_t scheduleType = LongFromText(fields[2]);
  bool shuttingDown = BoolFromText(fields[3]);

  m_filename = std::move(filename);
  m_range = std::move(range);
  m_scheduleType = scheduleType;
  m_shuttingDown = shuttingDown;
}

void MonitoredShowEvent::CopyFrom(const std::shared_ptr<MonitoredShowEvent>& Other) {
  Deserialize(Other ? Other->Serialize() : MonitoredShowEvent().Serialize());
}

bool MonitoredShowEvent::MemberwiseEquals(const std::shared_ptr<MonitoredShowEvent>& Other) const {
  return Serialize() == (Other ? Other->Serialize() : MonitoredShowEvent().Serialize());
}

}  // namespace tav
