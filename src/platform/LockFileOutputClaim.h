#pragma once
// The OutputClaim port as a lock file beside the tray socket (by default
// $XDG_RUNTIME_DIR/tessavar/outputs.lock): a claim is an exclusive flock on
// it, held until released or until the process ends, so a crashed program
// never leaves a stale claim behind. The holder writes its client name and
// process id into the file so the next one can say who holds the outputs.

#include <string>

#include "suite/channelio/OutputClaim.h"

namespace tav {

class LockFileOutputClaim : public OutputClaim {
 public:
  // The folder of UnixTrayLink::DefaultSocketPath() + "/outputs.lock".
  static std::string DefaultPath();

  explicit LockFileOutputClaim(std::string path = DefaultPath()) : m_path(std::move(path)) {}
  ~LockFileOutputClaim() override;
  LockFileOutputClaim(const LockFileOutputClaim&) = delete;
  LockFileOutputClaim& operator=(const LockFileOutputClaim&) = delete;

  bool TryClaim(const std::string& clientName, std::string& holder) override;
  void Release() override;

 private:
  std::string m_path;
  int m_fd = -1;
};

}  // namespace tav
