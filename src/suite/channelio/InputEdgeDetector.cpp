#include "suite/channelio/InputEdgeDetector.h"

#include <algorithm>

namespace tav {

InputEdgeDetector::InputEdgeDetector(int32_t firstSlot, int32_t slotCount, uint8_t threshold)
    : m_first(std::clamp(firstSlot, 1, 512)),
      m_threshold(threshold),
      m_state(static_cast<size_t>(std::clamp(slotCount, 0, 513 - m_first)), State::kUnknown) {}

void InputEdgeDetector::Update(const uint8_t* levels, std::vector<int32_t>& pressed) {
  for (size_t i = 0; i < m_state.size(); ++i) {
    bool high = levels[static_cast<size_t>(m_first - 1) + i] >= m_threshold;
    if (high && m_state[i] == State::kLow) pressed.push_back(m_first + static_cast<int32_t>(i));
    m_state[i] = high ? State::kHigh : State::kLow;
  }
}

void InputEdgeDetector::Forget() {
  std::fill(m_state.begin(), m_state.end(), State::kUnknown);
}

}  // namespace tav
