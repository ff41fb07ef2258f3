// The settings-file reader on arbitrary bytes: it reports lines it cannot
// read instead of failing, and writing what it read is stable.
//
// Stable from the second write on: the first write may normalise. A text
// value holding zero bytes, say, is written as typed hex data, and text read
// from such data ends at its first zero byte, as string data does on Windows.

#include <cstdlib>

#include "FuzzCommon.h"
#include "config/RegistryFileFormat.h"

namespace {
std::string ReadAndWrite(std::string_view bytes) {
  tav::RegistryDocument document;
  tav::ApplyRegistryFile(tav::ParseRegistryFile(bytes), document, false);
  return tav::FormatRegistryFile(document);
}
}  // namespace

TAV_FUZZ_TARGET({
  std::string once = ReadAndWrite(input);
  std::string twice = ReadAndWrite(once);
  if (ReadAndWrite(twice) != twice) std::abort();
})
