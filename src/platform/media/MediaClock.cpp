#include "platform/media/MediaClock.h"

#include <algorithm>

namespace tav {

void MediaClock::Reset() {
  *this = MediaClock();
}

void MediaClock::Report(double seconds, TimePoint at) {
  m_base = seconds;
  m_baseTime = at;
}

void MediaClock::Run(TimePoint at) {
  m_baseTime = std::max(m_baseTime, at);
  m_running = true;
}

void MediaClock::SetEnd(double seconds) {
  m_end = seconds;
}

void MediaClock::Follow(const Snapshot& other) {
  m_base = other.position;
  m_baseTime = other.at;
  m_end = other.end;
  m_running = other.running;
}

double MediaClock::Position(TimePoint now) const {
  if (!m_running) return m_base;
  auto runOn = std::clamp(now - m_baseTime, TimePoint::duration::zero(),
                          std::chrono::duration_cast<TimePoint::duration>(kMaxRunOn));
  double position = m_base + std::chrono::duration<double>(runOn).count();
  if (m_end > 0) position = std::min(position, m_end);
  m_lastGiven = std::max(m_lastGiven, position);
  return m_lastGiven;
}

double MediaClock::Remaining(TimePoint now) const {
  if (m_end <= 0) return 0;
  return std::max(0.0, m_end - Position(now));
}

}  // namespace tav
