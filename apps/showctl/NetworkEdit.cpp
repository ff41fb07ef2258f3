#include "NetworkEdit.h"

#include <fmt/format.h>

#include <algorithm>
#include <cctype>
#include <cstdlib>

#include "CommandRegistry.h"
#include "SettingsStore.h"
#include "config/MemoryRegistryStore.h"

namespace tav::showctl {
namespace {

// What the transaction answers when there is nothing to write: the store
// then leaves the file alone.
constexpr int32_t kNothingToWrite = -1;

// sACN's source name field holds 64 bytes with the terminating zero.
constexpr size_t kMaxSourceNameBytes = 63;

// 8-4-4-4-12 hexadecimal digits, with or without braces.
bool IsUuid(std::string text) {
  if (text.size() == 38 && text.front() == '{' && text.back() == '}') {
    text = text.substr(1, 36);
  }
  if (text.size() != 36) return false;
  for (size_t i = 0; i < text.size(); ++i) {
    bool dash = i == 8 || i == 13 || i == 18 || i == 23;
    if (dash ? text[i] != '-' : !std::isxdigit(static_cast<unsigned char>(text[i]))) return false;
  }
  return true;
}

// Lines of `after` that `before` does not have, each counted as often as it
// occurs more.
std::vector<std::string> NewLines(std::vector<std::string> before, std::vector<std::string> after) {
  std::vector<std::string> added;
  for (auto& line : after) {
    auto found = std::find(before.begin(), before.end(), line);
    if (found == before.end()) {
      added.push_back(std::move(line));
    } else {
      before.erase(found);
    }
  }
  return added;
}

// "DMX universe entry 3 size ..." names the list position; people know
// their universes by number: "DMX universe 20 size ...".
std::string ByUniverseNumber(const NetworkPreferences& prefs, const std::string& line) {
  static const std::string kPrefix = "DMX universe entry ";
  if (line.rfind(kPrefix, 0) != 0) return line;
  size_t end = line.find(' ', kPrefix.size());
  int32_t entry = std::atoi(line.substr(kPrefix.size(), end - kPrefix.size()).c_str());
  if (entry < 1 || entry > prefs.DMXUniverseCount() || end == std::string::npos) return line;
  return fmt::format("DMX universe {}{}", prefs.DMXUniverse(entry - 1).Universe(),
                     line.substr(end));
}

std::string Joined(const std::vector<std::string>& lines) {
  std::string text;
  for (const auto& line : lines) text += (text.empty() ? "" : "; ") + line;
  return text;
}

}  // namespace

std::vector<std::string> OutOfRange(const NetworkPreferences& prefs) {
  NetworkPreferences checked = prefs;
  checked.Listener().SetEnabled(true);
  std::vector<std::string> lines;
  for (const auto& line : checked.Validate()) lines.push_back(ByUniverseNumber(prefs, line));
  if (prefs.SourceName().size() > kMaxSourceNameBytes) {
    lines.push_back(fmt::format("source name is {} bytes long, longer than {}",
                                prefs.SourceName().size(), kMaxSourceNameBytes));
  }
  if (!prefs.SourceCID().empty() && !IsUuid(prefs.SourceCID())) {
    lines.push_back(
        fmt::format("source CID \"{}\" is not a UUID (8-4-4-4-12 hex digits)", prefs.SourceCID()));
  }
  DMXTransport listened = prefs.Listener().Transport();
  if (listened != DMXTransport::kE131 && listened != DMXTransport::kArtNet) {
    lines.push_back(fmt::format("listener transport is {}; it receives E1.31 or ArtNet only",
                                DMXTransportName(listened)));
  }
  return lines;
}

NetworkEditResult EditNetworkPreferences(FileRegistryStore& store,
                                         const std::function<void(NetworkPreferences&)>& change,
                                         RangeCheck check) {
  NetworkEditResult result;
  int32_t status = store.Update([&](RegistryDocument& document) {
    // The preferences read and write through the registry primitives; a
    // copy of the locked document lets them do so inside the transaction.
    MemoryRegistryStore working;
    working.Document() = document;
    NetworkPreferences before;
    before.InitFromRegistry(working);
    result.problems = before.Problems();
    result.prefs = before;
    change(result.prefs);
    if (check == RangeCheck::kNewValues) {
      std::vector<std::string> added = NewLines(OutOfRange(before), OutOfRange(result.prefs));
      if (!added.empty()) throw CommandFailed(Joined(added) + "; nothing was changed");
    }
    result.changed = result.prefs.DiffersFrom(before);
    if (!result.changed) return kNothingToWrite;
    result.prefs.SaveToRegistry(working);
    NetworkPreferences::BumpVersion(working);
    document = working.Document();
    return kRegistryOk;
  });
  if (status != kRegistryOk && status != kNothingToWrite) {
    throw CommandFailed(fmt::format("could not write {}; it was left unchanged", store.Path()));
  }
  FinishWriting(store);
  return result;
}

}  // namespace tav::showctl
