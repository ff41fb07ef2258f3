#include "suite/seqlib/ContentHash.h"

namespace tav {

namespace {

constexpr uint64_t kOffsetBasis = 0xcbf29ce484222325ull;

uint64_t Continue(uint64_t hash, std::string_view bytes) {
  for (unsigned char c : bytes) {
    hash ^= c;
    hash *= 0x100000001b3ull;
  }
  return hash;
}

}  // namespace

uint64_t ContentHash(std::string_view bytes) {
  return Continue(kOffsetBasis, bytes);
}

uint64_t ContentHash(const RandomAccessFile& file) {
  std::string chunk(64 * 1024, '\0');
  uint64_t hash = kOffsetBasis;
  for (uint64_t offset = 0; offset < file.Size();) {
    size_t got = file.ReadAt(offset, chunk.data(), chunk.size());
    if (got == 0) break;
    hash = Continue(hash, std::string_view(chunk.data(), got));
    offset += got;
  }
  return hash;
}

std::string ContentHashText(uint64_t hash) {
  static const char* digits = "0123456789abcdef";
  std::string text(16, '0');
  for (int i = 15; i >= 0; --i, hash >>= 4) text[i] = digits[hash & 15];
  return text;
}

}  // namespace tav
