#include "MediaLength.h"

#include <fmt/format.h>

#include <algorithm>
#include <cctype>
#include <cmath>

#include "support/Error.h"

namespace tav::simulation {
namespace {

uint32_t Le16(std::string_view b, size_t at) {
  return static_cast<uint8_t>(b[at]) | static_cast<uint8_t>(b[at + 1]) << 8;
}

uint32_t Le32(std::string_view b, size_t at) {
  return Le16(b, at) | Le16(b, at + 2) << 16;
}

uint32_t Byte(std::string_view b, size_t at) {
  return static_cast<uint8_t>(b[at]);
}

// "MP3 file", "OGG file"; "file" when the name has no extension.
std::string KindOf(const std::string& path) {
  size_t slash = path.find_last_of("/\\");
  size_t dot = path.find_last_of('.');
  if (dot == std::string::npos || (slash != std::string::npos && dot < slash) ||
      dot + 1 == path.size()) {
    return "file of unknown type";
  }
  std::string ext = path.substr(dot + 1);
  for (char& c : ext) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  return ext + " file";
}

}  // namespace

std::optional<double> WavSeconds(std::string_view head, uint64_t fileSize) {
  if (head.size() < 12 || head.substr(0, 4) != "RIFF" || head.substr(8, 4) != "WAVE") {
    return std::nullopt;
  }
  uint32_t format = 0, sampleRate = 0, byteRate = 0, blockAlign = 0;
  bool haveFormat = false;
  for (size_t at = 12; at + 8 <= head.size();) {
    std::string_view id = head.substr(at, 4);
    uint64_t size = Le32(head, at + 4);
    size_t body = at + 8;
    if (id == "fmt ") {
      if (size < 16 || body + 16 > head.size()) return std::nullopt;
      format = Le16(head, body);
      sampleRate = Le32(head, body + 4);
      byteRate = Le32(head, body + 8);
      blockAlign = Le16(head, body + 12);
      haveFormat = true;
    } else if (id == "data") {
      if (!haveFormat) return std::nullopt;
      uint64_t rest = fileSize > body ? fileSize - body : 0;
      // A writer that streams leaves the size at 0 or at its largest value.
      uint64_t bytes = size == 0 || size == 0xFFFFFFFFu ? rest : std::min<uint64_t>(size, rest);
      // Plain samples (PCM, float, the extensible form of either) are counted
      // in frames; other codings by the byte rate their header states.
      const bool frames = format == 1 || format == 3 || format == 0xFFFE;
      if (frames && sampleRate > 0 && blockAlign > 0) {
        return static_cast<double>(bytes / blockAlign) / sampleRate;
      }
      if (byteRate > 0) return static_cast<double>(bytes) / byteRate;
      return std::nullopt;
    }
    at = body + size + (size & 1);  // chunks are padded to even sizes
  }
  return std::nullopt;
}

std::optional<double> FlacSeconds(std::string_view head) {
  size_t at = 0;
  // An ID3v2 tag some taggers put in front: 10 bytes and a synchsafe size.
  if (head.size() >= 10 && head.substr(0, 3) == "ID3") {
    uint32_t size = (Byte(head, 6) & 0x7F) << 21 | (Byte(head, 7) & 0x7F) << 14 |
                    (Byte(head, 8) & 0x7F) << 7 | (Byte(head, 9) & 0x7F);
    at = 10 + size + ((Byte(head, 5) & 0x10) ? 10 : 0);
  }
  // "fLaC", then the STREAMINFO block: its 4-byte header and 34 bytes.
  if (head.size() < at + 4 + 4 + 34 || head.substr(at, 4) != "fLaC") return std::nullopt;
  size_t block = at + 4;
  if ((Byte(head, block) & 0x7F) != 0) return std::nullopt;
  size_t info = block + 4;
  uint32_t sampleRate =
      Byte(head, info + 10) << 12 | Byte(head, info + 11) << 4 | Byte(head, info + 12) >> 4;
  uint64_t samples = static_cast<uint64_t>(Byte(head, info + 13) & 0x0F) << 32 |
                     static_cast<uint64_t>(Byte(head, info + 14)) << 24 |
                     Byte(head, info + 15) << 16 | Byte(head, info + 16) << 8 |
                     Byte(head, info + 17);
  if (sampleRate == 0 || samples == 0) return std::nullopt;
  return static_cast<double>(samples) / sampleRate;
}

MediaLength ProbeMediaLength(const FileSystem& files, const std::string& path) {
  FileStatus status = files.Stat(path);
  if (!status.exists) return {MediaLength::Found::kMissing, 0, "file not found"};
  if (!status.IsFile()) return {MediaLength::Found::kUnreadable, 0, "it is a folder"};
  if (status.size == 0) return {MediaLength::Found::kUnreadable, 0, "the file is empty"};
  std::string head;
  std::string tail;
  try {
    auto file = files.OpenForRead(path);
    const uint64_t size = file->Size();
    head.resize(static_cast<size_t>(std::min<uint64_t>(size, kHeadBytes)));
    head.resize(file->ReadAt(0, head.data(), head.size()));
    // Ogg states its length on its last page only.
    if (head.compare(0, 4, "OggS") == 0) {
      tail.resize(static_cast<size_t>(std::min<uint64_t>(size, kHeadBytes)));
      tail.resize(file->ReadAt(size - tail.size(), tail.data(), tail.size()));
    }
  } catch (const Error& e) {
    return {MediaLength::Found::kUnreadable, 0, e.Description()};
  }
  if (auto seconds = WavSeconds(head, status.size)) {
    return {MediaLength::Found::kSeconds, *seconds, "WAV header"};
  }
  if (auto seconds = FlacSeconds(head)) {
    return {MediaLength::Found::kSeconds, *seconds, "FLAC header"};
  }
  if (auto seconds = OggSeconds(head, tail)) {
    return {MediaLength::Found::kSeconds, *seconds, "Ogg pages"};
  }
  // Frame sync patterns turn up inside other formats too: MPEG audio is
  // looked for only in files that say they are MP3 by name or by their start.
  const std::string kind = KindOf(path);
  const bool mpegByStart = head.compare(0, 3, "ID3") == 0 ||
                           (head.size() >= 2 && static_cast<uint8_t>(head[0]) == 0xFF &&
                            (static_cast<uint8_t>(head[1]) & 0xE0) == 0xE0);
  if (kind == "MP3 file" || kind == "MP2 file" || mpegByStart) {
    if (auto seconds = Mp3Seconds(head, status.size)) {
      return {MediaLength::Found::kSeconds, *seconds, "MP3 frames"};
    }
  }
  return {MediaLength::Found::kUnknown, 0, kind};
}

std::string LengthText(double seconds) {
  auto tenths = static_cast<int64_t>(std::llround(std::max(seconds, 0.0) * 10));
  int64_t s = tenths / 10, h = s / 3600, m = s / 60 % 60;
  if (h > 0) return fmt::format("{}:{:02}:{:02}.{}", h, m, s % 60, tenths % 10);
  return fmt::format("{}:{:02}.{}", m, s % 60, tenths % 10);
}

}  // namespace tav::simulation
