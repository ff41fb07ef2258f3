#pragma once
// The user data folder as the player finds it: the UserDataPath setting of
// the settings file, or the platform's user data folder when it is empty.
// Schedule and sequence commands look for their files there, so showctl
// edits exactly the files the player reads.

#include <string>

namespace tav::showctl {

// Ends with '/'. Read once per run.
std::string UserDataFolder();

}  // namespace tav::showctl
