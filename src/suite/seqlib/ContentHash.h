#pragma once
// The content hash a compressed export records of the file it came from:
// 64-bit FNV-1a. It detects a changed source, it is not a security measure.

#include <cstdint>
#include <string>
#include <string_view>

#include "suite/seqlib/RandomAccessFile.h"

namespace tav {

uint64_t ContentHash(std::string_view bytes);
// The same of a whole file, read a piece at a time.
uint64_t ContentHash(const RandomAccessFile& file);
// Sixteen lower-case hexadecimal digits.
std::string ContentHashText(uint64_t hash);

}  // namespace tav
