#pragma once
// An interactive group of a show: bindings of triggers to sequences, and the
// flags that decide what happens when a trigger fires while one of the
// group's sequences plays. The group type (TypeName, TypeDesc) is derived
// from Independent and Interruptible after every write of any of the three
// flags, so that the suite's editors can show it; the run-time code may use
// the flags directly. Owned by the show's group collection (shared pointers);
// bindings are owned by the group.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "show/TriggeredSequences.h"

namespace tav {

class InteractiveGroup {
 public:
  InteractiveGroup() = default;

  bool LightsOffAtEnd() const { return m_lightsOffAtEnd; }
  void SetLightsOffAtEnd(bool value) { m_lightsOffAtEnd = value; }

  // Empty until the first write of a flag.
  const std::string& TypeName() const { return m_typeName; }
  const std::string& TypeDesc() const { return m_typeDesc; }

  bool Independent() const { return m_independent; }
  void SetIndependent(bool value);
  bool Interruptible() const { return m_interruptible; }
  void SetInterruptible(bool value);
  bool MusicalAllowed() const { return m_musicalAllowed; }
  void SetMusicalAllowed(bool value);

  const std::string& Name() const { return m_name; }
  void SetName(std::string value) { m_name = std::move(value); }
  const std::string& Description() const { return m_description; }
  void SetDescription(std::string value) { m_description = std::move(value); }

  // The binding at a 0-based index; outside 0..Count-1 fails with the
  // subscript error (9).
  std::shared_ptr<TriggeredSequences> GetTriggeredSequences(int32_t index) const;
  // Appends at index Count (shared, not copied).
  void AddTriggeredSequences(std::shared_ptr<TriggeredSequences> binding);
  // Removes the binding at a 0-based index, moving later ones down; outside
  // 0..Count-1 fails with the subscript error (9).
  void DeleteTriggeredSequence(int32_t index);
  int32_t Count() const { return static_cast<int32_t>(m_bindings.size()); }

  // Takes other's options through the setters (so the type is derived again)
  // and deep copies of its bindings; shares nothing with other. A null source
  // fails with the object-not-set error (91).
  void Copy(const std::shared_ptr<InteractiveGroup>& other);
  void Copy(const InteractiveGroup& other);

 private:
  void UpdateType();

  std::vector<std::shared_ptr<TriggeredSequences>> m_bindings;
  bool m_independent = false;
  bool m_interruptible = false;
  bool m_musicalAllowed = true;
  std::string m_name;
  std::string m_description;
  std::string m_typeName;
  std::string m_typeDesc;
  bool m_lightsOffAtEnd = true;
};

}  // namespace tav
