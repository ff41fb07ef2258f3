#pragma once
// Shared by the fuzz targets: a reader may fail only with tav::Error. Any
// other exception escapes the target and libFuzzer reports it as a crash.

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "support/Error.h"

#define TAV_FUZZ_TARGET(body)                                               \
  extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) { \
    std::string_view input(reinterpret_cast<const char*>(data), size);      \
    try {                                                                   \
      body;                                                                 \
    } catch (const tav::Error&) {                                           \
    }                                                                       \
    return 0;                                                               \
  }
