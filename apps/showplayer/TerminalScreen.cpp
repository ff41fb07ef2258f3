#include "TerminalScreen.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

namespace tav::player {
namespace {

constexpr uint32_t kDrawIntervalMs = 200;
constexpr uint32_t kIdleIntervalMs = 1000;

int TerminalWidth() {
  winsize size{};
  if (::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 20) return size.ws_col;
  return 80;
}

bool TerminalSpeaksUnicode() {
  for (const char* name : {"LC_ALL", "LC_CTYPE", "LANG"}) {
    const char* value = std::getenv(name);
    if (value && *value) {
      std::string text(value);
      return text.find("UTF-8") != std::string::npos || text.find("utf8") != std::string::npos;
    }
  }
  return false;
}

}  // namespace

TerminalScreen::TerminalScreen(const LevelBuffers& levels, LevelViewSelection selection,
                               ConsoleLog& log, const Clock& clock, TimerService& timers,
                               std::function<std::string()> status)
    : m_log(log), m_clock(clock), m_status(std::move(status)) {
  LevelViewOptions options;
  options.width = TerminalWidth();
  options.unicode = TerminalSpeaksUnicode();
  // One line per universe: 16 universes and the log fit on one screen.
  options.compact = true;
  m_log.KeepForView(kLogLines);
  m_driver = std::make_unique<LevelViewDriver>(
      levels, std::move(selection), options, kDrawIntervalMs,
      [this](const std::vector<std::string>& lines) { Draw(lines); });
  std::fputs("\x1b[2J", stdout);
  m_idle = timers.CreateTimer("terminalView", kIdleIntervalMs, true, [this] { Idle(); });
  m_driver->DrawNow(m_status());
}

TerminalScreen::~TerminalScreen() = default;

void TerminalScreen::OnFrame(uint32_t tick) {
  m_driver->OnFrame(tick, m_status());
}

void TerminalScreen::Idle() {
  if (m_clock.TickCount() - m_lastDrawn >= kIdleIntervalMs) m_driver->DrawNow(m_status());
}

void TerminalScreen::Draw(const std::vector<std::string>& levelLines) {
  m_lastDrawn = m_clock.TickCount();
  std::string screen = "\x1b[H";
  for (const std::string& line : levelLines) screen += line + "\x1b[K\n";
  screen += "\x1b[K\n";
  for (const std::string& line : m_log.Recent()) screen += line + "\x1b[K\n";
  screen += "\x1b[J";
  std::fwrite(screen.data(), 1, screen.size(), stdout);
  std::fflush(stdout);
}

void TerminalScreen::Finish() {
  m_idle->SetEnabled(false);
  m_driver->DrawNow(m_status());
  m_log.KeepForView(0);
}

}  // namespace tav::player
