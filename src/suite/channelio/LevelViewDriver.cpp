#include "suite/channelio/LevelViewDriver.h"

#include <charconv>

#include "suite/channelio/Ticks.h"

namespace tav {

namespace {

bool Number(std::string_view text, int32_t& value) {
  if (text.empty()) return false;
  auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
  return error == std::errc() && end == text.data() + text.size();
}

}  // namespace

bool ParseLevelViewSelection(std::string_view text, LevelViewSelection& selection,
                             std::string& error) {
  LevelViewSelection parsed;
  while (!text.empty()) {
    size_t comma = text.find(',');
    std::string_view item = text.substr(0, comma);
    text = comma == std::string_view::npos ? std::string_view() : text.substr(comma + 1);
    if (item.empty()) continue;
    if (item[0] == 't' || item[0] == 'T') {
      size_t dot = item.find('.');
      int32_t network = 0;
      int32_t unit = 0;
      if (dot == std::string_view::npos || !Number(item.substr(1, dot - 1), network) ||
          !Number(item.substr(dot + 1), unit) || network < 1 || unit < 0 || unit > kMaxTAVUnit) {
        error = "\"" + std::string(item) + "\" is not a TAV unit (t<network>.<unit>, as t1.3)";
        return false;
      }
      parsed.tavUnits.push_back({network, unit});
      continue;
    }
    size_t dash = item.find('-');
    int32_t first = 0;
    int32_t last = 0;
    bool ok = dash == std::string_view::npos
                  ? Number(item, first) && (last = first, true)
                  : Number(item.substr(0, dash), first) && Number(item.substr(dash + 1), last);
    if (!ok || first < 0 || last < first || last > kMaxDMXUniverse || last - first >= 1000) {
      error = "\"" + std::string(item) + "\" is not a universe or a range of universes (as 5-8)";
      return false;
    }
    for (int32_t u = first; u <= last; ++u) parsed.universes.push_back(u);
  }
  selection = std::move(parsed);
  return true;
}

LevelViewDriver::LevelViewDriver(const LevelBuffers& levels, LevelViewSelection selection,
                                 LevelViewOptions options, uint32_t intervalMs, Draw draw)
    : m_levels(levels),
      m_selection(std::move(selection)),
      m_options(options),
      m_intervalMs(intervalMs),
      m_draw(std::move(draw)) {}

void LevelViewDriver::OnFrame(uint32_t tick, const std::string& status) {
  if (m_lastDrawn && TickDistance(*m_lastDrawn, tick) < static_cast<int32_t>(m_intervalMs)) return;
  m_lastDrawn = tick;
  DrawNow(status);
}

void LevelViewDriver::DrawNow(const std::string& status) {
  std::vector<LevelViewRow> rows;
  for (int32_t u : m_selection.universes) {
    const DMXLevels* buffer = m_levels.FindUniverse(u);
    rows.push_back({"U" + std::to_string(u), buffer ? std::span<const uint8_t>(buffer->slots)
                                                    : std::span<const uint8_t>(m_zeros)});
  }
  const auto& units = m_levels.TAVUnits();
  for (auto [network, unit] : m_selection.tavUnits) {
    auto it = units.find({network, unit});
    std::string label = "T" + std::to_string(network) + "." + std::to_string(unit);
    rows.push_back({label, it == units.end() ? std::span<const uint8_t>()
                                             : std::span<const uint8_t>(it->second.levels)});
  }
  std::vector<std::string> lines = {status};
  std::vector<std::string> body = RenderLevelView(rows, m_options);
  lines.insert(lines.end(), body.begin(), body.end());
  m_draw(lines);
}

}  // namespace tav
