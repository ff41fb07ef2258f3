#pragma once
// The content of a registry export file held in memory: keys as sections in
// file order, each with its entries in order. Entries are values or lines
// kept verbatim (comments, lines that could not be read), so that writing the
// document back loses nothing the program does not understand. Keys of other
// hives are kept the same way, though the primitives reach only
// HKEY_CURRENT_USER.
//
// It answers the RegistryStore primitives with the registry's status codes;
// the in-memory store and the Unix file store are thin layers on top. A key
// exists when it has a section or some key below it has one, as when the
// platform's editor imports a file. Names compare without letter case.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "config/RegistryStore.h"

namespace tav {

class RegistryDocument {
 public:
  static constexpr std::string_view kUserHive = "HKEY_CURRENT_USER";

  struct Entry {
    // A value when `verbatim` is empty; otherwise a line kept as it was.
    std::string name;
    RegistryValue value;
    std::string verbatim;
  };
  struct Section {
    std::string path;  // full path as written, hive first
    std::vector<Entry> entries;
  };

  // Lines before the first section other than the header (comments).
  std::vector<std::string>& Preamble() { return m_preamble; }
  const std::vector<std::string>& Preamble() const { return m_preamble; }
  const std::vector<Section>& Sections() const { return m_sections; }

  // Full-path operations, as an import file applies them.
  // A new section goes at the end with `inFileOrder` (reading a file keeps
  // its order), else after its parent and earlier siblings.
  Section& EnsureSection(std::string_view fullPath, bool inFileOrder = false);
  void RemoveKeyTree(std::string_view fullPath);
  void SetValueAt(std::string_view fullPath, std::string_view name, const RegistryValue& value);
  void RemoveValueAt(std::string_view fullPath, std::string_view name);
  void AddVerbatimAt(std::string_view fullPath, std::string verbatim);

  // The primitives; `key` is relative to HKEY_CURRENT_USER.
  int32_t OpenKey(std::string_view key) const;
  int32_t CreateKey(std::string_view key);
  int32_t QueryValue(std::string_view key, std::string_view name, RegistryValue& value) const;
  int32_t SetValue(std::string_view key, std::string_view name, const RegistryValue& value);
  int32_t DeleteValue(std::string_view key, std::string_view name);
  int32_t DeleteKey(std::string_view key);
  int32_t EnumSubKeys(std::string_view key, std::vector<std::string>& names) const;
  int32_t EnumValues(std::string_view key, std::vector<NamedRegistryValue>& values) const;
  int32_t QueryKeyInfo(std::string_view key, RegistryKeyInfo& info) const;

  // "HKEY_CURRENT_USER" + "\" + key (the hive alone for an empty key).
  static std::string UserPath(std::string_view key);
  // Letter-case-insensitive comparison of key paths and value names.
  static bool SameName(std::string_view a, std::string_view b);

  friend bool operator==(const RegistryDocument& a, const RegistryDocument& b);

 private:
  Section* FindSection(std::string_view fullPath);
  const Section* FindSection(std::string_view fullPath) const;
  bool KeyExists(std::string_view fullPath) const;
  bool HasSubKeys(std::string_view fullPath) const;

  std::vector<std::string> m_preamble;
  std::vector<Section> m_sections;
};

bool operator==(const RegistryDocument::Entry& a, const RegistryDocument::Entry& b);
bool operator==(const RegistryDocument::Section& a, const RegistryDocument::Section& b);

}  // namespace tav
