#pragma once
// The ProcessMemory port on Linux, from /proc/self/status.
//
// The figure is RssAnon + VmSwap: the anonymous memory the process has
// touched, whether resident or swapped out. That is what the platform's
// "private bytes" measure: the process's own allocations (the sequence
// cache lives there), counted even when paged out, and neither shared
// libraries nor mapped files, which the kernel can drop and re-read at will.
// smaps_rollup's Private_* would count written file-backed pages and miss
// swapped ones, and costs a walk over every mapping; status is a cheap read.

#include <string_view>

#include "ports/ProcessMemory.h"

namespace tav {

class LinuxProcessMemory : public ProcessMemory {
 public:
  // `statusPath` is for tests; the program reads its own status file.
  explicit LinuxProcessMemory(std::string statusPath = "/proc/self/status");
  int32_t PrivateBytes() const override;

  // The figure from the text of a status file. Fails like PrivateBytes, with
  // the "no data" code, when RssAnon is missing or unreadable. Sizes above
  // the 32-bit range report as its largest value.
  static int32_t PrivateBytesFromStatus(std::string_view statusText);

 private:
  std::string m_statusPath;
};

}  // namespace tav
