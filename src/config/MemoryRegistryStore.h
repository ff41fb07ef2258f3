#pragma once
// The RegistryStore held in memory, for tests and for tools that work on a
// copy. It behaves as the file store does (both answer from a
// RegistryDocument) and can be told to fail any primitive with a chosen
// status, a given number of times or until cleared, so tests can prove how
// callers handle a failing registry.

#include <map>
#include <string>
#include <vector>

#include "config/RegistryDocument.h"
#include "config/RegistryStore.h"

namespace tav {

enum class RegistryOperation {
  OpenKey,
  CreateKey,
  QueryValueInfo,
  QueryValue,
  SetValue,
  DeleteValue,
  DeleteKey,
  EnumSubKeys,
  EnumValues,
  QueryKeyInfo,
};

class MemoryRegistryStore : public RegistryStore {
 public:
  int32_t OpenKey(const std::string& key) override;
  int32_t CreateKey(const std::string& key) override;
  int32_t QueryValueInfo(const std::string& key, const std::string& name, uint32_t& type,
                         uint32_t& length) override;
  int32_t QueryValue(const std::string& key, const std::string& name,
                     RegistryValue& value) override;
  int32_t SetValue(const std::string& key, const std::string& name,
                   const RegistryValue& value) override;
  int32_t DeleteValue(const std::string& key, const std::string& name) override;
  int32_t DeleteKey(const std::string& key) override;
  int32_t EnumSubKeys(const std::string& key, std::vector<std::string>& names) override;
  int32_t EnumValues(const std::string& key, std::vector<NamedRegistryValue>& values) override;
  int32_t QueryKeyInfo(const std::string& key, RegistryKeyInfo& info) override;

  // Makes the next `times` calls of `operation` fail with `status` (every
  // call when `times` is negative) without touching the content.
  void FailOperation(RegistryOperation operation, int32_t status = kRegistryAccessDenied,
                     int times = -1);
  void ClearFailures() { m_failures.clear(); }
  // Calls made so far, failed ones included.
  int Calls(RegistryOperation operation) const;

  RegistryDocument& Document() { return m_document; }
  const RegistryDocument& Document() const { return m_document; }

 private:
  struct Failure {
    int32_t status;
    int remaining;
  };
  // Counts the call; the injected status if it is to fail, else 0.
  int32_t Enter(RegistryOperation operation);

  RegistryDocument m_document;
  std::map<RegistryOperation, Failure> m_failures;
  std::map<RegistryOperation, int> m_calls;
};

}  // namespace tav
