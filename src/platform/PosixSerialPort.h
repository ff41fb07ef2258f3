#pragma once
// The SerialLink port on a POSIX tty, on the program's event loop: serial
// USB adapters, on-board UARTs, and pseudo-terminals in tests.
//
// Opening takes the device for this program alone: TIOCEXCL (no later open
// succeeds, except for root) and an exclusive flock (which other serial
// programs honour, and which also holds against root). A device that another
// program holds is error 8005 with the host's words. The line is set raw, 8
// data bits, no parity, 1 or 2 stop bits, no flow control, at any standard
// speed (and any other the driver takes, through termios2 on Linux); a
// device that does not take the speed is error 8015.
//
// Writes are non-blocking: bytes the tty does not take at once wait in a
// queue of at most `maxQueuedBytes`, written as the tty drains. A break
// before a frame is timed on the loop with Asio timers (TIOCSBRK/TIOCCBRK),
// after the bytes before it have left the line by the speed's reckoning.
//
// A device that goes away (read end of file, EIO, ENXIO, ENODEV, hang-up) is
// closed, reported once, and reopened by path with a growing pause (0.25 s
// doubling to 5 s) until it is back, which is reported once too. Reports
// come from the loop, never from inside a call.
//
// Owned by the composition root; the EventLoop must outlive the opener and
// every link it made. Links may outlive the opener.

#include <cstddef>
#include <cstdint>
#include <memory>

#include "platform/EventLoop.h"
#include "suite/channelio/serial/SerialLink.h"

namespace tav {

struct PosixSerialOptions {
  size_t maxQueuedBytes = 64 * 1024;
  uint32_t firstReopenMs = 250;
  uint32_t longestReopenMs = 5000;
};

class PosixSerialPorts : public SerialPortOpener {
 public:
  explicit PosixSerialPorts(EventLoop& loop, PosixSerialOptions options = {});

  std::unique_ptr<SerialLink> Open(const SerialSettings& settings) override;

 private:
  EventLoop& m_loop;
  PosixSerialOptions m_options;
};

}  // namespace tav
