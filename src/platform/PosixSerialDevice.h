#pragma once
// Opens and configures a tty for a serial network: exclusive (TIOCEXCL and
// an exclusive flock), non-blocking, raw 8 data bits, no parity, 1 or 2 stop
// bits, no flow control, reads that wait for one byte. Used by
// PosixSerialPorts for the first open and for every reopen.

#include "suite/channelio/serial/SerialLink.h"

namespace tav {

// Returns the open descriptor. Throws tav::Error: kErrorPortInvalid (8002)
// when the path does not exist, cannot be opened or is no tty,
// kErrorPortAlreadyOpen (8005) when another program holds it,
// kErrorPortSettings (8015) when the device refuses the speed or framing.
int OpenSerialDevice(const SerialSettings& settings);

// The classic termios speed constant for `baud`, or 0 when it has none.
unsigned StandardSerialSpeed(int32_t baud);

}  // namespace tav
