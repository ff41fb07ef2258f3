#pragma once
// Drives the terminal view: samples the chosen DMX universes and TAV units
// from the level buffers and hands the rendered lines to whoever puts them
// on the screen (the app), a few times a second.
//
// It is called right after the control has handed a frame to the outputs
// (ChannelIOControl::SetOnFrameSent), so the sampling and rendering happen
// in the quiet time after a deadline, never in the way of the next one,
// and the buffers are read on the loop thread with no copy and no lock.
// Levels only change at frames, so no frame means nothing new to draw.

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "suite/channelio/LevelBuffers.h"
#include "suite/channelio/LevelView.h"

namespace tav {

struct LevelViewSelection {
  std::vector<int32_t> universes;
  std::vector<std::pair<int32_t, int32_t>> tavUnits;  // (network, unit)
};

// Reads a selection such as "1,2,5-8,t1.3": DMX universes and ranges of
// them, and TAV units as t<network>.<unit>. False with a reason otherwise.
bool ParseLevelViewSelection(std::string_view text, LevelViewSelection& selection,
                             std::string& error);

class LevelViewDriver {
 public:
  using Draw = std::function<void(const std::vector<std::string>& lines)>;

  LevelViewDriver(const LevelBuffers& levels, LevelViewSelection selection,
                  LevelViewOptions options, uint32_t intervalMs, Draw draw);

  // After a frame at `tick`: draws when `intervalMs` have passed since the
  // last drawing. `status` becomes the first line.
  void OnFrame(uint32_t tick, const std::string& status);
  // Draws now (the final state).
  void DrawNow(const std::string& status);

 private:
  const LevelBuffers& m_levels;
  LevelViewSelection m_selection;
  LevelViewOptions m_options;
  uint32_t m_intervalMs;
  Draw m_draw;
  std::optional<uint32_t> m_lastDrawn;
  std::vector<uint8_t> m_zeros = std::vector<uint8_t>(kDMXSlots, 0);
};

}  // namespace tav
