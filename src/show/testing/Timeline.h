#pragma once
// For whole-show tests: one record, in order, of everything a show did
// (log lines, tray notices, calls to the I/O control and the media player),
// each with the virtual millisecond it happened at. Two runs of the same
// show compare as two lists of lines. A path prefix (the test's own folder)
// is cut out of every text so expectations stay readable.

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace tav {

class Timeline {
 public:
  struct Entry {
    uint64_t atMs = 0;
    std::string text;
  };

  explicit Timeline(std::function<uint64_t()> nowMs = {}) : m_nowMs(std::move(nowMs)) {}

  void SetTimeSource(std::function<uint64_t()> nowMs) { m_nowMs = std::move(nowMs); }
  void SetPathPrefix(std::string prefix) { m_prefix = std::move(prefix); }

  void Add(std::string text) {
    if (!m_prefix.empty()) {
      for (size_t at; (at = text.find(m_prefix)) != std::string::npos;)
        text.erase(at, m_prefix.size());
    }
    m_entries.push_back({m_nowMs ? m_nowMs() : 0, std::move(text)});
  }

  const std::vector<Entry>& Entries() const { return m_entries; }
  // "<ms> <text>" for every entry.
  std::vector<std::string> Lines() const {
    std::vector<std::string> lines;
    for (const Entry& e : m_entries) lines.push_back(std::to_string(e.atMs) + " " + e.text);
    return lines;
  }
  // The texts (without times) of the entries that start with `prefix`.
  std::vector<std::string> Texts(const std::string& prefix = "") const {
    std::vector<std::string> texts;
    for (const Entry& e : m_entries) {
      if (e.text.compare(0, prefix.size(), prefix) == 0) texts.push_back(e.text);
    }
    return texts;
  }
  // Like Texts, with the time of each.
  std::vector<std::string> TimedTexts(const std::string& prefix) const {
    std::vector<std::string> texts;
    for (const Entry& e : m_entries) {
      if (e.text.compare(0, prefix.size(), prefix) == 0) {
        texts.push_back(std::to_string(e.atMs) + " " + e.text);
      }
    }
    return texts;
  }
  void Clear() { m_entries.clear(); }

 private:
  std::function<uint64_t()> m_nowMs;
  std::string m_prefix;
  std::vector<Entry> m_entries;
};

}  // namespace tav
