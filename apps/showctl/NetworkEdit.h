#pragma once
// Changes to the network preferences as showctl makes them: read the
// preferences from the settings file, apply one command's change, refuse it
// if it puts a value out of range, save, and announce the change by a new
// "Ver" text so a running player reloads its networks. All of it is one
// locked transaction of the settings file, so another program's change made
// meanwhile is neither lost nor overwritten, and a refused or failed change
// leaves the file exactly as it was.
//
// A change that leaves the preferences as they were writes nothing and does
// not disturb the player.

#include <functional>
#include <string>
#include <vector>

#include "config/NetworkPreferences.h"
#include "platform/FileRegistryStore.h"

namespace tav::showctl {

// Every out-of-range or inconsistent value, one line each: what
// NetworkPreferences::Validate reports (with the DMX listener's values
// checked even while it is switched off, since switching it on must not
// fail later), and the E1.31 source name length, the source CID's form and
// the listener's transport, which it does not check. DMX universes are named
// by their number rather than their place in the list.
std::vector<std::string> OutOfRange(const NetworkPreferences& prefs);

struct NetworkEditResult {
  bool changed = false;
  // The preferences as they now are.
  NetworkPreferences prefs;
  // What could not be read (NetworkPreferences::Problems); when the change
  // was saved, the values used instead were saved with it.
  std::vector<std::string> problems;
};

enum class RangeCheck {
  kNewValues,  // refuse a change that brings an out-of-range line not there before
  kNone,       // for changes that cannot bring one (removals), which renumber entries
};

// `change` refuses by throwing (CommandFailed); nothing is written then.
// Fails with CommandFailed when the file cannot be written.
NetworkEditResult EditNetworkPreferences(FileRegistryStore& store,
                                         const std::function<void(NetworkPreferences&)>& change,
                                         RangeCheck check = RangeCheck::kNewValues);

}  // namespace tav::showctl
