#pragma once
// What the tray's requests and the status report ask of the host. The host
// form implements it; the tray messaging holds a reference and never owns
// the host. Tests stand in a recorder.

#include <cstdint>
#include <memory>
#include <string>

#include "schedule/MonitoredShowEvent.h"
#include "support/DateTime.h"

namespace tav {

class TrayHost {
 public:
  virtual ~TrayHost() = default;

  // Ends the program at once, logging `szReason`.
  virtual void ImmediateShutdown(const std::string& szReason) = 0;
  // Lets the current show play its shutdown section, then ends the program.
  virtual void GracefulShutdown() = 0;
  // Reads the week and year schedules from their files again.
  virtual void LoadSchedules() = 0;
  // A serialised MonitoredShowEvent; an empty file name clears the show on
  // demand. Handles and logs its own failures.
  virtual void ShowOnDemand(const std::string& szSerialized) = 0;
  virtual void SetOnDemandOnly(bool value) = 0;
  // Fires input `inputNumber` of unit `unitId` on `network` as if the
  // hardware had raised it, for trying a show without the hardware. An input
  // no show listens to is ignored, as a real one would be.
  virtual void SimulateInput(int32_t network, int32_t unitId, int32_t inputNumber) = 0;
  // Set once the start-up delay is over.
  virtual bool Initialized() const = 0;

  // The current show event at `t` by the schedules (on demand, year, week).
  virtual std::shared_ptr<MonitoredShowEvent> CurrentShowEvent(DateTime t) = 0;
  // The event of the show the engine is running, or null when none runs.
  virtual std::shared_ptr<MonitoredShowEvent> RunningShowEvent() = 0;
  // The next scheduled show after `current`, or null.
  virtual std::shared_ptr<MonitoredShowEvent> NextShowEvent(
      const std::shared_ptr<MonitoredShowEvent>& current, DateTime t) = 0;
};

}  // namespace tav
