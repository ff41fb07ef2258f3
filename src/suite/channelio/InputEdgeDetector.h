#pragma once
// Turns the levels of a range of DMX slots into presses: a slot whose level
// rises from below the threshold to at least the threshold is pressed once;
// it must fall below the threshold again before it can press again.
//
// A slot's first known level sets its baseline without pressing, so a slot
// already held high when its source appears (at start-up, or after the
// source came back from a loss of data) does not fire; Forget returns every
// slot to that unknown state. Pure; owned by the DMX listener.

#include <cstdint>
#include <vector>

namespace tav {

class InputEdgeDetector {
 public:
  // Slots firstSlot .. firstSlot + slotCount - 1 (1-based, within 1-512).
  InputEdgeDetector(int32_t firstSlot, int32_t slotCount, uint8_t threshold);

  // `levels` holds 512 slots. Appends each pressed slot number to `pressed`.
  void Update(const uint8_t* levels, std::vector<int32_t>& pressed);
  void Forget();

 private:
  enum class State : uint8_t { kUnknown, kLow, kHigh };
  int32_t m_first;
  uint8_t m_threshold;
  std::vector<State> m_state;
};

}  // namespace tav
