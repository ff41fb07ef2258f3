// showctl network: see and change the network preferences, the description
// of every lighting network the player drives (docs/network-preferences.md).
// Each command without options shows its part; with options it changes
// those values and nothing else, refuses a value out of range with the range
// in the message (changing nothing), saves, and announces the change through
// the "Ver" value so a running player reopens the networks that changed.

#include <fmt/format.h>

#include <cstdio>
#include <functional>
#include <iostream>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "ArgumentValues.h"
#include "CommandRegistry.h"
#include "NetworkEdit.h"
#include "NetworkJson.h"
#include "NetworkView.h"
#include "SettingsStore.h"

namespace tav::showctl {
namespace {

// A range typed by mistake ("1-60000") would fill the settings file.
constexpr int64_t kMaxUniversesAtOnce = 1024;

using Option = std::optional<std::string>;
template <typename T>
using Steps = std::vector<std::function<void(T&)>>;

// Each Add* reads an option's value at once, so that a bad value fails
// before the settings file is opened, and records how to apply it.
template <typename T, typename Setter>
void AddLong(Steps<T>& steps, const Option& text, const char* option, Setter set) {
  if (!text) return;
  int32_t value = ParseLong(*text, option);
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T, typename Setter>
void AddBoolean(Steps<T>& steps, const Option& text, const char* option, Setter set) {
  if (!text) return;
  bool value = ParseBoolean(*text, option);
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T, typename Setter>
void AddText(Steps<T>& steps, const Option& text, Setter set) {
  if (!text) return;
  std::string value = *text;
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T, typename Setter>
void AddTransport(Steps<T>& steps, const Option& text, const char* option, Setter set) {
  if (!text) return;
  DMXTransport value;
  if (!DMXTransportFromName(*text, value)) {
    throw CommandFailed(fmt::format(
        "{}: \"{}\" is not a transport (E1.31, ArtNet, USBPro or OpenDMX)", option, *text));
  }
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T>
void Apply(const Steps<T>& steps, T& target) {
  for (const auto& step : steps) step(target);
}

void Warn(const std::string& text) {
  std::cerr << "showctl: warning: " << text << "\n";
}

NetworkPreferences Read(FileRegistryStore& store) {
  NetworkPreferences prefs;
  prefs.InitFromRegistry(store);
  for (const auto& problem : prefs.Problems()) Warn(problem);
  for (const auto& line : OutOfRange(prefs)) Warn(line);
  return prefs;
}

using View = std::function<std::string(const NetworkPreferences&)>;

// Shows one part when no option was given, else changes it and shows the
// result.
void ShowOrChange(const std::string& file, bool change,
                  const std::function<void(NetworkPreferences&)>& apply, const View& view,
                  RangeCheck check = RangeCheck::kNewValues) {
  FileRegistryStore store = OpenSettingsStore(file);
  if (!change) {
    std::cout << view(Read(store));
    return;
  }
  NetworkEditResult result = EditNetworkPreferences(store, apply, check);
  for (const auto& problem : result.problems) {
    Warn(result.changed ? problem + " (now saved)" : problem);
  }
  for (const auto& line : OutOfRange(result.prefs)) Warn(line);
  std::cout << view(result.prefs);
  if (!result.changed) std::cout << "(no change: nothing was saved)\n";
}

struct Common {
  std::string file;
};

// --- list ---

void List(const Common& common, bool json) {
  FileRegistryStore store = OpenSettingsStore(common.file);
  NetworkPreferences prefs = Read(store);
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

void TAV(const Common& common, const TAVOptions& o) {
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
      common.file, !steps.empty(),
      [&](NetworkPreferences& prefs) { Apply(steps, prefs.TAVNetwork(network)); },
      [&](const NetworkPreferences& prefs) { return TAVNetworkText(prefs, network); });
}

// --- universe ---

struct UniverseRange {
  int32_t first = 0;
  int32_t last = 0;
  bool Single() const { return first == last; }
};

// "7" or "1-16".
UniverseRange ParseUniverses(const std::string& text) {
  size_t dash = text.find('-', 1);
  UniverseRange range;
  range.first = ParseLong(text.substr(0, dash), "UNIVERSES");
  range.last =
      dash == std::string::npos ? range.first : ParseLong(text.substr(dash + 1), "UNIVERSES");
  if (range.first < 0) throw CommandFailed(fmt::format("UNIVERSES: {} is below 0", range.first));
  if (range.last < range.first) {
    throw CommandFailed(
        fmt::format("UNIVERSES: {} counts down; give the lower universe first", text));
  }
  if (static_cast<int64_t>(range.last) - range.first + 1 > kMaxUniversesAtOnce) {
    throw CommandFailed(
        fmt::format("UNIVERSES: {} is more than {} universes at once", text, kMaxUniversesAtOnce));
  }
  return range;
}

int32_t Saturated(int64_t value) {
  return static_cast<int32_t>(std::min<int64_t>(value, std::numeric_limits<int32_t>::max()));
}

// The first absolute channel after every universe in the list.
int64_t NextFreeChannel(const NetworkPreferences& prefs) {
  int64_t next = 1;
  for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
    const DMXUniversePrefs& u = prefs.DMXUniverse(i);
    next = std::max(next, static_cast<int64_t>(u.StartChannel()) + u.Size());
  }
  return next;
}

// Indexes of the entries for the universes of `range`, in the range's
// order; a universe not in the list fails.
std::vector<int32_t> EntriesOf(const NetworkPreferences& prefs, const UniverseRange& range) {
  std::vector<int32_t> indexes;
  for (int64_t universe = range.first; universe <= range.last; ++universe) {
    bool found = false;
    for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
      if (prefs.DMXUniverse(i).Universe() == universe) {
        indexes.push_back(i);
        found = true;
      }
    }
    if (!found) {
      throw CommandFailed(fmt::format(
          "universe {} is not in the list (add it with `showctl network universe add {}`)",
          universe, universe));
    }
  }
  return indexes;
}

struct UniverseOptions {
  std::string universes;
  Option transport, destination, interface, priority, startChannel, size, port, enabled, renumber;
};

Steps<DMXUniversePrefs> UniverseSteps(const UniverseOptions& o) {
  using T = DMXUniversePrefs;
  Steps<T> steps;
  AddTransport(steps, o.transport, "--transport", &T::SetTransport);
  AddText(steps, o.destination, &T::SetDestination);
  AddText(steps, o.interface, &T::SetInterface);
  AddLong(steps, o.priority, "--priority", &T::SetPriority);
  AddLong(steps, o.size, "--size", &T::SetSize);
  AddText(steps, o.port, &T::SetPort);
  AddBoolean(steps, o.enabled, "--enabled", &T::SetEnabled);
  return steps;
}

std::optional<int32_t> StartChannel(const UniverseOptions& o) {
  if (!o.startChannel) return std::nullopt;
  return ParseLong(*o.startChannel, "--start-channel");
}

void UniverseAdd(const Common& common, const UniverseOptions& o) {
  UniverseRange range = ParseUniverses(o.universes);
  Steps<DMXUniversePrefs> steps = UniverseSteps(o);
  std::optional<int32_t> start = StartChannel(o);
  ShowOrChange(
      common.file, true,
      [&](NetworkPreferences& prefs) {
        for (int64_t universe = range.first; universe <= range.last; ++universe) {
          if (prefs.FindDMXUniverse(static_cast<int32_t>(universe))) {
            throw CommandFailed(fmt::format(
                "universe {} is already in the list (change it with `showctl network universe "
                "set {}`); nothing was changed",
                universe, universe));
          }
        }
        // Consecutive universes take consecutive channels, after the
        // universes already there unless told where to start.
        int64_t channel = start ? *start : NextFreeChannel(prefs);
        for (int64_t universe = range.first; universe <= range.last; ++universe) {
          DMXUniversePrefs entry;
          entry.SetUniverse(static_cast<int32_t>(universe));
          Apply(steps, entry);
          entry.SetStartChannel(Saturated(channel));
          channel += entry.Size();
          prefs.AddDMXUniverse(entry);
        }
      },
      DMXUniversesTable);
}

void UniverseSet(const Common& common, const UniverseOptions& o) {
  UniverseRange range = ParseUniverses(o.universes);
  Steps<DMXUniversePrefs> steps = UniverseSteps(o);
  std::optional<int32_t> start = StartChannel(o);
  std::optional<int32_t> renumber;
  if (o.renumber) {
    renumber = ParseLong(*o.renumber, "--universe");
    if (!range.Single()) {
      throw CommandFailed("--universe renumbers one universe; give a single UNIVERSES");
    }
  }
  bool change = !steps.empty() || start || renumber;
  ShowOrChange(
      common.file, change,
      [&](NetworkPreferences& prefs) {
        std::vector<int32_t> indexes = EntriesOf(prefs, range);
        if (renumber) {
          if (indexes.size() > 1) {
            throw CommandFailed(
                fmt::format("universe {} is in the list {} times; remove the ones not wanted first",
                            range.first, indexes.size()));
          }
          const DMXUniversePrefs* other = prefs.FindDMXUniverse(*renumber);
          if (other && *renumber != range.first) {
            throw CommandFailed(fmt::format("universe {} is already in the list", *renumber));
          }
        }
        int64_t channel = start.value_or(0);
        for (int32_t index : indexes) {
          DMXUniversePrefs& entry = prefs.DMXUniverse(index);
          Apply(steps, entry);
          if (renumber) entry.SetUniverse(*renumber);
          if (start) {
            entry.SetStartChannel(Saturated(channel));
            channel += entry.Size();
          }
        }
      },
      DMXUniversesTable);
}

void UniverseRemove(const Common& common, const UniverseOptions& o) {
  UniverseRange range = ParseUniverses(o.universes);
  ShowOrChange(
      common.file, true,
      [&](NetworkPreferences& prefs) {
        std::vector<int32_t> indexes = EntriesOf(prefs, range);
        std::sort(indexes.rbegin(), indexes.rend());
        for (int32_t index : indexes) prefs.RemoveDMXUniverse(index);
      },
      DMXUniversesTable, RangeCheck::kNone);
}

// --- x10, fennick, listener, output ---

struct X10Options {
  Option port, houseCodes;
};

void X10(const Common& common, const X10Options& o) {
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
      common.file, !steps.empty(), [&](T& prefs) { Apply(steps, prefs); }, X10Text);
}

struct FennickOptions {
  Option port, speed, stopBits, boards, channelsPerBoard, headerPerBank, clamp;
};

void Fennick(const Common& common, const FennickOptions& o) {
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
      common.file, !portStep.empty() || !steps.empty(),
      [&](NetworkPreferences& prefs) {
        Apply(portStep, prefs);
        Apply(steps, prefs.Fennick());
      },
      FennickText);
}

struct ListenerOptions {
  Option enabled, transport, universe, interface, firstSlot, slotCount, threshold, network, unit;
};

void Listener(const Common& common, const ListenerOptions& o) {
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
      common.file, !steps.empty(),
      [&](NetworkPreferences& prefs) { Apply(steps, prefs.Listener()); }, ListenerText);
}

struct OutputOptions {
  Option sourceName, ttl, syncUniverse, refreshRate, sourceCID;
};

void Output(const Common& common, const OutputOptions& o) {
  using T = NetworkPreferences;
  Steps<T> steps;
  AddText(steps, o.sourceName, &T::SetSourceName);
  AddLong(steps, o.ttl, "--ttl", &T::SetMulticastTTL);
  AddLong(steps, o.syncUniverse, "--sync-universe", &T::SetSyncUniverse);
  AddLong(steps, o.refreshRate, "--refresh-rate", &T::SetRefreshRate);
  AddText(steps, o.sourceCID, &T::SetSourceCID);
  ShowOrChange(
      common.file, !steps.empty(), [&](T& prefs) { Apply(steps, prefs); }, OutputText);
}

// --- registration ---

const char* kFooter =
    "Without options the command shows the values; with options it changes only those, saves "
    "and tells a running player (through the \"Ver\" value) to reopen the networks. A value "
    "out of range changes nothing. \"\" clears a text value.";

// Value names for --help, by option: what each option takes.
void NameValues(CLI::App* command) {
  static const std::vector<std::pair<std::string, const char*>> kNames = {
      {"port", "DEVICE"},
      {"speed", "BAUD"},
      {"old-mcp", "on|off"},
      {"enhanced", "on|off"},
      {"enabled", "on|off"},
      {"header-per-bank", "on|off"},
      {"clamp-special-values", "on|off"},
      {"transport", "NAME"},
      {"destination", "ADDRESS"},
      {"interface", "INTERFACE"},
      {"source-name", "TEXT"},
      {"source-cid", "UUID"},
      {"house-codes", "LETTERS"},
      {"file", "FILE"},
      {"UNIVERSES", "U|U1-U2"},
  };
  for (CLI::Option* option : command->get_options()) {
    if (option->get_type_name().empty()) continue;  // a flag
    std::string key = option->get_lnames().empty() ? option->get_name() : option->get_lnames()[0];
    const char* name = "N";
    for (const auto& [known, value] : kNames) {
      if (key == known) name = value;
    }
    option->type_name(name);
  }
  for (CLI::App* sub : command->get_subcommands({})) NameValues(sub);
}

void Register(CLI::App& app) {
  auto common = std::make_shared<Common>();
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
  tav->footer(kFooter);
  tav->callback([common, t] { TAV(*common, *t); });

  auto* universe = network->add_subcommand("universe", "List, add, change or remove DMX universes");
  universe->require_subcommand(1);
  auto* universeList = universe->add_subcommand("list", "Show the DMX universes");
  universeList->callback([common] {
    FileRegistryStore store = OpenSettingsStore(common->file);
    std::cout << DMXUniversesTable(Read(store));
  });
  const char* rangeHelp = "A universe number, or a range such as 1-16";
  auto addUniverseOptions = [](CLI::App* command, UniverseOptions& o) {
    command->add_option("--transport", o.transport, "E1.31 (default), ArtNet, USBPro or OpenDMX");
    command->add_option("--destination", o.destination,
                        "Unicast address or host name; \"\" = E1.31 multicast or Art-Net "
                        "broadcast (default)");
    command->add_option("--interface", o.interface,
                        "Network interface (eth0) or local address to send from; \"\" = the "
                        "system's choice (default)");
    command->add_option("--priority", o.priority, "E1.31 priority, 0 to 200 (default 100)");
    command->add_option("--start-channel", o.startChannel,
                        "Absolute channel of slot 1 in sequences, 1 to 16777216; a range takes "
                        "consecutive channels from here");
    command->add_option("--size", o.size, "Slots, 1 to 512 (default 512)");
    command->add_option("--port", o.port, "Serial device of a USBPro or OpenDMX widget");
    command->add_option("--enabled", o.enabled, "Send this universe: on (default) or off");
  };
  auto add = std::make_shared<UniverseOptions>();
  auto* universeAdd = universe->add_subcommand(
      "add",
      "Add universes; consecutive universes take consecutive channels, after the universes "
      "already in the list unless --start-channel says where");
  universeAdd->add_option("UNIVERSES", add->universes, rangeHelp)->required();
  addUniverseOptions(universeAdd, *add);
  universeAdd->footer("E1.31 universes are 1 to 63999, Art-Net port-addresses 0 to 32767.");
  universeAdd->callback([common, add] { UniverseAdd(*common, *add); });

  auto set = std::make_shared<UniverseOptions>();
  auto* universeSet =
      universe->add_subcommand("set", "Change universes already in the list (or show them)");
  universeSet->add_option("UNIVERSES", set->universes, rangeHelp)->required();
  addUniverseOptions(universeSet, *set);
  universeSet->add_option("--universe", set->renumber, "Give a single universe a new number");
  universeSet->footer(kFooter);
  universeSet->callback([common, set] { UniverseSet(*common, *set); });

  auto remove = std::make_shared<UniverseOptions>();
  auto* universeRemove = universe->add_subcommand("remove", "Remove universes from the list");
  universeRemove->add_option("UNIVERSES", remove->universes, rangeHelp)->required();
  universeRemove->callback([common, remove] { UniverseRemove(*common, *remove); });

  auto x = std::make_shared<X10Options>();
  auto* x10 = network->add_subcommand("x10", "Show or change the X10 network");
  x10->add_option("--port", x->port, "Serial device of the X10 interface, \"\" for none");
  x10->add_option("--house-codes", x->houseCodes,
                  "House codes in use, letters A to P, such as AC (\"\" = A)");
  x10->footer(kFooter);
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
  fennick->footer(kFooter);
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
  listener->footer(kFooter);
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
  output->footer(kFooter);
  output->callback([common, out] { Output(*common, *out); });
  NameValues(network);
}

}  // namespace

CommandGroup reg{"network", Register};

}  // namespace tav::showctl
