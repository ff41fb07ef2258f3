#pragma once
// Port: a serial device as the serial lighting networks use it. The control
// opens one link per network through a SerialPortOpener; the adapter
// (platform/PosixSerialPort) puts it on the program's event loop, and tests
// stand in a fake link or a pseudo-terminal.
//
// Writes never block: bytes the device cannot take at once wait in a queue
// of bounded size, and a write that would overflow it is refused whole, so a
// caller never sends half a frame. Received bytes and connection changes
// arrive on the loop, never from inside a call to the link.
//
// Destroying a link first hands the device what is still queued, waiting a
// moment at most, so that a network's last frame (its lights-off) is not
// lost because the line was busy when the network closed.
//
// A link outlives the device behind it: when a USB adapter is unplugged the
// link reports the loss once, keeps trying to reopen the same path with a
// growing pause, and reports once more when the device is back. Writes while
// the device is away are refused.

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>

#include "suite/channelio/ChannelIO.h"

namespace tav {

// Errors of opening a port, in the numbering of the platform's serial
// control: 8002 the port does not exist or is no serial device, 8005 another
// program holds it (kErrorPortAlreadyOpen, ChannelIO.h), 8015 the device
// refused the settings.
inline constexpr int32_t kErrorPortInvalid = 8002;
inline constexpr int32_t kErrorPortSettings = 8015;

// The host's own words for a port that another program holds.
inline constexpr const char* kPortAlreadyOpenText =
    "Shows can not be enabled because the comm port is already open.  If the Tessavar Hardware "
    "Utility is running, shut it down and then enable shows.";

struct SerialSettings {
  std::string path;  // "/dev/ttyUSB0", "/dev/serial/by-id/...", "COM3" on Windows
  int32_t baud = 57600;
  int32_t stopBits = 1;  // 8 data bits, no parity, 1 or 2 stop bits, no flow control
};

class SerialLink {
 public:
  virtual ~SerialLink() = default;

  // Queues `bytes` behind what is already queued. False, and nothing queued,
  // when the device is away or the queue would grow past its bound.
  virtual bool Write(std::span<const uint8_t> bytes) = 0;
  // Once everything queued before has left the line, holds the line in break
  // for `breakMicros`, then at mark for `markMicros`, then writes `bytes`
  // (the host-timed DMX frame of a bare FTDI dongle). Longer waits than asked
  // are allowed; shorter never. Refused like Write.
  virtual bool WriteAfterBreak(std::span<const uint8_t> bytes, uint32_t breakMicros,
                               uint32_t markMicros) = 0;
  // Bytes accepted but not yet handed to the device.
  virtual size_t QueuedBytes() const = 0;
  // Whether the device is there.
  virtual bool Connected() const = 0;

  // Bytes from the device, as they arrive.
  virtual void SetOnReceive(std::function<void(std::span<const uint8_t>)> handler) = 0;
  // Called with false and the reason when the device goes away, with true
  // when it has been reopened.
  virtual void SetOnConnectionChange(
      std::function<void(bool connected, const std::string& reason)> handler) = 0;
};

class SerialPortOpener {
 public:
  virtual ~SerialPortOpener() = default;
  // Opens the device for this program alone with the given settings. Throws
  // tav::Error: kErrorPortInvalid when it does not exist or is no serial
  // device, kErrorPortAlreadyOpen when another program holds it (with
  // kPortAlreadyOpenText), kErrorPortSettings when it refuses the speed or
  // framing.
  virtual std::unique_ptr<SerialLink> Open(const SerialSettings& settings) = 0;
};

}  // namespace tav
