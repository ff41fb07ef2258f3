#pragma once
// The terminal view of the levels, for people without lights: each chosen
// DMX universe or TAV unit becomes its label followed by one character per
// level, from blank (0) through growing blocks to a full block (255), or
// an ASCII ramp " .:-=+*#%@" where the terminal has no Unicode. Long rows
// wrap at the width with the first address of each line in front; in
// compact form each row takes one line and each character shows the highest
// of the levels it stands for. Pure: lines of text in, lines of text out.

#include <cstdint>
#include <span>
#include <string>
#include <vector>

namespace tav {

struct LevelViewRow {
  std::string label;  // "U1", "TAV 1.3"
  std::span<const uint8_t> levels;
};

struct LevelViewOptions {
  int32_t width = 80;
  bool unicode = true;
  bool compact = false;
};

// One character for a level.
std::string LevelGlyph(uint8_t level, bool unicode);
std::vector<std::string> RenderLevelView(std::span<const LevelViewRow> rows,
                                         const LevelViewOptions& options);

}  // namespace tav
