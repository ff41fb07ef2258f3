// The length of an MP3 (MPEG audio) file from its first frames: the frame
// count of a Xing/Info or VBRI header when the encoder wrote one (variable
// bit rates), else the audio's size over the first frame's bit rate
// (constant bit rate). Part of MediaLength.

#include <array>

#include "MediaLength.h"

namespace tav::simulation {
namespace {

uint32_t Byte(std::string_view b, size_t at) {
  return static_cast<uint8_t>(b[at]);
}

uint32_t Be32(std::string_view b, size_t at) {
  return Byte(b, at) << 24 | Byte(b, at + 1) << 16 | Byte(b, at + 2) << 8 | Byte(b, at + 3);
}

struct FrameHeader {
  bool mpeg1 = false;
  int layer = 0;  // 1, 2 or 3
  bool mono = false;
  uint32_t bitRate = 0;  // bits per second
  uint32_t sampleRate = 0;
  uint32_t samplesPerFrame = 0;
  uint32_t frameBytes = 0;
};

// Kilobits per second by bit-rate index (1-14), for MPEG-1 layers I-III and
// for MPEG-2/2.5 layer I and layers II-III.
constexpr std::array<std::array<uint16_t, 15>, 5> kBitRates = {{
    {0, 32, 64, 96, 128, 160, 192, 224, 256, 288, 320, 352, 384, 416, 448},
    {0, 32, 48, 56, 64, 80, 96, 112, 128, 160, 192, 224, 256, 320, 384},
    {0, 32, 40, 48, 56, 64, 80, 96, 112, 128, 160, 192, 224, 256, 320},
    {0, 32, 48, 56, 64, 80, 96, 112, 128, 144, 160, 176, 192, 224, 256},
    {0, 8, 16, 24, 32, 40, 48, 56, 64, 80, 96, 112, 128, 144, 160},
}};

std::optional<FrameHeader> ReadFrameHeader(std::string_view b, size_t at) {
  if (at + 4 > b.size()) return std::nullopt;
  const uint32_t h = Be32(b, at);
  if ((h >> 21) != 0x7FF) return std::nullopt;
  const uint32_t version = h >> 19 & 3;  // 0 MPEG-2.5, 2 MPEG-2, 3 MPEG-1
  const uint32_t layerBits = h >> 17 & 3;
  const uint32_t rateIndex = h >> 12 & 15;
  const uint32_t sampleIndex = h >> 10 & 3;
  if (version == 1 || layerBits == 0 || rateIndex == 0 || rateIndex == 15 || sampleIndex == 3) {
    return std::nullopt;
  }
  FrameHeader f;
  f.mpeg1 = version == 3;
  f.layer = 4 - static_cast<int>(layerBits);
  f.mono = (h >> 6 & 3) == 3;
  const size_t table = f.mpeg1 ? static_cast<size_t>(f.layer - 1) : (f.layer == 1 ? 3 : 4);
  f.bitRate = kBitRates[table][rateIndex] * 1000u;
  static constexpr uint32_t kRates[] = {44100, 48000, 32000};
  f.sampleRate = kRates[sampleIndex] >> (version == 3 ? 0 : version == 2 ? 1 : 2);
  const uint32_t padding = h >> 9 & 1;
  if (f.layer == 1) {
    f.samplesPerFrame = 384;
    f.frameBytes = (12 * f.bitRate / f.sampleRate + padding) * 4;
  } else {
    f.samplesPerFrame = f.layer == 3 && !f.mpeg1 ? 576 : 1152;
    f.frameBytes = f.samplesPerFrame / 8 * f.bitRate / f.sampleRate + padding;
  }
  return f;
}

// The frame count of a Xing/Info or VBRI header in the frame at `at`.
std::optional<uint32_t> FrameCount(std::string_view b, size_t at, const FrameHeader& f) {
  const size_t sideInfo = f.mpeg1 ? (f.mono ? 17 : 32) : (f.mono ? 9 : 17);
  const size_t xing = at + 4 + sideInfo;
  if (xing + 12 <= b.size()) {
    std::string_view tag = b.substr(xing, 4);
    if ((tag == "Xing" || tag == "Info") && (Be32(b, xing + 4) & 1) != 0) {
      return Be32(b, xing + 8);
    }
  }
  const size_t vbri = at + 4 + 32;
  if (vbri + 18 <= b.size() && b.substr(vbri, 4) == "VBRI") return Be32(b, vbri + 14);
  return std::nullopt;
}

}  // namespace

std::optional<double> Mp3Seconds(std::string_view head, uint64_t fileSize) {
  size_t at = 0;
  if (head.size() >= 10 && head.substr(0, 3) == "ID3") {
    at = 10 + (Byte(head, 6) & 0x7F) * (1u << 21) + (Byte(head, 7) & 0x7F) * (1u << 14) +
         (Byte(head, 8) & 0x7F) * (1u << 7) + (Byte(head, 9) & 0x7F) +
         ((Byte(head, 5) & 0x10) ? 10 : 0);
  }
  // The first frame whose successor starts where its length says: a lone
  // sync pattern in a tag or in cover art is no frame.
  for (; at + 4 <= head.size(); ++at) {
    std::optional<FrameHeader> f = ReadFrameHeader(head, at);
    if (!f || f->frameBytes < 4) continue;
    const size_t next = at + f->frameBytes;
    if (next + 4 <= head.size() && !ReadFrameHeader(head, next)) continue;
    if (auto frames = FrameCount(head, at, *f)) {
      if (*frames == 0) return std::nullopt;
      return static_cast<double>(*frames) * f->samplesPerFrame / f->sampleRate;
    }
    if (fileSize <= at) return std::nullopt;
    return static_cast<double>(fileSize - at) * 8 / f->bitRate;
  }
  return std::nullopt;
}

}  // namespace tav::simulation
