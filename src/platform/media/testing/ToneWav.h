#pragma once
// Media the tests make themselves: a WAV file of a tone, in the bytes of the
// format (RIFF, a PCM "fmt " chunk, the samples), so no media file needs to
// be kept in the repository.

#include <cmath>
#include <cstdint>
#include <numbers>
#include <string>

namespace tav {

// 16-bit PCM of a 440 Hz tone, `seconds` long.
inline std::string ToneWav(double seconds, uint32_t rate = 8000, uint16_t channels = 1) {
  uint32_t frames = static_cast<uint32_t>(seconds * rate);
  uint32_t dataBytes = frames * channels * 2;
  std::string bytes;
  bytes.reserve(44 + dataBytes);
  auto put = [&bytes](uint32_t value, int size) {
    for (int i = 0; i < size; ++i) bytes.push_back(static_cast<char>(value >> (8 * i)));
  };
  bytes += "RIFF";
  put(36 + dataBytes, 4);
  bytes += "WAVEfmt ";
  put(16, 4);
  put(1, 2);  // PCM
  put(channels, 2);
  put(rate, 4);
  put(rate * channels * 2, 4);
  put(channels * 2, 2);
  put(16, 2);
  bytes += "data";
  put(dataBytes, 4);
  for (uint32_t i = 0; i < frames; ++i) {
    double wave = std::sin(2 * std::numbers::pi * 440.0 * i / rate);
    for (uint16_t c = 0; c < channels; ++c) {
      put(static_cast<uint16_t>(static_cast<int16_t>(8000 * wave)), 2);
    }
  }
  return bytes;
}

}  // namespace tav
