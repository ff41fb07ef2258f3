// showctl settings: read and change the settings file that the player and
// the rest of the suite share, and move settings to and from the registry
// export files of a Windows machine. Every change goes through the settings
// store's locked transactions, so the player and other programs may run
// meanwhile, and a refused command leaves the file exactly as it was.

#include <fmt/format.h>

#include <chrono>
#include <cstdio>
#include <fstream>
#include <iostream>
#include <memory>
#include <optional>
#include <sstream>

#include "ArgumentValues.h"
#include "CommandRegistry.h"
#include "SettingsStore.h"
#include "config/LibRegistry.h"
#include "config/RegistryFileFormat.h"
#include "config/Settings.h"
#include "platform/FileRegistryStore.h"

namespace tav::showctl {
namespace {

struct SettingsOptions {
  std::string file;  // settings file; empty: the usual location
  std::string name;
  std::optional<std::string> section;
  std::string value;
  std::string type;
  std::string path;  // import/export file, "-" for standard input/output
  bool utf16 = false;
  bool skipBadLines = false;
};

FileRegistryStore OpenStore(const SettingsOptions& o) {
  return OpenSettingsStore(o.file);
}

const SettingDescription* FindKnown(const std::string& name,
                                    const std::optional<std::string>& section) {
  for (const auto& s : KnownSettings()) {
    if (!RegistryDocument::SameName(s.name, name)) continue;
    if (section && !RegistryDocument::SameName(s.section, *section)) continue;
    return &s;
  }
  return nullptr;
}

// A known setting's section unless one was given; directly under Shared else.
std::string SectionOf(const SettingsOptions& o) {
  if (o.section) return *o.section;
  const SettingDescription* known = FindKnown(o.name, std::nullopt);
  return known ? std::string(known->section) : std::string();
}

std::string Describe(const RegistryValue& value) {
  switch (value.type) {
    case kRegSz:
    case kRegExpandSz:
      return value.data;
    case kRegDword:
      if (value.IsDword()) return std::to_string(static_cast<int32_t>(value.DwordValue()));
      break;
    default:
      break;
  }
  // Anything else as the export format writes its data.
  std::string line = FormatRegistryValueLine("", value);
  return line.substr(line.find('=') + 1);
}

// A value as the player reads it: a known boolean as true/false, a number
// in decimal, text as it is.
std::string Describe(const RegistryValue& value, const SettingDescription* known) {
  if (known && known->type == "boolean") {
    if (value.IsDword()) return value.DwordValue() != 0 ? "true" : "false";
  }
  return Describe(value);
}

void Get(const SettingsOptions& o) {
  FileRegistryStore store = OpenStore(o);
  std::string section = SectionOf(o);
  const SettingDescription* known = FindKnown(o.name, section);
  std::optional<RegistryValue> value = RegistryGetValue(store, SharedSettingsKey(section), o.name);
  if (value) {
    std::cout << Describe(*value, known) << "\n";
    return;
  }
  if (known) {
    std::cout << known->defaultText << "\n";
    return;
  }
  throw CommandFailed(
      fmt::format("no setting \"{}\" in section \"{}\" of {}", o.name, section, store.Path()));
}

void Set(const SettingsOptions& o) {
  std::string section = SectionOf(o);
  const SettingDescription* known = FindKnown(o.name, section);
  std::string type = o.type.empty() ? (known ? std::string(known->type) : "string") : o.type;
  if (known && type != known->type) {
    throw CommandFailed(fmt::format("{} is a {} setting, not a {}", o.name, known->type, type));
  }
  // Parse before touching the file: a bad value changes nothing.
  FileRegistryStore store = OpenStore(o);
  if (type == "boolean") {
    SetBooleanSetting(store, o.name, section, ParseBoolean(o.value));
  } else if (type == "long") {
    SetLongSetting(store, o.name, section, ParseLong(o.value));
  } else {
    SetStringSetting(store, o.name, section, o.value);
  }
  FinishWriting(store);
}

void ListKey(FileRegistryStore& store, const std::string& key, const std::string& prefix) {
  for (const auto& [name, value] : RegistryEnumValues(store, key)) {
    std::string section = prefix.empty() ? "(none)" : prefix;
    bool knownHere = FindKnown(name, prefix) != nullptr;
    if (!knownHere) {
      std::cout << fmt::format("{:<18} {:<32} {:<10} {}\n", section, name.empty() ? "@" : name,
                               RegistryValueTypeName(value.type), Describe(value));
    }
  }
  for (const auto& sub : RegistryEnumSubKeys(store, key)) {
    ListKey(store, key + "\\" + sub, prefix.empty() ? sub : prefix + "\\" + sub);
  }
}

void List(const SettingsOptions& o) {
  FileRegistryStore store = OpenStore(o);
  std::cout << "# " << store.Path() << "\n";
  std::cout << fmt::format("{:<18} {:<32} {:<10} {}\n", "SECTION", "NAME", "TYPE", "VALUE");
  for (const auto& s : KnownSettings()) {
    std::string section(s.section);
    auto value = RegistryGetValue(store, SharedSettingsKey(section), std::string(s.name));
    std::string shown = value ? Describe(*value, &s) : s.defaultText + " (default)";
    std::cout << fmt::format("{:<18} {:<32} {:<10} {}\n", section.empty() ? "(none)" : section,
                             s.name, s.type, shown);
  }
  // Then whatever else is stored below the shared key.
  if (RegistryKeyExists(store, SharedSettingsKey(""))) ListKey(store, SharedSettingsKey(""), "");
}

std::string ReadInput(const std::string& path) {
  std::stringstream bytes;
  if (path == "-") {
    bytes << std::cin.rdbuf();
  } else {
    std::ifstream in(path, std::ios::binary);
    if (!in) throw CommandFailed(fmt::format("cannot read {}", path));
    bytes << in.rdbuf();
  }
  return bytes.str();
}

void Import(const SettingsOptions& o) {
  RegistryFile file = ParseRegistryFile(ReadInput(o.path));
  if (file.version == RegistryFile::Version::None) {
    throw CommandFailed(
        fmt::format("{} is not a registry export file (it must start with \"{}\" or \"{}\")",
                    o.path, kRegistryHeader5, kRegistryHeader4));
  }
  for (const auto& problem : file.problems)
    std::cerr << "showctl: " << o.path << ": " << problem << "\n";
  if (!file.problems.empty() && !o.skipBadLines) {
    throw CommandFailed(
        fmt::format("{} has lines that cannot be read; nothing was imported "
                    "(--skip-bad-lines imports the rest)",
                    o.path));
  }
  // Only the current user's keys belong in the settings file.
  std::erase_if(file.lines, [&](const RegistryFileLine& line) {
    const std::string& key = line.key;
    bool userKey =
        key.empty() || RegistryDocument::SameName(key, RegistryDocument::kUserHive) ||
        (key.size() > RegistryDocument::kUserHive.size() &&
         RegistryDocument::SameName(key.substr(0, RegistryDocument::kUserHive.size() + 1),
                                    std::string(RegistryDocument::kUserHive) + "\\"));
    if (!userKey && line.kind == RegistryFileLine::Kind::Key) {
      std::cerr << "showctl: " << o.path << ": line " << line.lineNumber
                << ": skipped, not under HKEY_CURRENT_USER: " << key << "\n";
    }
    return !userKey;
  });
  size_t values = 0;
  for (const auto& line : file.lines) values += line.kind == RegistryFileLine::Kind::Value;
  FileRegistryStore store = OpenStore(o);
  int32_t status = store.Update([&](RegistryDocument& document) {
    ApplyRegistryFile(file, document, /*keepVerbatim=*/false);
    return kRegistryOk;
  });
  if (status != kRegistryOk) {
    throw CommandFailed(fmt::format("could not write {}; it was left unchanged", store.Path()));
  }
  FinishWriting(store);
  std::cout << fmt::format("imported {} value{} into {}\n", values, values == 1 ? "" : "s",
                           store.Path());
}

void Export(const SettingsOptions& o) {
  FileRegistryStore store = OpenStore(o);
  const RegistryDocument* content = store.Content();
  if (!content) throw CommandFailed(fmt::format("cannot read {}", store.Path()));
  std::string bytes = FormatRegistryFile(
      *content, o.utf16 ? RegistryFileEncoding::Utf16WithMark : RegistryFileEncoding::Utf8);
  if (o.path.empty() || o.path == "-") {
    std::cout << bytes;
    return;
  }
  // Written beside the target and renamed, so a failed export never leaves
  // half a file where a good one was.
  std::string temp = o.path + ".part";
  {
    std::ofstream out(temp, std::ios::binary | std::ios::trunc);
    out << bytes;
    out.flush();
    if (!out) {
      std::remove(temp.c_str());
      throw CommandFailed(fmt::format("cannot write {}", o.path));
    }
  }
  if (std::rename(temp.c_str(), o.path.c_str()) != 0) {
    std::remove(temp.c_str());
    throw CommandFailed(fmt::format("cannot write {}", o.path));
  }
}

void Register(CLI::App& app) {
  auto o = std::make_shared<SettingsOptions>();
  auto* settings =
      app.add_subcommand("settings",
                         "Read and change the settings file shared by the player and the suite\n"
                         "("
                         "$TAV_REGISTRY_FILE, else $XDG_CONFIG_HOME/tessavar/registry.reg)");
  settings->require_subcommand(1);
  settings->add_option("--file", o->file, "Settings file to work on instead of the usual one");

  auto sectionHelp =
      "Section below Software\\Tessavar\\Shared (default: the known setting's own section, "
      "else the Shared key itself; \"\" for the Shared key)";

  auto* get = settings->add_subcommand("get", "Print a setting's value (its default if unset)");
  get->add_option("name", o->name, "Value name, e.g. MonitorRestart")->required();
  get->add_option("-s,--section", o->section, sectionHelp);
  get->callback([o] { Get(*o); });

  auto* set = settings->add_subcommand("set", "Change a setting (creates its key if needed)");
  set->add_option("name", o->name, "Value name, e.g. MonitorRestart")->required();
  set->add_option("value", o->value, "New value: true/false, a whole number, or text")->required();
  set->add_option("-s,--section", o->section, sectionHelp);
  set->add_option("-t,--type", o->type,
                  "Type for a setting the player does not know (default: string)")
      ->check(CLI::IsMember({"boolean", "long", "string"}));
  set->callback([o] { Set(*o); });

  auto* list = settings->add_subcommand(
      "list", "List every setting the player reads, then any other stored values");
  list->callback([o] { List(*o); });

  auto* importCmd = settings->add_subcommand(
      "import",
      "Merge a registry export file (Windows 5.00 in UTF-16 or UTF-8, or REGEDIT4) into the "
      "settings; nothing changes if it has unreadable lines");
  importCmd->add_option("file", o->path, "Export file to read, - for standard input")->required();
  importCmd->add_flag("--skip-bad-lines", o->skipBadLines,
                      "Import the readable lines even if others cannot be read");
  importCmd->callback([o] { Import(*o); });

  auto* exportCmd = settings->add_subcommand(
      "export", "Write the settings as a registry export file (to standard output by default)");
  exportCmd->add_option("file", o->path, "File to write, - for standard output");
  exportCmd->add_flag("--utf16", o->utf16,
                      "Write UTF-16 with a byte-order mark, as Windows' registry editor expects");
  exportCmd->callback([o] { Export(*o); });
}

}  // namespace

static CommandGroup reg{"settings", Register};

}  // namespace tav::showctl
