#pragma once
// The internal output interface: every transmitter of the hardware-I/O
// control is a NetworkOutput and is handed the same frames. E1.31 and
// Art-Net universes (UdpDMXOutput) are outputs today; a serial transmitter
// (a DMX USB widget, a chain of TAV controllers, the Fennick boards, an X10
// interface) is one more output of the same kind:
//
//  - Send is called on the loop at every frame deadline (`newFrame` true),
//    right after the frame's level blocks and effects have been written to
//    the level buffers, and at the refresh ticks the output asked for
//    through NextRefresh (`newFrame` false). The output reads the buffers of
//    its own networks (LevelBuffers versions tell it what changed since it
//    last looked), builds its packets and hands them to its port without
//    blocking: a serial output writes what the port takes and keeps the
//    rest for its next call rather than wait.
//  - `dark` asks for all levels at zero (the host has switched the lights
//    off) without forgetting them; the levels return when it clears.
//  - NextRefresh is the tick by which the output needs a call even when no
//    frame comes (a keep-alive, a serial line that must be refreshed); the
//    control sets its one deadline timer to the earliest of these.
//  - Close ends the output cleanly (E1.31 sends its stream-terminated
//    packets); the control destroys it afterwards.
//
// Outputs live on the loop thread and never call back into the control.

#include <cstdint>
#include <optional>
#include <string>

#include "suite/channelio/LevelBuffers.h"

namespace tav {

struct OutputFrame {
  const LevelBuffers& levels;
  uint32_t now = 0;       // the tick of this call
  bool newFrame = false;  // a frame was due: levels may have changed
  bool dark = false;      // send zeros in place of the levels
};

struct OutputCounters {
  uint64_t packetsSent = 0;
  uint64_t packetsDropped = 0;
};

class NetworkOutput {
 public:
  virtual ~NetworkOutput() = default;
  // For log lines: "E1.31 on eth0", "USBPro on /dev/ttyUSB0".
  virtual std::string Name() const = 0;
  virtual void Send(const OutputFrame& frame) = 0;
  virtual std::optional<uint32_t> NextRefresh() const = 0;
  virtual void Close() = 0;
  virtual OutputCounters Counters() const = 0;
};

}  // namespace tav
