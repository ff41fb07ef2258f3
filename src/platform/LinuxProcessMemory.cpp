#include "platform/LinuxProcessMemory.h"

#include <cerrno>
#include <charconv>
#include <cstdint>
#include <fstream>
#include <limits>
#include <optional>
#include <sstream>

namespace tav {

namespace {

// The value of a "Name:   1234 kB" line, in kibibytes.
std::optional<uint64_t> FieldKiB(std::string_view text, std::string_view name) {
  size_t pos = 0;
  while (pos < text.size()) {
    size_t end = text.find('\n', pos);
    if (end == std::string_view::npos) end = text.size();
    std::string_view line = text.substr(pos, end - pos);
    pos = end + 1;
    if (line.size() <= name.size() || line.substr(0, name.size()) != name ||
        line[name.size()] != ':') {
      continue;
    }
    line.remove_prefix(name.size() + 1);
    while (!line.empty() && (line.front() == ' ' || line.front() == '\t')) line.remove_prefix(1);
    uint64_t value = 0;
    auto [next, error] = std::from_chars(line.data(), line.data() + line.size(), value);
    if (error != std::errc() || next == line.data()) return std::nullopt;
    return value;
  }
  return std::nullopt;
}

}  // namespace

LinuxProcessMemory::LinuxProcessMemory(std::string statusPath)
    : m_statusPath(std::move(statusPath)) {}

int32_t LinuxProcessMemory::PrivateBytesFromStatus(std::string_view statusText) {
  std::optional<uint64_t> anon = FieldKiB(statusText, "RssAnon");
  if (!anon) throw ProcessMemoryError(ENODATA);
  // VmSwap is absent when the kernel has no swap support: nothing swapped.
  uint64_t kib = *anon + FieldKiB(statusText, "VmSwap").value_or(0);
  constexpr uint64_t kMax = std::numeric_limits<int32_t>::max();
  uint64_t bytes = kib > kMax / 1024 ? kMax : kib * 1024;
  return static_cast<int32_t>(bytes);
}

int32_t LinuxProcessMemory::PrivateBytes() const {
  std::ifstream file(m_statusPath);
  if (!file) throw ProcessMemoryError(errno != 0 ? errno : ENOENT);
  std::ostringstream text;
  text << file.rdbuf();
  return PrivateBytesFromStatus(text.str());
}

}  // namespace tav
