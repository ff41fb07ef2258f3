#pragma once
// One input that can fire: an input (circuit) of a unit on a lighting
// network. Shows hold their startup trigger and every group binding holds
// one, shared by reference; the run-time input handling builds one per input
// event and compares it with Equals. The name is only a label for people, so
// it never takes part in a comparison.

#include <cstdint>
#include <memory>
#include <string>

namespace tav {

class Trigger {
 public:
  // Copies UnitId, InputNumber, Name and Network. A null source fails with
  // the object-not-set error (91).
  void Copy(const std::shared_ptr<Trigger>& other);
  void Copy(const Trigger& other);

  // Same UnitId, InputNumber and Network; Name is not compared. Null is never
  // equal.
  bool Equals(const std::shared_ptr<Trigger>& other) const;
  bool Equals(const Trigger& other) const;

  int32_t InputNumber() const { return m_inputNumber; }
  void SetInputNumber(int32_t value) { m_inputNumber = value; }
  const std::string& Name() const { return m_name; }
  void SetName(std::string value) { m_name = std::move(value); }
  int32_t Network() const { return m_network; }
  void SetNetwork(int32_t value) { m_network = value; }
  int32_t UnitId() const { return m_unitId; }
  void SetUnitId(int32_t value) { m_unitId = value; }

 private:
  int32_t m_inputNumber = 0;
  std::string m_name;
  int32_t m_network = 0;
  int32_t m_unitId = 0;
};

}  // namespace tav
