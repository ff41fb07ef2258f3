#pragma once
// Registry access for the whole program: the key names of the suite, the
// registry primitives, which turn a failing call into an error naming it
// ("RegOpenKeyEx failure" and so on, numbered with the registry's status
// code), and the typed setting getters and setters every other part uses.
//
// A setting is addressed by (value name, section) below
// HKEY_CURRENT_USER\Software\Tessavar\Shared\<section>; an empty section
// means the Shared key itself. Getters return the caller's default when the
// key or value is missing and never create anything; setters create the key
// when it is missing. Nothing is cached: each call reads through the store.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "config/RegistryStore.h"

namespace tav {

inline constexpr std::string_view kSuiteRootKey = "Software\\Tessavar";
inline constexpr std::string_view kSharedKeyName = "Shared";

// kSuiteRootKey, with "\" + subKey appended when subKey is not empty.
std::string SuiteKey(std::string_view subKey);
// The key of a settings section: Software\Tessavar\Shared[\section].
std::string SharedSettingsKey(std::string_view section);

// "REG_SZ", "REG_DWORD", ...; "Unknown (" + type + ")" for other numbers.
std::string RegistryValueTypeName(uint32_t type);

// The primitives. Each fails with tav::Error(status, "LibRegistry.<name>",
// text of the failing call).
bool RegistryKeyExists(RegistryStore& store, const std::string& key);  // "RegOpenKeyEx failure"
void RegistryCreateKey(RegistryStore& store, const std::string& key);  // "RegCreateKeyEx failure"
// Size in bytes, or nothing when the key or value is missing.
// "RegQueryValueEx failure (length)".
std::optional<uint32_t> RegistryQueryValueLength(RegistryStore& store, const std::string& key,
                                                 const std::string& name, uint32_t* type = nullptr);
RegistryValue RegistryQueryValue(RegistryStore& store, const std::string& key,
                                 const std::string& name);  // "RegQueryValueEx failure"
void RegistrySetValue(RegistryStore& store, const std::string& key, const std::string& name,
                      const RegistryValue& value);  // "RegSetValueEx failure"
void RegistryDeleteValue(RegistryStore& store, const std::string& key,
                         const std::string& name);  // "RegDeleteValue failure"
// Deletes the key with all its sub-keys, deepest first. "RegDeleteKey failure".
void RegistryDeleteKey(RegistryStore& store, const std::string& key);
// "Error getting registry value" when the listing fails.
std::vector<std::string> RegistryEnumSubKeys(RegistryStore& store, const std::string& key);
std::vector<NamedRegistryValue> RegistryEnumValues(RegistryStore& store, const std::string& key);
RegistryKeyInfo RegistryQueryKeyInfo(RegistryStore& store, const std::string& key);

// The value as stored, of whatever type, if both key and value exist.
std::optional<RegistryValue> RegistryGetStoredValue(RegistryStore& store, const std::string& key,
                                                    const std::string& name);
// The value if both key and value exist. A value that is neither text nor a
// 32-bit number fails with "Error getting registry value".
std::optional<RegistryValue> RegistryGetValue(RegistryStore& store, const std::string& key,
                                              const std::string& name);

// A stored value read as a setting of each type. A value of another type
// fails with "Error getting registry value" (87); numbers read from text (a
// hand-edited file) convert as the platform converts text to numbers,
// failing with the type-mismatch (13) or overflow (6) error; booleans also
// accept "True" and "False"; a number read as a string is its decimal text.
bool BooleanSettingOf(const RegistryValue& value);
int32_t LongSettingOf(const RegistryValue& value);
std::string StringSettingOf(const RegistryValue& value);

// Typed settings: the default when the key or value is missing, else the
// stored value read as above (failing as above). Failures of the registry
// itself raise the primitives' errors.
bool GetBooleanSetting(RegistryStore& store, const std::string& szValueName,
                       const std::string& szSection, bool boolDefault);
int32_t GetLongSetting(RegistryStore& store, const std::string& szValueName,
                       const std::string& szSection, int32_t lDefault);
std::string GetStringSetting(RegistryStore& store, const std::string& szValueName,
                             const std::string& szSection, const std::string& szDefault);
// Booleans are stored as the numbers 1 and 0.
void SetBooleanSetting(RegistryStore& store, const std::string& szValueName,
                       const std::string& szSection, bool boolValue);
void SetLongSetting(RegistryStore& store, const std::string& szValueName,
                    const std::string& szSection, int32_t lValue);
void SetStringSetting(RegistryStore& store, const std::string& szValueName,
                      const std::string& szSection, const std::string& szValue);

}  // namespace tav
