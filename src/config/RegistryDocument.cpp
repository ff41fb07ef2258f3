#include "config/RegistryDocument.h"

#include <algorithm>
#include <cctype>
#include <iterator>

namespace tav {

namespace {

char Lower(char c) {
  return static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
}

// True when `path` lies strictly below `ancestor`; gives the remainder.
bool IsBelow(std::string_view path, std::string_view ancestor, std::string_view* rest = nullptr) {
  if (path.size() <= ancestor.size() + 1 || path[ancestor.size()] != '\\') return false;
  if (!RegistryDocument::SameName(path.substr(0, ancestor.size()), ancestor)) return false;
  if (rest) *rest = path.substr(ancestor.size() + 1);
  return true;
}

// Orders paths so that a parent comes right before its children.
bool PathLess(std::string_view a, std::string_view b) {
  size_t n = std::min(a.size(), b.size());
  for (size_t i = 0; i < n; ++i) {
    if (a[i] == b[i]) continue;
    char x = a[i] == '\\' ? '\0' : Lower(a[i]);
    char y = b[i] == '\\' ? '\0' : Lower(b[i]);
    if (x != y) return x < y;
  }
  return a.size() < b.size();
}

std::string_view TrimSeparators(std::string_view key) {
  while (!key.empty() && key.front() == '\\') key.remove_prefix(1);
  while (!key.empty() && key.back() == '\\') key.remove_suffix(1);
  return key;
}

}  // namespace

bool RegistryDocument::SameName(std::string_view a, std::string_view b) {
  // From the end, where sibling keys differ ("...\DMX\17"), and bytes that
  // are equal need no case folding: a document of a thousand keys is
  // searched often while the network preferences load.
  return a.size() == b.size() && std::equal(a.rbegin(), a.rend(), b.rbegin(), [](char x, char y) {
           return x == y || Lower(x) == Lower(y);
         });
}

std::string RegistryDocument::UserPath(std::string_view key) {
  key = TrimSeparators(key);
  std::string path(kUserHive);
  if (!key.empty()) {
    path += '\\';
    path += key;
  }
  return path;
}

RegistryDocument::Section* RegistryDocument::FindSection(std::string_view fullPath) {
  for (auto& section : m_sections) {
    if (SameName(section.path, fullPath)) return &section;
  }
  return nullptr;
}

const RegistryDocument::Section* RegistryDocument::FindSection(std::string_view fullPath) const {
  return const_cast<RegistryDocument*>(this)->FindSection(fullPath);
}

bool RegistryDocument::HasSubKeys(std::string_view fullPath) const {
  return std::any_of(m_sections.begin(), m_sections.end(),
                     [&](const Section& s) { return IsBelow(s.path, fullPath); });
}

bool RegistryDocument::KeyExists(std::string_view fullPath) const {
  // The hive itself always exists.
  if (SameName(fullPath, kUserHive)) return true;
  return FindSection(fullPath) != nullptr || HasSubKeys(fullPath);
}

RegistryDocument::Section& RegistryDocument::EnsureSection(std::string_view fullPath,
                                                           bool inFileOrder) {
  if (Section* existing = FindSection(fullPath)) return *existing;
  Section section{std::string(fullPath), {}};
  if (inFileOrder) return m_sections.emplace_back(std::move(section));
  // After the last section that sorts before it: in a file in the editor's
  // order that is its place in that order, and in any other file it still
  // lands after its parent and earlier siblings rather than among strangers.
  auto at = m_sections.end();
  while (at != m_sections.begin() && !PathLess(std::prev(at)->path, fullPath)) --at;
  return *m_sections.insert(at, std::move(section));
}

void RegistryDocument::RemoveKeyTree(std::string_view fullPath) {
  std::string path(fullPath);
  std::erase_if(m_sections,
                [&](const Section& s) { return SameName(s.path, path) || IsBelow(s.path, path); });
}

void RegistryDocument::SetValueAt(std::string_view fullPath, std::string_view name,
                                  const RegistryValue& value) {
  Section& section = EnsureSection(fullPath);
  for (auto& entry : section.entries) {
    if (entry.verbatim.empty() && SameName(entry.name, name)) {
      entry.value = value;
      return;
    }
  }
  section.entries.push_back(Entry{std::string(name), value, {}});
}

void RegistryDocument::RemoveValueAt(std::string_view fullPath, std::string_view name) {
  if (Section* section = FindSection(fullPath)) {
    std::erase_if(section->entries,
                  [&](const Entry& e) { return e.verbatim.empty() && SameName(e.name, name); });
  }
}

void RegistryDocument::AddVerbatimAt(std::string_view fullPath, std::string verbatim) {
  EnsureSection(fullPath).entries.push_back(Entry{{}, {}, std::move(verbatim)});
}

int32_t RegistryDocument::OpenKey(std::string_view key) const {
  return KeyExists(UserPath(key)) ? kRegistryOk : kRegistryNotFound;
}

int32_t RegistryDocument::CreateKey(std::string_view key) {
  std::string path = UserPath(key);
  if (!KeyExists(path)) EnsureSection(path);
  return kRegistryOk;
}

int32_t RegistryDocument::QueryValue(std::string_view key, std::string_view name,
                                     RegistryValue& value) const {
  const Section* section = FindSection(UserPath(key));
  if (!section) return kRegistryNotFound;
  for (const auto& entry : section->entries) {
    if (entry.verbatim.empty() && SameName(entry.name, name)) {
      value = entry.value;
      return kRegistryOk;
    }
  }
  return kRegistryNotFound;
}

int32_t RegistryDocument::SetValue(std::string_view key, std::string_view name,
                                   const RegistryValue& value) {
  std::string path = UserPath(key);
  if (!KeyExists(path)) return kRegistryNotFound;
  SetValueAt(path, name, value);
  return kRegistryOk;
}

int32_t RegistryDocument::DeleteValue(std::string_view key, std::string_view name) {
  RegistryValue ignored;
  if (QueryValue(key, name, ignored) != kRegistryOk) return kRegistryNotFound;
  RemoveValueAt(UserPath(key), name);
  return kRegistryOk;
}

int32_t RegistryDocument::DeleteKey(std::string_view key) {
  std::string path = UserPath(key);
  if (SameName(path, kUserHive)) return kRegistryAccessDenied;
  if (!KeyExists(path)) return kRegistryNotFound;
  if (HasSubKeys(path)) return kRegistryAccessDenied;
  // The parent may exist only through this key; it must outlive it.
  std::string parent = path.substr(0, path.rfind('\\'));
  if (!SameName(parent, kUserHive)) EnsureSection(parent);
  RemoveKeyTree(path);
  return kRegistryOk;
}

int32_t RegistryDocument::EnumSubKeys(std::string_view key, std::vector<std::string>& names) const {
  std::string path = UserPath(key);
  if (!KeyExists(path)) return kRegistryNotFound;
  names.clear();
  for (const auto& section : m_sections) {
    std::string_view rest;
    if (!IsBelow(section.path, path, &rest)) continue;
    std::string_view child = rest.substr(0, rest.find('\\'));
    bool known = std::any_of(names.begin(), names.end(),
                             [&](const std::string& n) { return SameName(n, child); });
    if (!known && !child.empty()) names.emplace_back(child);
  }
  return kRegistryOk;
}

int32_t RegistryDocument::EnumValues(std::string_view key,
                                     std::vector<NamedRegistryValue>& values) const {
  std::string path = UserPath(key);
  if (!KeyExists(path)) return kRegistryNotFound;
  values.clear();
  if (const Section* section = FindSection(path)) {
    for (const auto& entry : section->entries) {
      if (entry.verbatim.empty()) values.emplace_back(entry.name, entry.value);
    }
  }
  return kRegistryOk;
}

int32_t RegistryDocument::QueryKeyInfo(std::string_view key, RegistryKeyInfo& info) const {
  std::vector<std::string> subKeys;
  std::vector<NamedRegistryValue> values;
  if (int32_t status = EnumSubKeys(key, subKeys); status != kRegistryOk) return status;
  EnumValues(key, values);
  info = RegistryKeyInfo{};
  info.subKeyCount = static_cast<uint32_t>(subKeys.size());
  for (const auto& name : subKeys) {
    info.maxSubKeyLength = std::max(info.maxSubKeyLength, static_cast<uint32_t>(name.size()));
  }
  info.valueCount = static_cast<uint32_t>(values.size());
  for (const auto& [name, value] : values) {
    info.maxValueNameLength = std::max(info.maxValueNameLength, static_cast<uint32_t>(name.size()));
    info.maxValueLength = std::max(info.maxValueLength, value.StoredLength());
  }
  return kRegistryOk;
}

bool operator==(const RegistryDocument::Entry& a, const RegistryDocument::Entry& b) {
  return a.name == b.name && a.value == b.value && a.verbatim == b.verbatim;
}

bool operator==(const RegistryDocument::Section& a, const RegistryDocument::Section& b) {
  return a.path == b.path && a.entries == b.entries;
}

bool operator==(const RegistryDocument& a, const RegistryDocument& b) {
  return a.m_preamble == b.m_preamble && a.m_sections == b.m_sections;
}

}  // namespace tav
