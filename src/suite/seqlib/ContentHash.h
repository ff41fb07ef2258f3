#pragma once
// The content hash a compressed export records of the file it came from:
// 64-bit FNV-1a. It detects a changed source, it is not a security measure.

#include <cstdint>
#include <string>
#include <string_view>

namespace tav {

uint64_t ContentHash(std::string_view bytes);
// Sixteen lower-case hexadecimal digits.
std::string ContentHashText(uint64_t hash);

}  // namespace tav
