#pragma once

// The hardware-I/O control on this machine: the control itself with the
// adapters it sends and listens through (UDP sockets for E1.31 and Art-Net,
// one timerfd for the frame deadlines, the lock file that keeps a second
// program off the outputs, the serial ports of the suite's controllers, DMX
// widgets, X10 and Fennick interfaces). The programs that drive lights build
// one of these; everything else sees only the ChannelIO port.
//
// An input that a serial controller reports joins the inputs of the DMX
// listener (the control's InjectInput). Everything runs on `loop`'s thread.

#include <memory>

#include "platform/EventLoop.h"
#include "platform/LockFileOutputClaim.h"
#include "platform/PosixSerialPort.h"
#include "platform/TimerfdDeadlineTimer.h"
#include "platform/UdpDatagramNetwork.h"
#include "suite/channelio/ChannelIOControl.h"
#include "suite/channelio/serial/SerialOutputs.h"

namespace tav {

class LocalChannelIO {
 public:
  // `settings` keeps the E1.31 source identity; the serial outputs time
  // their pacing with `timers`. Each reference must outlive this object.
  LocalChannelIO(EventLoop& loop, const Clock& clock, TimerService& timers, MessageLog& log,
                 RegistryStore& settings);
  LocalChannelIO(const LocalChannelIO&) = delete;
  LocalChannelIO& operator=(const LocalChannelIO&) = delete;

  const std::shared_ptr<ChannelIOControl>& Control() const { return m_control; }

 private:
  UdpDatagramNetwork m_network;
  TimerfdDeadlineTimer m_frameTimer;
  LockFileOutputClaim m_claim;
  PosixSerialPorts m_serialPorts;
  SerialOutputs m_serial;
  std::shared_ptr<ChannelIOControl> m_control;
};

}  // namespace tav
