#include "suite/seqlib/ContentHash.h"

namespace tav {

uint64_t ContentHash(std::string_view bytes) {
  uint64_t hash = 0xcbf29ce484222325ull;
  for (unsigned char c : bytes) {
    hash ^= c;
    hash *= 0x100000001b3ull;
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
