#pragma once
// The text form of an interactive group inside a show file: eight fields,
// Count (written for information, never read), Description, Independent,
// Interruptible, MusicalAllowed, Name, the bindings as a nested list, and
// LightsOffAtEnd (absent in older files, which then keep true).
//
// Neither direction guards an empty group: a group without bindings cannot
// be written, and a text whose bindings field is empty cannot be read. Both
// fail with the subscript error (9); the show reader drops such a group and a
// show comparison then reports a difference.

#include <memory>
#include <string>
#include <string_view>

#include "show/InteractiveGroup.h"

namespace tav {

std::string InteractiveGroupToText(const std::shared_ptr<InteractiveGroup>& group);
std::string InteractiveGroupToText(const InteractiveGroup& group);

std::shared_ptr<InteractiveGroup> InteractiveGroupFromText(std::string_view text);

}  // namespace tav
