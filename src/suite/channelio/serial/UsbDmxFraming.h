#pragma once
// The bytes two kinds of USB-serial DMX widgets take for one DMX frame.
//
// A DMX USB Pro has its own microcontroller: the host sends it a framed
// "output only send DMX" message (label 6: 0x7E, label, length LSB/MSB, the
// START code 0x00 and the slots, 0xE7) and the widget makes the break, the
// mark-after-break and the repeats itself. The widget takes 24 to 512 slots.
//
// A bare FTDI dongle ("Open DMX") is a UART wired to an RS-485 driver: the
// host holds the line in break, lets it rest at mark, then writes the START
// code and 512 slots at 250 000 baud with 2 stop bits, again and again. The
// break and mark are the serial link's (SerialLink::WriteAfterBreak); the
// frame here is only the bytes after them.
//
// Pure: no I/O.

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace tav {

inline constexpr uint8_t kUsbProStart = 0x7E;
inline constexpr uint8_t kUsbProEnd = 0xE7;
inline constexpr uint8_t kUsbProLabelSendDMX = 6;
inline constexpr size_t kUsbProMinSlots = 24;
inline constexpr size_t kDMXMaxSlots = 512;

// DMX512 line timing for host-timed dongles, with margin over the
// transmitter minimums (92 us break, 12 us mark-after-break).
inline constexpr int32_t kOpenDMXBaud = 250000;
inline constexpr int32_t kOpenDMXStopBits = 2;
inline constexpr uint32_t kOpenDMXBreakMicros = 110;
inline constexpr uint32_t kOpenDMXMarkMicros = 16;

// Replaces `out` with the send-DMX message for `slotCount` slots (clamped to
// 24-512) taken from `slots` (slot 1 first); slots not given are 0.
void EncodeUsbProSendDMX(std::span<const uint8_t> slots, size_t slotCount,
                         std::vector<uint8_t>& out);

// Replaces `out` with the START code and 512 slots; slots not given are 0.
void EncodeOpenDMXFrame(std::span<const uint8_t> slots, std::vector<uint8_t>& out);

}  // namespace tav
