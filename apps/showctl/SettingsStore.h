#pragma once
// The settings file as showctl commands open it: the file given with --file,
// else the one the player reads ($TAV_REGISTRY_FILE, else the user's config
// folder). Lines the store cannot read are reported on standard error as
// warnings, each once per run however often the file is read, and otherwise
// left alone.

#include <string>

#include "platform/FileRegistryStore.h"

namespace tav::showctl {

// `file` empty: the usual settings file.
FileRegistryStore OpenSettingsStore(const std::string& file);

// The store never waits for its lock (the player must not), so a command
// that changed something waits here, a few seconds at most, and reports a
// change it could not write rather than success.
void FinishWriting(FileRegistryStore& store);

}  // namespace tav::showctl
