#pragma once
// An object whose operations can be called by their name, with no
// arguments, as the registry watcher calls its callback. The host form
// implements it for "DoUpdateNetworkPrefsFromRegistry"; a name it does not
// know should fail as the platform does: tav::Error 438, "Object doesn't
// support this property or method".

#include <string>

namespace tav {

class CallableByName {
 public:
  virtual ~CallableByName() = default;
  virtual void CallByName(const std::string& name) = 0;
};

}  // namespace tav
