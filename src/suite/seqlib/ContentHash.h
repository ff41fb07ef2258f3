#pragma once
// The content hash a compressed export records of the files it came from:
// XXH64 (seed 0) of their bytes, written out here from its published
// description so that no library is needed. It detects a changed source; it
// is not a security measure. It runs at memory speed, so an export can check
// its sources at every load and still load many times faster than a plain
// sequence parses.
//
// A sequence that includes others records the combined hash of its own file
// and every file it included (CombinedContentHash), so an edited subsequence
// makes its export stale too.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "suite/seqlib/RandomAccessFile.h"

namespace tav {

uint64_t ContentHash(std::string_view bytes);

// The same hash over bytes that arrive in pieces of any size.
class ContentHasher {
 public:
  ContentHasher();
  void Update(std::string_view bytes);
  uint64_t Value() const;

 private:
  void Stripe(const unsigned char* p);

  uint64_t m_lanes[4];
  unsigned char m_buffer[32];
  size_t m_buffered = 0;
  uint64_t m_total = 0;
};

// The own file's hash when nothing was included; otherwise the hash of the
// eight little-endian bytes of each hash, the own file's first, then the
// included files' in the order they were first included.
uint64_t CombinedContentHash(uint64_t own, const std::vector<uint64_t>& included);

// The same of a whole file, read a piece at a time.
uint64_t ContentHash(const RandomAccessFile& file);
// Sixteen lower-case hexadecimal digits.
std::string ContentHashText(uint64_t hash);

}  // namespace tav
