#include "config/RegistryStore.h"

namespace tav {

RegistryValue RegistryValue::Dword(uint32_t number) {
  std::string bytes(4, '\0');
  for (int i = 0; i < 4; ++i) bytes[i] = static_cast<char>((number >> (8 * i)) & 0xFF);
  return {kRegDword, std::move(bytes)};
}

uint32_t RegistryValue::DwordValue() const {
  uint32_t number = 0;
  for (size_t i = 0; i < 4 && i < data.size(); ++i) {
    number |= static_cast<uint32_t>(static_cast<unsigned char>(data[i])) << (8 * i);
  }
  return number;
}

uint32_t RegistryValue::StoredLength() const {
  bool text = type == kRegSz || type == kRegExpandSz || type == kRegMultiSz;
  return static_cast<uint32_t>(data.size() + (text ? 1 : 0));
}

}  // namespace tav
