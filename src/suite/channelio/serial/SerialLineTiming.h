#pragma once
// How long bytes take on a serial line, and what a dimmer network can carry
// at a given speed. Every line here is 8 data bits, no parity, 1 or 2 stop
// bits: a byte is 9 + stopBits bits long.
//
// LinePacer keeps track of when the line will have sent everything handed to
// it, so a transmitter can hold its next frame until the line is nearly idle
// instead of piling frames up in the device's buffer (where they would only
// add delay). It runs on the Clock port's millisecond tick, which wraps; the
// pacer unwraps it itself.

#include <cstddef>
#include <cstdint>

namespace tav {

constexpr int32_t SerialBitsPerByte(int32_t stopBits) {
  return 9 + (stopBits >= 2 ? 2 : 1);
}

// Microseconds the line needs for `bytes` at `baud` (rounded up).
int64_t SerialLineMicros(size_t bytes, int32_t baud, int32_t stopBits);

// The frame rate below which a dimmer network's fades look stepped.
inline constexpr int32_t kDimmerTargetFrameRate = 20;

// The most channels a one-header dimmer frame can hold and still leave
// kDimmerTargetFrameRate times a second: 94 at 19200, 286 at 57600, 574 at
// 115200 (one stop bit).
int32_t DimmerChannelsForSpeed(int32_t baud, int32_t stopBits);

// Frames per second the line carries when every frame is `frameBytes` long.
double SerialFrameRateLimit(size_t frameBytes, int32_t baud, int32_t stopBits);

class LinePacer {
 public:
  LinePacer(int32_t baud, int32_t stopBits) : m_baud(baud), m_stopBits(stopBits) {}

  // Records `bytes` handed to the device at `tick`.
  void Wrote(size_t bytes, uint32_t tick);
  // Adds time the line is held without bytes (a break) to what was written.
  void Occupy(int64_t micros) { m_freeAtMicros += micros; }
  // Microseconds from `tick` until the line has sent everything recorded
  // (0 when it is idle).
  int64_t BusyMicros(uint32_t tick);
  // Forgets what was written (the device went away).
  void Reset() { m_freeAtMicros = 0; }

 private:
  int64_t NowMicros(uint32_t tick);

  int32_t m_baud;
  int32_t m_stopBits;
  bool m_started = false;
  uint32_t m_lastTick = 0;
  int64_t m_nowMs = 0;  // unwrapped
  int64_t m_freeAtMicros = 0;
};

}  // namespace tav
