#pragma once
// Port: the registry below HKEY_CURRENT_USER, where the suite keeps every
// setting. Keys are addressed by their path below the hive, such as
// "Software\Tessavar\Shared"; names compare without regard to letter case, and every
// call answers with the platform registry's status code, 0 for success. The
// LibRegistry functions turn failures into errors; the typed settings
// accessors sit on top of those.
//
// Adapters: the registry export text file on Unix (platform/), an in-memory
// store for tests. Used on the program's one thread only.

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace tav {

// Status codes, with the platform registry's numbers.
constexpr int32_t kRegistryOk = 0;
constexpr int32_t kRegistryNotFound = 2;
constexpr int32_t kRegistryAccessDenied = 5;
constexpr int32_t kRegistryInvalidParameter = 87;
constexpr int32_t kRegistryIoFailed = 1016;

// Value types, with the platform's numbers.
constexpr uint32_t kRegNone = 0;
constexpr uint32_t kRegSz = 1;
constexpr uint32_t kRegExpandSz = 2;
constexpr uint32_t kRegBinary = 3;
constexpr uint32_t kRegDword = 4;
constexpr uint32_t kRegDwordBigEndian = 5;
constexpr uint32_t kRegLink = 6;
constexpr uint32_t kRegMultiSz = 7;
constexpr uint32_t kRegQword = 11;

// A value as stored. Text types (REG_SZ, REG_EXPAND_SZ, REG_MULTI_SZ) hold
// UTF-8 text without a terminator, REG_MULTI_SZ's strings separated by NUL;
// REG_DWORD holds 4 bytes, least significant first; every other type holds
// its bytes as they are.
struct RegistryValue {
  uint32_t type = kRegNone;
  std::string data;

  static RegistryValue String(std::string text) { return {kRegSz, std::move(text)}; }
  static RegistryValue Dword(uint32_t number);
  static RegistryValue Binary(std::string bytes) { return {kRegBinary, std::move(bytes)}; }
  // The number of a REG_DWORD value of 4 bytes.
  bool IsDword() const { return type == kRegDword && data.size() == 4; }
  uint32_t DwordValue() const;
  // Size in bytes as the registry reports it: text counts its terminator.
  uint32_t StoredLength() const;

  friend bool operator==(const RegistryValue&, const RegistryValue&) = default;
};

using NamedRegistryValue = std::pair<std::string, RegistryValue>;

struct RegistryKeyInfo {
  uint32_t subKeyCount = 0;
  uint32_t maxSubKeyLength = 0;
  uint32_t valueCount = 0;
  uint32_t maxValueNameLength = 0;
  uint32_t maxValueLength = 0;
};

class RegistryStore {
 public:
  virtual ~RegistryStore() = default;

  // kRegistryNotFound when the key does not exist.
  virtual int32_t OpenKey(const std::string& key) = 0;
  // Creates the key and any missing parents; succeeds when it exists.
  virtual int32_t CreateKey(const std::string& key) = 0;
  // The type and size in bytes of a value (text counts its terminator).
  virtual int32_t QueryValueInfo(const std::string& key, const std::string& name, uint32_t& type,
                                 uint32_t& length) = 0;
  virtual int32_t QueryValue(const std::string& key, const std::string& name,
                             RegistryValue& value) = 0;
  // The key must exist.
  virtual int32_t SetValue(const std::string& key, const std::string& name,
                           const RegistryValue& value) = 0;
  virtual int32_t DeleteValue(const std::string& key, const std::string& name) = 0;
  // Deletes a key that has no sub-keys (kRegistryAccessDenied otherwise).
  virtual int32_t DeleteKey(const std::string& key) = 0;
  // Names of the key's direct sub-keys, as they are spelled.
  virtual int32_t EnumSubKeys(const std::string& key, std::vector<std::string>& names) = 0;
  virtual int32_t EnumValues(const std::string& key, std::vector<NamedRegistryValue>& values) = 0;
  virtual int32_t QueryKeyInfo(const std::string& key, RegistryKeyInfo& info) = 0;
};

}  // namespace tav
