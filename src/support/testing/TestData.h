#pragma once
// Files written by independent programs, kept in the repository's testdata/
// folder, for tests that must not trust our own writers. ctest sets
// TAV_TESTDATA_DIR; a test binary run by hand falls back to the path compiled
// into it.

#include <cstdlib>
#include <string>

namespace tav::testing {

inline std::string TestDataFile(const std::string& relative) {
  const char* dir = std::getenv("TAV_TESTDATA_DIR");
#ifdef TAV_TESTDATA_DIR_DEFAULT
  std::string base = dir && *dir ? dir : TAV_TESTDATA_DIR_DEFAULT;
#else
  std::string base = dir && *dir ? dir : "testdata";
#endif
  return base + "/" + relative;
}

}  // namespace tav::testing
