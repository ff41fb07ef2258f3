#include "suite/channelio/serial/X10SendQueue.h"

#include <algorithm>

namespace tav {
namespace {

bool IsDimLevel(int32_t steps) {
  return steps > 0 && steps < kX10DimStepsFull;
}

}  // namespace

int32_t X10StepsForLevel(uint8_t level) {
  return (level * kX10DimStepsFull + 127) / 255;
}

int32_t X10SendQueue::ExpectedSteps(int32_t house, int32_t unit) const {
  for (auto it = m_entries.rbegin(); it != m_entries.rend(); ++it) {
    if (it->house == house && it->unit == unit) return it->steps;
  }
  return m_driven[Index(house, unit)];
}

void X10SendQueue::SetTarget(int32_t house, int32_t unit, int32_t steps) {
  if (house < 1 || house > 16 || unit < 1 || unit > 16) return;
  steps = std::clamp(steps, 0, kX10DimStepsFull);
  if (ExpectedSteps(house, unit) == steps) return;
  for (auto it = m_entries.rbegin(); it != m_entries.rend(); ++it) {
    if (it->house != house || it->unit != unit) continue;
    if (IsDimLevel(it->steps)) {
      it->steps = steps;
      return;
    }
    break;
  }
  m_entries.push_back({house, unit, steps});
}

std::vector<X10Transmission> X10SendQueue::TakeNext() {
  std::vector<X10Transmission> out;
  // A replaced dim level may have come back to where the unit already is.
  while (!m_entries.empty() && m_entries.front().steps ==
                                   m_driven[Index(m_entries.front().house, m_entries.front().unit)])
    m_entries.pop_front();
  if (m_entries.empty()) return out;
  const Entry entry = m_entries.front();
  m_entries.pop_front();
  int32_t& driven = m_driven[Index(entry.house, entry.unit)];
  out.push_back(X10Transmission::Address(entry.house, entry.unit));
  if (entry.steps == 0) {
    out.push_back(X10Transmission::Function(entry.house, X10Function::kOff));
  } else if (entry.steps == kX10DimStepsFull || driven == 0) {
    out.push_back(X10Transmission::Function(entry.house, X10Function::kOn));
    if (entry.steps < kX10DimStepsFull) {
      out.push_back(X10Transmission::Function(entry.house, X10Function::kDim,
                                              kX10DimStepsFull - entry.steps));
    }
  } else if (entry.steps < driven) {
    out.push_back(X10Transmission::Function(entry.house, X10Function::kDim, driven - entry.steps));
  } else {
    out.push_back(
        X10Transmission::Function(entry.house, X10Function::kBright, entry.steps - driven));
  }
  driven = entry.steps;
  return out;
}

int32_t X10SendQueue::DrivenSteps(int32_t house, int32_t unit) const {
  if (house < 1 || house > 16 || unit < 1 || unit > 16) return -1;
  return m_driven[Index(house, unit)];
}

}  // namespace tav
