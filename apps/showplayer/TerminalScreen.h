#pragma once
// The terminal view of `showplayer --view`: the levels of the chosen
// universes, drawn a few times a second right after a frame has gone out
// (OnFrame, never in the way of the next frame), with a status line on top
// and the latest log lines below. When no frame goes out (no show), the log part is
// still brought up to date once a second.
//
// Owned by the composition root, beside the control whose levels it reads;
// writes to standard output on the loop's thread.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "ConsoleLog.h"
#include "ports/Clock.h"
#include "ports/TimerService.h"
#include "suite/channelio/LevelBuffers.h"
#include "suite/channelio/LevelViewDriver.h"

namespace tav::player {

class TerminalScreen {
 public:
  // Lines of log kept below the levels.
  static constexpr size_t kLogLines = 8;

  TerminalScreen(const LevelBuffers& levels, LevelViewSelection selection, ConsoleLog& log,
                 const Clock& clock, TimerService& timers, std::function<std::string()> status);
  ~TerminalScreen();

  // After every frame the control has sent.
  void OnFrame(uint32_t tick);
  // Draws once more and leaves the cursor below the view.
  void Finish();

 private:
  void Draw(const std::vector<std::string>& levelLines);
  void Idle();

  ConsoleLog& m_log;
  const Clock& m_clock;
  std::function<std::string()> m_status;
  std::unique_ptr<LevelViewDriver> m_driver;
  std::unique_ptr<Timer> m_idle;
  uint32_t m_lastDrawn = 0;
};

}  // namespace tav::player
