#pragma once
// Error numbers of the sequence library. They keep the platform's numbers
// for file failures so that log lines read as users know them; the
// description always says what is wrong and where (file, offset, JSON path).

#include <cstdint>
#include <string>

#include "support/Error.h"

namespace tav::seqerrors {

constexpr int32_t kFileNotFound = 53;
constexpr int32_t kPastEndOfFile = 62;
constexpr int32_t kFileAccess = 75;
constexpr int32_t kInvalidFileFormat = 321;

Error FileNotFound(std::string source, const std::string& path);
Error PastEndOfFile(std::string source, const std::string& what);
Error FileAccess(std::string source, const std::string& what);
Error InvalidFormat(std::string source, const std::string& what);

}  // namespace tav::seqerrors
