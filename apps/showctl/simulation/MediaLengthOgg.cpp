// The length of an Ogg Vorbis or Ogg Opus file: the granule position of the
// stream's last page (its sample count) over the sample rate from the first
// page's identification header; Opus counts at 48 kHz after its pre-skip.
// The last page is found in the file's tail. Part of MediaLength.

#include "MediaLength.h"

namespace tav::simulation {
namespace {

constexpr size_t kPageHeaderBytes = 27;

uint32_t Byte(std::string_view b, size_t at) {
  return static_cast<uint8_t>(b[at]);
}

uint32_t Le32(std::string_view b, size_t at) {
  return Byte(b, at) | Byte(b, at + 1) << 8 | Byte(b, at + 2) << 16 | Byte(b, at + 3) << 24;
}

uint64_t Le64(std::string_view b, size_t at) {
  return Le32(b, at) | static_cast<uint64_t>(Le32(b, at + 4)) << 32;
}

bool IsPage(std::string_view b, size_t at) {
  return at + kPageHeaderBytes <= b.size() && b.substr(at, 4) == "OggS" && Byte(b, at + 4) == 0;
}

}  // namespace

std::optional<double> OggSeconds(std::string_view head, std::string_view tail) {
  if (!IsPage(head, 0)) return std::nullopt;
  const uint32_t serial = Le32(head, 14);
  const size_t body = kPageHeaderBytes + Byte(head, 26);
  double rate = 0;
  uint64_t preSkip = 0;
  if (body + 16 <= head.size() && head.substr(body, 7) == "\x01vorbis") {
    rate = Le32(head, body + 12);
  } else if (body + 12 <= head.size() && head.substr(body, 8) == "OpusHead") {
    rate = 48000;
    preSkip = Byte(head, body + 10) | Byte(head, body + 11) << 8;
  }
  if (rate <= 0) return std::nullopt;
  // The last page of this stream with a position (-1 marks a page on which
  // no packet ends).
  for (size_t at = tail.size() >= kPageHeaderBytes ? tail.size() - kPageHeaderBytes + 1 : 0;
       at-- > 0;) {
    if (!IsPage(tail, at) || Le32(tail, at + 14) != serial) continue;
    const uint64_t granule = Le64(tail, at + 6);
    if (granule == ~uint64_t{0}) continue;
    if (granule <= preSkip) return std::nullopt;
    return static_cast<double>(granule - preSkip) / rate;
  }
  return std::nullopt;
}

}  // namespace tav::simulation
