#include "show/Trigger.h"

#include "support/Error.h"

namespace tav {

void Trigger::Copy(const std::shared_ptr<Trigger>& other) {
  if (!other) throw errors::ObjectNotSet("Trigger.Copy");
  Copy(*other);
}

void Trigger::Copy(const Trigger& other) {
  m_unitId = other.m_unitId;
  m_inputNumber = other.m_inputNumber;
  m_name = other.m_name;
  m_network = other.m_network;
}

bool Trigger::Equals(const std::shared_ptr<Trigger>& other) const {
  return other && Equals(*other);
}

bool Trigger::Equals(const Trigger& other) const {
  return m_unitId == other.m_unitId && m_inputNumber == other.m_inputNumber &&
         m_network == other.m_network;
}

}  // namespace tav
