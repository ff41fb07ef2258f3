#pragma once
// Arithmetic on the Clock port's millisecond tick, which wraps at 2^32.
// Deadlines are compared by their signed distance, so a comparison stays
// right across the wrap as long as the two ticks lie within 24 days of each
// other.

#include <cstdint>

namespace tav {

// b - a in milliseconds, negative when b comes before a.
inline int32_t TickDistance(uint32_t a, uint32_t b) {
  return static_cast<int32_t>(b - a);
}
// Whether tick a comes strictly before tick b.
inline bool TickBefore(uint32_t a, uint32_t b) {
  return TickDistance(a, b) > 0;
}
// The earlier of two ticks.
inline uint32_t TickMin(uint32_t a, uint32_t b) {
  return TickBefore(b, a) ? b : a;
}

}  // namespace tav
