#pragma once
// Where FSEQ channels land for a given set of network preferences: on the
// enabled DMX universes that give a start channel and a size of their own,
// else (none does) on consecutive universes of 512 slots from universe 1.
// The player and its simulation place channels alike through this one rule.

#include "config/NetworkPreferences.h"
#include "suite/seqlib/UniverseMap.h"

namespace tav {

UniverseMap UniverseMapOf(const NetworkPreferences& prefs);

}  // namespace tav
