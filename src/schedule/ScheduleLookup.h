#pragma once
// What should run at a time t, and what comes after it, as data: the host
// applies the answer (loads the show, sets the engine's next show, reports
// status) and showctl prints it. Nothing here changes the schedules.
//
// Precedence: the show on demand when its range holds t (start included, end
// excluded, as for every schedule span), then a dated show
// of the year schedule, then the week schedule. While the player runs on
// demand only, the two schedules are ignored. Each answer says which source
// won and why, in words a person can read.
//
// Schedule type codes on the MonitoredShowEvents built here (the tray program
// and the engine compare them; a show on demand keeps the code its requester
// gave it, and showctl asks with kScheduleTypeOnDemand):
//   0  none: an empty event (no schedule applies)
//   1  week schedule
//   2  year schedule (a dated show)
//   3  show on demand

#include <cstdint>
#include <memory>
#include <string>

#include "schedule/MonitoredShowEvent.h"
#include "schedule/Schedule.h"
#include "schedule/YearSchedule.h"
#include "support/DateTime.h"

namespace tav {

constexpr int32_t kScheduleTypeNone = 0;
constexpr int32_t kScheduleTypeWeek = 1;
constexpr int32_t kScheduleTypeYear = 2;
constexpr int32_t kScheduleTypeOnDemand = 3;

enum class ShowSource { kNothing, kOnDemand, kYear, kWeek };

// The host's scheduling state at one moment. Any pointer may be null: no
// week schedule counts as an empty week, no year schedule as none loaded.
struct ScheduleState {
  std::shared_ptr<const Schedule> Week;
  std::shared_ptr<const YearSchedule> Year;
  std::shared_ptr<const MonitoredShowEvent> OnDemand;
  bool OnDemandOnly = false;
};

struct ShowDecision {
  // A new object the caller may keep. For the current event never null (its
  // Filename is empty while nothing should run); for the next event null
  // when no scheduled show follows.
  std::shared_ptr<MonitoredShowEvent> Event;
  ShowSource Source = ShowSource::kNothing;
  std::string Reason;
};

// The show event current at t. A week wait comes back as an event of the week
// schedule with an empty file name and the span of the whole wait, also when
// the list splits it at Sunday 00:00:00.
ShowDecision CurrentShowEvent(const ScheduleState& state, DateTime t);

// The next scheduled show after `current` (null: after t): the dated or weekly
// show that runs first once the current show has ended, or from t when the
// current event is no show. A dated show wins a tie, and may also cut into a
// weekly show, so for a current weekly show dated shows are sought from t.
// Nothing under on-demand-only mode or after a show that never ends.
ShowDecision NextShowEvent(const ScheduleState& state,
                           const std::shared_ptr<const MonitoredShowEvent>& current, DateTime t);

// "week schedule", "year schedule", "show on demand" or "nothing".
std::string ShowSourceName(ShowSource source);

}  // namespace tav
