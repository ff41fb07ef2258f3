#include "SyncProbe.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <sstream>

namespace tav::player {

std::optional<SyncProbe::Where> SyncProbe::Parse(const std::string& text) {
  Where where;
  char colon1 = 0, colon2 = 0;
  std::istringstream in(text);
  if (!(in >> where.universe >> colon1 >> where.slot >> colon2 >> where.periodMs) ||
      colon1 != ':' || colon2 != ':' || !in.eof()) {
    return std::nullopt;
  }
  if (where.universe < 0 || where.universe > kMaxDMXUniverse || where.slot < 1 ||
      where.slot > kDMXSlots - 1 || where.periodMs < 1) {
    return std::nullopt;
  }
  return where;
}

SyncProbe::SyncProbe(const LevelBuffers& levels, const MediaPlayer& media, Where where)
    : m_levels(levels), m_media(media), m_where(where) {}

void SyncProbe::OnFrame() {
  int32_t frame = m_levels.DMXLevel(m_where.universe, m_where.slot) * 256 +
                  m_levels.DMXLevel(m_where.universe, m_where.slot + 1);
  if (m_lastFrame == frame) return;
  m_lastFrame = frame;
  if (m_media.PlayState() != kMediaPlaying || frame == 0) return;
  m_offsets.push_back(m_media.CurrentPosition() * 1000.0 -
                      static_cast<double>(frame) * m_where.periodMs);
}

std::string SyncProbe::Report() const {
  if (m_offsets.empty()) return "sync probe: no time-coded frame went out while music played";
  std::vector<double> sorted;
  for (double offset : m_offsets) sorted.push_back(std::fabs(offset));
  std::sort(sorted.begin(), sorted.end());
  auto at = [&](double q) {
    return sorted[std::min(sorted.size() - 1, static_cast<size_t>(q * (sorted.size() - 1) + 0.5))];
  };
  double mean = 0;
  for (double offset : m_offsets) mean += offset;
  mean /= static_cast<double>(m_offsets.size());
  char line[200];
  std::snprintf(line, sizeof line,
                "sync probe: %zu frames; |offset| p50 %.2f ms, p99 %.2f ms, max %.2f ms; "
                "mean offset %+.2f ms (music ahead of the lights when positive)",
                m_offsets.size(), at(0.5), at(0.99), sorted.back(), mean);
  return line;
}

}  // namespace tav::player
