#pragma once
// Log lines held back while no tray program is known, oldest first, joined
// by carriage return plus line feed. The buffer is bounded: when it reaches
// kTrimAt bytes it keeps its last kKeepAfterTrim bytes, cut to start at a
// whole line, or, when one line is longer than that, at a whole UTF-8
// character (so up to three bytes fewer). Limits count bytes, which is what
// a tray message carries. Trimming to half the limit makes trimming rare
// while a player runs for days without a tray. Owned by the host's log.

#include <cstddef>
#include <string>
#include <string_view>

namespace tav {

class PendingLog {
 public:
  static constexpr size_t kTrimAt = 60000;
  static constexpr size_t kKeepAfterTrim = 30000;

  // Appends one line after a line break (none before the first line), then
  // trims.
  void Append(std::string_view line);

  bool IsEmpty() const { return m_text.empty(); }
  const std::string& Text() const { return m_text; }
  // The whole buffer; the buffer is empty afterwards.
  std::string Take();

 private:
  std::string m_text;
};

}  // namespace tav
