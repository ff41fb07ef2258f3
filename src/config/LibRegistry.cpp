#include "config/LibRegistry.h"

#include <cctype>

#include "support/Error.h"
#include "support/Numbers.h"

namespace tav {

namespace {

constexpr const char* kOpenFailure = "RegOpenKeyEx failure";
constexpr const char* kCreateFailure = "RegCreateKeyEx failure";
constexpr const char* kQueryLengthFailure = "RegQueryValueEx failure (length)";
constexpr const char* kQueryFailure = "RegQueryValueEx failure";
constexpr const char* kSetFailure = "RegSetValueEx failure";
constexpr const char* kDeleteValueFailure = "RegDeleteValue failure";
constexpr const char* kDeleteKeyFailure = "RegDeleteKey failure";
constexpr const char* kGetValueFailure = "Error getting registry value";

void Check(int32_t status, const char* procedure, const char* text) {
  if (status != kRegistryOk) throw Error(status, std::string("LibRegistry.") + procedure, text);
}

std::string Upper(std::string_view text) {
  std::string out(text);
  for (char& c : out) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  return out;
}

std::string Trim(std::string_view text) {
  while (!text.empty() && (text.front() == ' ' || text.front() == '\t')) text.remove_prefix(1);
  while (!text.empty() && (text.back() == ' ' || text.back() == '\t')) text.remove_suffix(1);
  return std::string(text);
}

int32_t NumberFromText(const std::string& text, const char* procedure) {
  std::optional<double> number = ParseNumber(text);
  if (!number) throw errors::TypeMismatch(std::string("LibRegistry.") + procedure);
  return ToInt32(*number);
}

bool IsText(const RegistryValue& value) {
  return value.type == kRegSz || value.type == kRegExpandSz;
}

// Settings are text or 32-bit numbers; anything else cannot be read as one.
void CheckReadable(const RegistryValue& value) {
  if (!IsText(value) && !value.IsDword()) {
    throw Error(kRegistryInvalidParameter, "LibRegistry.RegistryGetValue", kGetValueFailure);
  }
}

}  // namespace

std::string SuiteKey(std::string_view subKey) {
  std::string key(kSuiteRootKey);
  if (!subKey.empty()) {
    key += '\\';
    key += subKey;
  }
  return key;
}

std::string SharedSettingsKey(std::string_view section) {
  std::string key = SuiteKey(kSharedKeyName);
  if (!section.empty()) {
    key += '\\';
    key += section;
  }
  return key;
}

std::string RegistryValueTypeName(uint32_t type) {
  switch (type) {
    case kRegBinary:
      return "REG_BINARY";
    case kRegDword:
      return "REG_DWORD";
    case kRegDwordBigEndian:
      return "REG_DWORD_BIG_ENDIAN";
    case kRegExpandSz:
      return "REG_EXPAND_SZ";
    case kRegLink:
      return "REG_LINK";
    case kRegMultiSz:
      return "REG_MULTI_SZ";
    case kRegNone:
      return "REG_NONE";
    case kRegQword:
      return "REG_QWORD";
    case kRegSz:
      return "REG_SZ";
    default:
      return "Unknown (" + std::to_string(type) + ")";
  }
}

bool RegistryKeyExists(RegistryStore& store, const std::string& key) {
  int32_t status = store.OpenKey(key);
  if (status == kRegistryNotFound) return false;
  Check(status, "RegistryKeyExists", kOpenFailure);
  return true;
}

void RegistryCreateKey(RegistryStore& store, const std::string& key) {
  Check(store.CreateKey(key), "RegistryCreateKey", kCreateFailure);
}

std::optional<uint32_t> RegistryQueryValueLength(RegistryStore& store, const std::string& key,
                                                 const std::string& name, uint32_t* type) {
  uint32_t valueType = kRegNone, length = 0;
  int32_t status = store.QueryValueInfo(key, name, valueType, length);
  if (status == kRegistryNotFound) return std::nullopt;
  Check(status, "RegistryQueryValueLength", kQueryLengthFailure);
  if (type) *type = valueType;
  return length;
}

RegistryValue RegistryQueryValue(RegistryStore& store, const std::string& key,
                                 const std::string& name) {
  RegistryValue value;
  Check(store.QueryValue(key, name, value), "RegistryQueryValue", kQueryFailure);
  return value;
}

void RegistrySetValue(RegistryStore& store, const std::string& key, const std::string& name,
                      const RegistryValue& value) {
  Check(store.SetValue(key, name, value), "RegistrySetValue", kSetFailure);
}

void RegistryDeleteValue(RegistryStore& store, const std::string& key, const std::string& name) {
  Check(store.DeleteValue(key, name), "RegistryDeleteValue", kDeleteValueFailure);
}

void RegistryDeleteKey(RegistryStore& store, const std::string& key) {
  Check(store.OpenKey(key), "RegistryDeleteKey", kOpenFailure);
  // The registry deletes only keys without sub-keys, so go deepest first.
  for (const auto& subKey : RegistryEnumSubKeys(store, key)) {
    RegistryDeleteKey(store, key + "\\" + subKey);
  }
  Check(store.DeleteKey(key), "RegistryDeleteKey", kDeleteKeyFailure);
}

std::vector<std::string> RegistryEnumSubKeys(RegistryStore& store, const std::string& key) {
  std::vector<std::string> names;
  Check(store.EnumSubKeys(key, names), "RegistryEnumSubKeys", kGetValueFailure);
  return names;
}

std::vector<NamedRegistryValue> RegistryEnumValues(RegistryStore& store, const std::string& key) {
  std::vector<NamedRegistryValue> values;
  Check(store.EnumValues(key, values), "RegistryEnumValues", kGetValueFailure);
  return values;
}

RegistryKeyInfo RegistryQueryKeyInfo(RegistryStore& store, const std::string& key) {
  RegistryKeyInfo info;
  Check(store.QueryKeyInfo(key, info), "RegistryQueryKeyInfo", kGetValueFailure);
  return info;
}

std::optional<RegistryValue> RegistryGetStoredValue(RegistryStore& store, const std::string& key,
                                                    const std::string& name) {
  if (!RegistryKeyExists(store, key)) return std::nullopt;
  if (!RegistryQueryValueLength(store, key, name)) return std::nullopt;
  return RegistryQueryValue(store, key, name);
}

std::optional<RegistryValue> RegistryGetValue(RegistryStore& store, const std::string& key,
                                              const std::string& name) {
  std::optional<RegistryValue> value = RegistryGetStoredValue(store, key, name);
  if (value) CheckReadable(*value);
  return value;
}

bool BooleanSettingOf(const RegistryValue& value) {
  CheckReadable(value);
  if (value.IsDword()) return value.DwordValue() != 0;
  std::string text = Upper(Trim(value.data));
  if (text == "TRUE") return true;
  if (text == "FALSE") return false;
  return NumberFromText(text, "GetBooleanSetting") != 0;
}

int32_t LongSettingOf(const RegistryValue& value) {
  CheckReadable(value);
  if (value.IsDword()) return static_cast<int32_t>(value.DwordValue());
  return NumberFromText(value.data, "GetLongSetting");
}

std::string StringSettingOf(const RegistryValue& value) {
  CheckReadable(value);
  if (value.IsDword()) return std::to_string(static_cast<int32_t>(value.DwordValue()));
  return value.data;
}

bool GetBooleanSetting(RegistryStore& store, const std::string& szValueName,
                       const std::string& szSection, bool boolDefault) {
  auto value = RegistryGetStoredValue(store, SharedSettingsKey(szSection), szValueName);
  return value ? BooleanSettingOf(*value) : boolDefault;
}

int32_t GetLongSetting(RegistryStore& store, const std::string& szValueName,
                       const std::string& szSection, int32_t lDefault) {
  auto value = RegistryGetStoredValue(store, SharedSettingsKey(szSection), szValueName);
  return value ? LongSettingOf(*value) : lDefault;
}

std::string GetStringSetting(RegistryStore& store, const std::string& szValueName,
                             const std::string& szSection, const std::string& szDefault) {
  auto value = RegistryGetStoredValue(store, SharedSettingsKey(szSection), szValueName);
  return value ? StringSettingOf(*value) : szDefault;
}

namespace {
void SetSetting(RegistryStore& store, const std::string& szValueName, const std::string& szSection,
                const RegistryValue& value) {
  std::string key = SharedSettingsKey(szSection);
  RegistryCreateKey(store, key);
  RegistrySetValue(store, key, szValueName, value);
}
}  // namespace

void SetBooleanSetting(RegistryStore& store, const std::string& szValueName,
                       const std::string& szSection, bool boolValue) {
  SetSetting(store, szValueName, szSection, RegistryValue::Dword(boolValue ? 1 : 0));
}

void SetLongSetting(RegistryStore& store, const std::string& szValueName,
                    const std::string& szSection, int32_t lValue) {
  SetSetting(store, szValueName, szSection, RegistryValue::Dword(static_cast<uint32_t>(lValue)));
}

void SetStringSetting(RegistryStore& store, const std::string& szValueName,
                      const std::string& szSection, const std::string& szValue) {
  SetSetting(store, szValueName, szSection, RegistryValue::String(szValue));
}

}  // namespace tav
