#include "suite/channelio/serial/SerialLineTiming.h"

#include <algorithm>

namespace tav {

int64_t SerialLineMicros(size_t bytes, int32_t baud, int32_t stopBits) {
  if (baud <= 0) return 0;
  int64_t bits = static_cast<int64_t>(bytes) * SerialBitsPerByte(stopBits);
  return (bits * 1000000 + baud - 1) / baud;
}

int32_t DimmerChannelsForSpeed(int32_t baud, int32_t stopBits) {
  // Two bytes of every frame are its header.
  int32_t bytesPerFrame = baud / (SerialBitsPerByte(stopBits) * kDimmerTargetFrameRate);
  return std::max(0, bytesPerFrame - 2);
}

double SerialFrameRateLimit(size_t frameBytes, int32_t baud, int32_t stopBits) {
  if (frameBytes == 0) return 0.0;
  return static_cast<double>(baud) /
         (static_cast<double>(frameBytes) * SerialBitsPerByte(stopBits));
}

int64_t LinePacer::NowMicros(uint32_t tick) {
  if (!m_started) {
    m_started = true;
    m_lastTick = tick;
  }
  m_nowMs += static_cast<int32_t>(tick - m_lastTick);
  m_lastTick = tick;
  return m_nowMs * 1000;
}

void LinePacer::Wrote(size_t bytes, uint32_t tick) {
  int64_t now = NowMicros(tick);
  m_freeAtMicros = std::max(now, m_freeAtMicros) + SerialLineMicros(bytes, m_baud, m_stopBits);
}

int64_t LinePacer::BusyMicros(uint32_t tick) {
  return std::max<int64_t>(0, m_freeAtMicros - NowMicros(tick));
}

}  // namespace tav
