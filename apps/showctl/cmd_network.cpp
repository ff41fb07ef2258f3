// showctl network: see and change the network preferences, the description
// of every lighting network the player drives (docs/network-preferences.md).
// Each command without options shows its part; with options it changes
// those values and nothing else, refuses a value out of range with the range
// in the message (changing nothing), saves, and announces the change through
// the "Ver" value so a running player reopens the networks that changed.

#include <fmt/format.h>

#include <cctype>
#include <functional>
#include <iostream>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "NetworkJson.h"
#include "NetworkOptions.h"
#include "NetworkUniverseCommands.h"
#include "NetworkView.h"
#include "SettingsStore.h"

namespace tav::showctl {
namespace {

// --- list ---

void List(const NetworkCommon& common, bool json) {
  FileRegistryStore store = OpenSettingsStore(common.file);
  NetworkPreferences prefs = ReadAndWarn(store);
  if (json) {
    std::vector<std::string> warnings = prefs.Problems();
    for (auto& line : OutOfRange(prefs)) warnings.push_back(std::move(line));
    std::cout << NetworkPreferencesJson(prefs, warnings)
                     .dump(2, ' ', false, nlohmann::json::error_handler_t::replace)
              << "\n";
    return;
  }
  std::cout << "# " << store.Path() << "\n\n" << NetworkPreferencesText(prefs);
}

// --- tav ---

struct TAVOptions {
  std::string network;
  Option port, speed, oldMCP, enhanced, units, circuits, stopBits, dmxUniverse, dmxStartSlot;
};

void TAV(const NetworkCommon& common, const TAVOptions& o) {
  int32_t network = ParseLong(o.network, "NETWORK");
  if (network < 0 || network >= kTAVNetworkCount) {
    throw CommandFailed(
        fmt::format("TAV networks are numbered 0 to {}, not {}", kTAVNetworkCount - 1, network));
  }
  using T = TAVNetworkPreferences;
  Steps<T> steps;
  AddText(steps, o.port, &T::SetPort);
  AddLong(steps, o.speed, "--speed", &T::SetSpeed);
  AddBoolean(steps, o.oldMCP, "--old-mcp", &T::SetOldMCP);
  AddBoolean(steps, o.enhanced, "--enhanced", &T::SetEnhanced);
  AddLong(steps, o.units, "--units", &T::SetUnitCount);
  AddLong(steps, o.circuits, "--circuits", &T::SetCircuitsPerUnit);
  AddLong(steps, o.stopBits, "--stop-bits", &T::SetStopBits);
  AddLong(steps, o.dmxUniverse, "--dmx-universe", &T::SetDMXUniverse);
  AddLong(steps, o.dmxStartSlot, "--dmx-start-slot", &T::SetDMXStartSlot);
  ShowOrChange(
      common, !steps.empty(),
      [&](NetworkPreferences& prefs) { Apply(steps, prefs.TAVNetwork(network)); },
      [&](const NetworkPreferences& prefs) { return TAVNetworkText(prefs, network); });
}

// --- x10, fennick, listener, output ---

struct X10Options {
  Option port, houseCodes;
};

void X10(const NetworkCommon& common, const X10Options& o) {
  using T = NetworkPreferences;
  Steps<T> steps;
  AddText(steps, o.port, &T::SetX10Port);
  if (o.houseCodes) {
    std::string codes;
    for (char c : *o.houseCodes)
      codes += static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
    AddText(steps, Option(codes), &T::SetX10HouseCodes);
  }
  ShowOrChange(
      common, !steps.empty(), [&](T& prefs) { Apply(steps, prefs); }, X10Text);
}

struct FennickOptions {
  Option port, speed, stopBits, boards, channelsPerBoard, headerPerBank, clamp;
};

void Fennick(const NetworkCommon& common, const FennickOptions& o) {
  Steps<NetworkPreferences> portStep;
  AddText(portStep, o.port, &NetworkPreferences::SetFennickPort);
  using T = FennickPreferences;
  Steps<T> steps;
  AddLong(steps, o.speed, "--speed", &T::SetSpeed);
  AddLong(steps, o.stopBits, "--stop-bits", &T::SetStopBits);
  AddLong(steps, o.boards, "--boards", &T::SetBoards);
  AddLong(steps, o.channelsPerBoard, "--channels-per-board", &T::SetChannelsPerBoard);
  AddBoolean(steps, o.headerPerBank, "--header-per-bank", &T::SetHeaderPerBank);
  AddBoolean(steps, o.clamp, "--clamp-special-values", &T::SetClampSpecialValues);
  ShowOrChange(
      common, !portStep.empty() || !steps.empty(),
      [&](NetworkPreferences& prefs) {
        Apply(portStep, prefs);
        Apply(steps, prefs.Fennick());
      },
      FennickText);
}

struct ListenerOptions {
  Option enabled, transport, universe, interface, firstSlot, slotCount, threshold, network, unit;
};

void Listener(const NetworkCommon& common, const ListenerOptions& o) {
  using T = DMXListenerPrefs;
  Steps<T> steps;
  AddBoolean(steps, o.enabled, "--enabled", &T::SetEnabled);
  AddTransport(steps, o.transport, "--transport", &T::SetTransport);
  AddLong(steps, o.universe, "--universe", &T::SetUniverse);
  AddText(steps, o.interface, &T::SetInterface);
  AddLong(steps, o.firstSlot, "--first-slot", &T::SetFirstSlot);
  AddLong(steps, o.slotCount, "--slot-count", &T::SetSlotCount);
  AddLong(steps, o.threshold, "--threshold", &T::SetThreshold);
  AddLong(steps, o.network, "--network", &T::SetNetwork);
  AddLong(steps, o.unit, "--unit", &T::SetUnit);
  ShowOrChange(
      common, !steps.empty(), [&](NetworkPreferences& prefs) { Apply(steps, prefs.Listener()); },
      ListenerText);
}

struct OutputOptions {
  Option sourceName, ttl, syncUniverse, refreshRate, sourceCID;
};

void Output(const NetworkCommon& common, const OutputOptions& o) {
  using T = NetworkPreferences;
  Steps<T> steps;
  AddText(steps, o.sourceName, &T::SetSourceName);
  AddLong(steps, o.ttl, "--ttl", &T::SetMulticastTTL);
  AddLong(steps, o.syncUniverse, "--sync-universe", &T::SetSyncUniverse);
  AddLong(steps, o.refreshRate, "--refresh-rate", &T::SetRefreshRate);
  AddText(steps, o.sourceCID, &T::SetSourceCID);
  ShowOrChange(
      common, !steps.empty(), [&](T& prefs) { Apply(steps, prefs); }, OutputText);
}

// --- registration ---

void Register(CLI::App& app) {
  auto common = std::make_shared<NetworkCommon>();
  auto* network = app.add_subcommand(
      "network",
      "See and change the lighting networks: TAV networks, DMX universes, X10, Fennick, the DMX "
      "listener and the E1.31/Art-Net output");
  network->require_subcommand(1);
  network->fallthrough();
  network->add_option("--file", common->file, "Settings file to work on instead of the usual one");

  auto json = std::make_shared<bool>(false);
  auto* list = network->add_subcommand(
      "list",
      "Show every network setting; values that cannot be read or are out of range are "
      "warned about");
  list->add_flag("--json", *json, "Print JSON, one member per stored value, for scripts");
  list->callback([common, json] { List(*common, *json); });

  auto t = std::make_shared<TAVOptions>();
  auto* tav = network->add_subcommand("tav", "Show or change one TAV network (serial controllers)");
  tav->add_option("NETWORK", t->network, "Network number, 0 to 15")->required();
  tav->add_option("--port", t->port, "Serial device the controllers hang on, \"\" for none");
  tav->add_option("--speed", t->speed, "Baud, 300 to 4000000 (default 57600)");
  tav->add_option("--old-mcp", t->oldMCP, "Controllers of the old MCP generation: on or off");
  tav->add_option("--enhanced", t->enhanced, "Enhanced (per-bank addressed) protocol: on or off");
  tav->add_option("--units", t->units, "Units on the network, 1 to 127 (default 8)");
  tav->add_option("--circuits", t->circuits, "Circuits per unit, 1 to 512 (default 16)");
  tav->add_option("--stop-bits", t->stopBits, "Serial stop bits, 1 or 2");
  tav->add_option("--dmx-universe", t->dmxUniverse,
                  "With no controller attached, send the levels to this DMX universe "
                  "(1 to 63999; 0 = not mapped)");
  tav->add_option("--dmx-start-slot", t->dmxStartSlot,
                  "Slot of the mapped universe that unit 1 circuit 1 lands on, 1 to 512");
  tav->footer(kNetworkFooter);
  tav->callback([common, t] { TAV(*common, *t); });

  AddUniverseCommands(*network, common);

  auto x = std::make_shared<X10Options>();
  auto* x10 = network->add_subcommand("x10", "Show or change the X10 network");
  x10->add_option("--port", x->port, "Serial device of the X10 interface, \"\" for none");
  x10->add_option("--house-codes", x->houseCodes,
                  "House codes in use, letters A to P, such as AC (\"\" = A)");
  x10->footer(kNetworkFooter);
  x10->callback([common, x] { X10(*common, *x); });

  auto f = std::make_shared<FennickOptions>();
  auto* fennick = network->add_subcommand("fennick", "Show or change the Fennick network");
  fennick->add_option("--port", f->port, "Serial device of the board chain, \"\" for none");
  fennick->add_option("--speed", f->speed, "Baud, 300 to 4000000 (default 57600)");
  fennick->add_option("--stop-bits", f->stopBits, "Serial stop bits, 1 or 2");
  fennick->add_option("--boards", f->boards, "Boards in the chain, 1 to 127 (default 1)");
  fennick->add_option("--channels-per-board", f->channelsPerBoard,
                      "Channels per board, 1 to 512 (default 8)");
  fennick->add_option("--header-per-bank", f->headerPerBank,
                      "A header before every bank of 8 channels instead of one per frame: on or "
                      "off");
  fennick->add_option("--clamp-special-values", f->clamp,
                      "Clamp levels 0x7D-0x7F instead of escaping them: on or off");
  fennick->footer(kNetworkFooter);
  fennick->callback([common, f] { Fennick(*common, *f); });

  auto l = std::make_shared<ListenerOptions>();
  auto* listener = network->add_subcommand(
      "listener", "Show or change the DMX listener, whose incoming slots act as inputs");
  listener->add_option("--enabled", l->enabled, "Listen: on or off (default off)");
  listener->add_option("--transport", l->transport, "E1.31 (default) or ArtNet");
  listener->add_option("--universe", l->universe, "Universe to receive, 0 to 63999");
  listener->add_option("--interface", l->interface,
                       "Network interface or local address to receive on; \"\" = any");
  listener->add_option("--first-slot", l->firstSlot, "First slot that acts as an input, 1 to 512");
  listener->add_option("--slot-count", l->slotCount,
                       "Slots that act as inputs, from the first slot to at most slot 512");
  listener->add_option("--threshold", l->threshold,
                       "Level, 1 to 255, a slot must rise to from below to fire (default 128)");
  listener->add_option("--network", l->network, "Network the inputs are raised on");
  listener->add_option("--unit", l->unit, "Unit the inputs are raised on; slot s is input s");
  listener->footer(kNetworkFooter);
  listener->callback([common, l] { Listener(*common, *l); });

  auto out = std::make_shared<OutputOptions>();
  auto* output =
      network->add_subcommand("output", "Show or change how E1.31 and Art-Net frames are sent");
  output->add_option("--source-name", out->sourceName,
                     "E1.31 source name receivers show, at most 63 bytes");
  output->add_option("--ttl", out->ttl, "Multicast time to live, 1 to 255 (default 1)");
  output->add_option("--sync-universe", out->syncUniverse,
                     "E1.31 synchronization universe, 1 to 63999; 0 = none, and no ArtSync");
  output->add_option("--refresh-rate", out->refreshRate, "Frames a second, 1 to 1000 (default 40)");
  output->add_option("--source-cid", out->sourceCID,
                     "E1.31 source CID, a UUID; \"\" makes the player choose a new one");
  output->footer(kNetworkFooter);
  output->callback([common, out] { Output(*common, *out); });
  NameValues(network);
}

}  // namespace

CommandGroup reg{"network", Register};

}  // namespace tav::showctl
