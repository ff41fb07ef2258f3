#include "suite/channelio/LevelView.h"

#include <algorithm>

namespace tav {

namespace {

constexpr const char* kBlocks[] = {" ",      "\u2581", "\u2582", "\u2583", "\u2584",
                                   "\u2585", "\u2586", "\u2587", "\u2588"};
constexpr const char kRamp[] = " .:-=+*#%@";

std::string Pad(std::string text, size_t width) {
  if (text.size() < width) text.append(width - text.size(), ' ');
  return text;
}

std::string Address(size_t address) {
  std::string text = std::to_string(address);
  return std::string(text.size() < 4 ? 4 - text.size() : 0, ' ') + text;
}

}  // namespace

std::string LevelGlyph(uint8_t level, bool unicode) {
  if (level == 0) return " ";
  if (unicode) return kBlocks[1 + (level - 1) * 8 / 255];
  return std::string(1, kRamp[1 + (level - 1) * 9 / 255]);
}

std::vector<std::string> RenderLevelView(std::span<const LevelViewRow> rows,
                                         const LevelViewOptions& options) {
  size_t labelWidth = 0;
  for (const auto& row : rows) labelWidth = std::max(labelWidth, row.label.size());
  labelWidth += 1;
  std::vector<std::string> lines;
  if (options.compact) {
    size_t cells = static_cast<size_t>(std::max<int32_t>(options.width, 16)) - labelWidth;
    cells = std::max<size_t>(cells, 8);
    for (const auto& row : rows) {
      std::string line = Pad(row.label, labelWidth);
      size_t per = std::max<size_t>(1, (row.levels.size() + cells - 1) / cells);
      for (size_t i = 0; i < row.levels.size(); i += per) {
        size_t end = std::min(row.levels.size(), i + per);
        line += LevelGlyph(*std::max_element(row.levels.begin() + i, row.levels.begin() + end),
                           options.unicode);
      }
      lines.push_back(std::move(line));
    }
    return lines;
  }
  // Address column, then cells in groups of 8 so lines line up.
  size_t cells = static_cast<size_t>(std::max<int32_t>(options.width, 24)) - labelWidth - 5;
  cells = std::max<size_t>(8, cells / 8 * 8);
  for (const auto& row : rows) {
    if (row.levels.empty()) {
      lines.push_back(row.label);
      continue;
    }
    for (size_t start = 0; start < row.levels.size(); start += cells) {
      std::string line = Pad(start == 0 ? row.label : std::string(), labelWidth);
      line += Address(start + 1) + " ";
      size_t end = std::min(row.levels.size(), start + cells);
      for (size_t i = start; i < end; ++i) line += LevelGlyph(row.levels[i], options.unicode);
      lines.push_back(std::move(line));
    }
  }
  return lines;
}

}  // namespace tav
