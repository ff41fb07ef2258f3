#pragma once
// Port: how much memory this process holds privately, in bytes. The memory
// watchdog compares it with its thresholds to decide when to drop cached
// sequences and when to end the program for a fresh restart.
//
// The measurement is a 32-bit signed number of bytes, like the thresholds it
// is compared with; a larger figure is reported as the largest 32-bit value.
// When the figure cannot be obtained, PrivateBytes fails with the error made
// by ProcessMemoryError.

#include <cstdint>
#include <string>

#include "support/Error.h"

namespace tav {

class ProcessMemory {
 public:
  virtual ~ProcessMemory() = default;
  virtual int32_t PrivateBytes() const = 0;
};

// The failure of a memory query: the system's error code as the number, and
// "Cannot get process memory info; error: " followed by that code.
inline Error ProcessMemoryError(int32_t systemErrorCode) {
  return Error(systemErrorCode, "LibMem.ProcessMemory",
               "Cannot get process memory info; error: " + std::to_string(systemErrorCode));
}

}  // namespace tav
