#include "NetworkUniverseCommands.h"

#include <fmt/format.h>

#include <algorithm>
#include <iostream>
#include <limits>

#include "NetworkView.h"
#include "SettingsStore.h"

namespace tav::showctl {
namespace {

// A range typed by mistake ("1-60000") would fill the settings file.
constexpr int64_t kMaxUniversesAtOnce = 1024;

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

void UniverseAdd(const NetworkCommon& common, const UniverseOptions& o) {
  UniverseRange range = ParseUniverses(o.universes);
  Steps<DMXUniversePrefs> steps = UniverseSteps(o);
  std::optional<int32_t> start = StartChannel(o);
  ShowOrChange(
      common, true,
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

void UniverseSet(const NetworkCommon& common, const UniverseOptions& o) {
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
      common, change,
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

void UniverseRemove(const NetworkCommon& common, const UniverseOptions& o) {
  UniverseRange range = ParseUniverses(o.universes);
  ShowOrChange(
      common, true,
      [&](NetworkPreferences& prefs) {
        std::vector<int32_t> indexes = EntriesOf(prefs, range);
        std::sort(indexes.rbegin(), indexes.rend());
        for (int32_t index : indexes) prefs.RemoveDMXUniverse(index);
      },
      DMXUniversesTable, RangeCheck::kNone);
}

}  // namespace

void AddUniverseCommands(CLI::App& network, const std::shared_ptr<NetworkCommon>& common) {
  auto* universe = network.add_subcommand("universe", "List, add, change or remove DMX universes");
  universe->require_subcommand(1);
  auto* universeList = universe->add_subcommand("list", "Show the DMX universes");
  universeList->callback([common] {
    FileRegistryStore store = OpenSettingsStore(common->file);
    std::cout << DMXUniversesTable(ReadAndWarn(store));
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
  universeSet->footer(kNetworkFooter);
  universeSet->callback([common, set] { UniverseSet(*common, *set); });

  auto remove = std::make_shared<UniverseOptions>();
  auto* universeRemove = universe->add_subcommand("remove", "Remove universes from the list");
  universeRemove->add_option("UNIVERSES", remove->universes, rangeHelp)->required();
  universeRemove->callback([common, remove] { UniverseRemove(*common, *remove); });
}

}  // namespace tav::showctl
