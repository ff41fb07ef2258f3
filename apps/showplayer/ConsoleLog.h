#pragma once
// The player's log as a person at a terminal (or journalctl) reads it: one
// line per log line, "2024-12-24 18:00:05 info    Starting show: demo.show".
// The host echoes its lines here while no tray is connected. With the
// terminal view on, the lines are kept for the view to draw below the levels
// instead of being written between its frames.
//
// Owned by the entry point; single-threaded.

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <deque>
#include <string>
#include <string_view>

#include "support/DateTime.h"

namespace tav::player {

// "info", "warning", "error"; "level n" for anything else.
std::string LevelName(int32_t level);
// The date and time, the level padded to seven characters, the text; a text
// of several lines gives several lines, each with the same prefix.
std::string FormatConsoleLine(int32_t level, DateTime now, std::string_view text);

class ConsoleLog {
 public:
  explicit ConsoleLog(std::FILE* stream) : m_stream(stream) {}

  void Write(int32_t level, DateTime now, std::string_view text);

  // From now on keep the last `lines` lines instead of writing them (0:
  // write them again).
  void KeepForView(size_t lines);
  const std::deque<std::string>& Recent() const { return m_recent; }

 private:
  std::FILE* m_stream;
  size_t m_keep = 0;
  std::deque<std::string> m_recent;
};

}  // namespace tav::player
