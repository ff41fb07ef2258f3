#include "show/InteractiveGroup.h"

#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kGenericTypeName = "Interactive Group";

constexpr const char* kMagicToyName = "Magic Toy";
constexpr const char* kMagicToyDesc =
    "Any unit/circuit in this group can be associated with any number of sequences, all of which "
    "will play simultaneously whenever that Unit/circuit is triggered.  If any sequences from "
    "this group were already playing, they will immediately stop."
    "\r\n\r\n"
    "Only animation sequences can be used in this group - musical sequences cannot be used.";

constexpr const char* kSoundboardName = "Soundboard";
constexpr const char* kSoundboardDesc =
    "Only one sequence from this group can be playing at any given time.  If a unit/circuit from "
    "this group is triggered, but a sequence from this group is already playing, the playing "
    "sequence will immediately stop, and the sequence associated with the triggered unit/circuit "
    "will be played."
    "\r\n\r\n"
    "If a unit/circuit in this group is associated with more than once sequence, then every time "
    "it is triggered, the next such sequence will be played, in a round-robin fashion.";

constexpr const char* kJukeboxName = "Jukebox";
constexpr const char* kJukeboxDesc =
    "Only one sequence from this group can be playing at any given time.  If a unit/circuit from "
    "this group is triggered, but a sequence from this group is already playing, the trigger "
    "will be ignored."
    "\r\n\r\n"
    "If a unit/circuit in this group is associated with more than one sequence, then every time "
    "it is triggered, the next such sequence will be played, in a round-robin fashion (unless it "
    "is ignored because a sequence from this group is already playing).";

}  // namespace

void InteractiveGroup::SetIndependent(bool value) {
  m_independent = value;
  UpdateType();
}

void InteractiveGroup::SetInterruptible(bool value) {
  m_interruptible = value;
  UpdateType();
}

void InteractiveGroup::SetMusicalAllowed(bool value) {
  m_musicalAllowed = value;
  UpdateType();
}

std::shared_ptr<TriggeredSequences> InteractiveGroup::GetTriggeredSequences(int32_t index) const {
  if (index < 0 || index >= Count()) {
    throw errors::SubscriptOutOfRange("InteractiveGroup.GetTriggeredSequences");
  }
  return m_bindings[static_cast<size_t>(index)];
}

void InteractiveGroup::AddTriggeredSequences(std::shared_ptr<TriggeredSequences> binding) {
  m_bindings.push_back(std::move(binding));
}

void InteractiveGroup::DeleteTriggeredSequence(int32_t index) {
  if (index < 0 || index >= Count()) {
    throw errors::SubscriptOutOfRange("InteractiveGroup.DeleteTriggeredSequence");
  }
  m_bindings.erase(m_bindings.begin() + index);
}

void InteractiveGroup::Copy(const std::shared_ptr<InteractiveGroup>& other) {
  if (!other) throw errors::ObjectNotSet("InteractiveGroup.Copy");
  Copy(*other);
}

void InteractiveGroup::Copy(const InteractiveGroup& other) {
  // Copying from itself must not lose the bindings while they are rebuilt.
  std::vector<std::shared_ptr<TriggeredSequences>> sources = other.m_bindings;
  SetDescription(other.m_description);
  SetIndependent(other.m_independent);
  SetInterruptible(other.m_interruptible);
  SetMusicalAllowed(other.m_musicalAllowed);
  SetName(other.m_name);
  SetLightsOffAtEnd(other.m_lightsOffAtEnd);
  m_bindings.clear();
  for (const auto& source : sources) {
    auto binding = std::make_shared<TriggeredSequences>();
    binding->Copy(source);
    AddTriggeredSequences(std::move(binding));
  }
}

// Every flag write lands here, even when the value did not change. The
// independent-but-not-interruptible combination has no type of its own; it
// reads as the generic name and keeps whatever help text was there.
void InteractiveGroup::UpdateType() {
  m_typeName = kGenericTypeName;
  if (m_interruptible && m_independent) {
    m_typeName = kMagicToyName;
    m_typeDesc = kMagicToyDesc;
  } else if (m_interruptible) {
    m_typeName = kSoundboardName;
    m_typeDesc = kSoundboardDesc;
  } else if (!m_independent) {
    m_typeName = kJukeboxName;
    m_typeDesc = kJukeboxDesc;
  }
}

}  // namespace tav
