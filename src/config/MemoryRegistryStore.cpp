#include "config/MemoryRegistryStore.h"

namespace tav {

int32_t MemoryRegistryStore::Enter(RegistryOperation operation) {
  ++m_calls[operation];
  auto it = m_failures.find(operation);
  if (it == m_failures.end()) return kRegistryOk;
  int32_t status = it->second.status;
  if (it->second.remaining > 0 && --it->second.remaining == 0) m_failures.erase(it);
  return status;
}

void MemoryRegistryStore::FailOperation(RegistryOperation operation, int32_t status, int times) {
  if (times == 0) {
    m_failures.erase(operation);
    return;
  }
  m_failures[operation] = Failure{status, times < 0 ? -1 : times};
}

int MemoryRegistryStore::Calls(RegistryOperation operation) const {
  auto it = m_calls.find(operation);
  return it == m_calls.end() ? 0 : it->second;
}

int32_t MemoryRegistryStore::OpenKey(const std::string& key) {
  if (int32_t status = Enter(RegistryOperation::OpenKey)) return status;
  return m_document.OpenKey(key);
}

int32_t MemoryRegistryStore::CreateKey(const std::string& key) {
  if (int32_t status = Enter(RegistryOperation::CreateKey)) return status;
  return m_document.CreateKey(key);
}

int32_t MemoryRegistryStore::QueryValueInfo(const std::string& key, const std::string& name,
                                            uint32_t& type, uint32_t& length) {
  if (int32_t status = Enter(RegistryOperation::QueryValueInfo)) return status;
  RegistryValue value;
  if (int32_t status = m_document.QueryValue(key, name, value)) return status;
  type = value.type;
  length = value.StoredLength();
  return kRegistryOk;
}

int32_t MemoryRegistryStore::QueryValue(const std::string& key, const std::string& name,
                                        RegistryValue& value) {
  if (int32_t status = Enter(RegistryOperation::QueryValue)) return status;
  return m_document.QueryValue(key, name, value);
}

int32_t MemoryRegistryStore::SetValue(const std::string& key, const std::string& name,
                                      const RegistryValue& value) {
  if (int32_t status = Enter(RegistryOperation::SetValue)) return status;
  return m_document.SetValue(key, name, value);
}

int32_t MemoryRegistryStore::DeleteValue(const std::string& key, const std::string& name) {
  if (int32_t status = Enter(RegistryOperation::DeleteValue)) return status;
  return m_document.DeleteValue(key, name);
}

int32_t MemoryRegistryStore::DeleteKey(const std::string& key) {
  if (int32_t status = Enter(RegistryOperation::DeleteKey)) return status;
  return m_document.DeleteKey(key);
}

int32_t MemoryRegistryStore::EnumSubKeys(const std::string& key, std::vector<std::string>& names) {
  if (int32_t status = Enter(RegistryOperation::EnumSubKeys)) return status;
  return m_document.EnumSubKeys(key, names);
}

int32_t MemoryRegistryStore::EnumValues(const std::string& key,
                                        std::vector<NamedRegistryValue>& values) {
  if (int32_t status = Enter(RegistryOperation::EnumValues)) return status;
  return m_document.EnumValues(key, values);
}

int32_t MemoryRegistryStore::QueryKeyInfo(const std::string& key, RegistryKeyInfo& info) {
  if (int32_t status = Enter(RegistryOperation::QueryKeyInfo)) return status;
  return m_document.QueryKeyInfo(key, info);
}

}  // namespace tav
