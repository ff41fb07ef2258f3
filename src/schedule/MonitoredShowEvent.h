#pragma once
// The flat description of one show occurrence that the host, the engine and
// the tray pass around: which show file, over which calendar span, from which
// kind of schedule, and whether it is shutting down. Copy and equality go
// through the text form, so two events are equal when they would be written
// identically and a copy never shares its range.

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "schedule/TimeRange.h"

namespace tav {

class MonitoredShowEvent {
 public:
  MonitoredShowEvent();

  const std::string& Filename() const { return m_filename; }
  void SetFilename(std::string value) { m_filename = std::move(value); }
  // The stored range itself, never null.
  const std::shared_ptr<TimeRange>& Range() const { return m_range; }
  // Stores the object (shared, not copied); null stores a new empty range.
  void SetRange(std::shared_ptr<TimeRange> value);
  // Which schedule the show comes from; the codes belong to the host.
  int32_t ScheduleType() const { return m_scheduleType; }
  void SetScheduleType(int32_t value) { m_scheduleType = value; }
  bool ShuttingDown() const { return m_shuttingDown; }
  void SetShuttingDown(bool value) { m_shuttingDown = value; }

  // "(Xmas,(T,2024-12-24 18:00:00,T,2024-12-24 22:00:00), 1,F)".
  std::string Serialize() const;
  // Replaces all four fields, or none when the record fails to read.
  void Deserialize(std::string_view szSerialized);
  // Null copies from a new object, resetting this one.
  void CopyFrom(const std::shared_ptr<MonitoredShowEvent>& Other);
  // Null compares as a new object.
  bool MemberwiseEquals(const std::shared_ptr<MonitoredShowEvent>& Other) const;

 private:
  std::string m_filename;
  std::shared_ptr<TimeRange> m_range;
  int32_t m_scheduleType = 0;
  bool m_shuttingDown = false;
};

}  // namespace tav
