#pragma once
// Port: the claim a client takes on the lighting outputs, so that two
// programs on one machine never drive the same universes with one source
// identity (receivers would drop one of them as out of order) or open the
// same serial ports. The adapter (platform/LockFileOutputClaim) holds a lock
// file in the user's runtime folder for as long as the claim lasts.

#include <string>

namespace tav {

class OutputClaim {
 public:
  virtual ~OutputClaim() = default;
  // Takes the claim for `clientName`. False when another program holds it;
  // `holder` then names that program as far as it is known.
  virtual bool TryClaim(const std::string& clientName, std::string& holder) = 0;
  virtual void Release() = 0;
};

}  // namespace tav
