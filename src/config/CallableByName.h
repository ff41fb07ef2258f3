#pragma once
// An object whose operations can be called by their name, with no
// arguments, as the registry watcher calls its callback. The host form
// implements it for "DoUpdateNetworkPrefsFromRegistry"; a name it does not
// know should fail with UnknownOperationError.

#include <string>

#include "support/Error.h"

namespace tav {

class CallableByName {
 public:
  virtual ~CallableByName() = default;
  virtual void CallByName(const std::string& name) = 0;
};

// The platform's error 438, "Object doesn't support this property or method".
inline Error UnknownOperationError(const std::string& source) {
  return Error(438, source, "Object doesn't support this property or method");
}

}  // namespace tav
