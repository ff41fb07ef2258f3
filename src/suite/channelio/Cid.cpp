#include "suite/channelio/Cid.h"

#include <random>

namespace tav {

namespace {

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

}  // namespace

bool ParseCid(std::string_view text, Cid& cid) {
  if (text.size() >= 2 && text.front() == '{' && text.back() == '}')
    text = text.substr(1, text.size() - 2);
  bool hyphenated = text.size() == 36;
  if (!hyphenated && text.size() != 32) return false;
  Cid parsed{};
  size_t digit = 0;
  for (size_t i = 0; i < text.size(); ++i) {
    if (hyphenated && (i == 8 || i == 13 || i == 18 || i == 23)) {
      if (text[i] != '-') return false;
      continue;
    }
    int value = HexValue(text[i]);
    if (value < 0) return false;
    parsed[digit / 2] = static_cast<uint8_t>(parsed[digit / 2] | (digit % 2 ? value : value << 4));
    ++digit;
  }
  if (parsed == Cid{}) return false;
  cid = parsed;
  return true;
}

std::string FormatCid(const Cid& cid) {
  static const char* kHex = "0123456789abcdef";
  std::string text;
  for (size_t i = 0; i < cid.size(); ++i) {
    if (i == 4 || i == 6 || i == 8 || i == 10) text += '-';
    text += kHex[cid[i] >> 4];
    text += kHex[cid[i] & 15];
  }
  return text;
}

Cid NewRandomCid() {
  std::random_device device;
  Cid cid;
  for (size_t i = 0; i < cid.size(); i += 4) {
    uint32_t word = device();
    for (size_t k = 0; k < 4; ++k) cid[i + k] = static_cast<uint8_t>(word >> (8 * k));
  }
  cid[6] = static_cast<uint8_t>((cid[6] & 0x0F) | 0x40);  // version 4
  cid[8] = static_cast<uint8_t>((cid[8] & 0x3F) | 0x80);  // RFC 4122 variant
  return cid;
}

}  // namespace tav
