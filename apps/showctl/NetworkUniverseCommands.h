#pragma once
// `showctl network universe list|add|set|remove`: the DMX universes, named
// by their number. A range (1-16) adds or changes consecutive universes,
// and `add` lays them out on consecutive channels.

#include <CLI/CLI.hpp>
#include <memory>

#include "NetworkOptions.h"

namespace tav::showctl {

// Adds the `universe` command and its subcommands to the `network` group.
void AddUniverseCommands(CLI::App& network, const std::shared_ptr<NetworkCommon>& common);

}  // namespace tav::showctl
