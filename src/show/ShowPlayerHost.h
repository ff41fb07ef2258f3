#pragma once
// What the show engine asks of the program that hosts it, beyond what every
// playing sequence asks (the log, the tray's start and stop notices, a
// playable file for a missing name): the show status for the tray, and the
// memory watchdog's restart check when there is no show to start. The host
// form implements it; tests stand in a recorder. The engine never owns it.

#include "sequence/SequenceHost.h"

namespace tav {

class ShowPlayerHost : public SequenceHost {
 public:
  // The current and next show event, to the tray; sent only when they
  // changed since the last report unless forced. Never fails.
  virtual void SendStatusToTAVTray(bool boolForce) = 0;
  // Ends the program for a fresh start when memory is high and no show is
  // due soon; otherwise does nothing. Called whenever the engine finds no
  // show to start.
  virtual void ShutdownForRestartIfNecessary() = 0;
};

}  // namespace tav
