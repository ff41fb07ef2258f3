#pragma once
// For tests of every subsystem: what a call failed with, so that cases can
// compare numbers, sources and descriptions in one line. Header only.

#include <cstdint>
#include <functional>
#include <string>

#include "support/Error.h"

namespace tav::testing {

struct Failure {
  int32_t number = 0;
  std::string source;
  std::string description;
};

// The error an action fails with; number 0 when it succeeds.
inline Failure FailureOf(const std::function<void()>& action) {
  try {
    action();
  } catch (const Error& e) {
    return {e.Number(), e.Source(), e.Description()};
  }
  return {};
}

}  // namespace tav::testing
