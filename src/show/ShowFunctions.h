#pragma once
// The show file: one list of ten fields, the Startup, Shutdown, Main and
// Musical playlists, a reserved empty field, the Background playlist, the
// interactive groups (an empty field when there are none), StartupType,
// StartupTrigger (an empty field when there is none) and PreloadSequences.
// Older files stop after field 5, 6, 7, 8 or 9 and are read as if the
// missing fields held their defaults.
//
// Reading is forgiving below the top level, so that one bad group does not
// cost a whole evening's show: a group or trigger that cannot be read is left
// out, and a StartupType that is no number reads as 0. It is strict where the
// file is unusable: a text that is no well-formed list, or whose groups field
// is badly formatted, raises the list error; a playlist that cannot be read
// makes ShowFromText return null.

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "show/Show.h"

namespace tav {

// A show built from these parts (shared, not copied), normalised: the
// playlist types are forced (Startup, Shutdown and Musical musical; Main and
// Background animation), which resets the order settings of a playlist of
// the other kind, and null entries are removed from the group collection. A
// null playlist or group collection fails with the object-not-set error (91).
std::shared_ptr<Show> NewShow(std::shared_ptr<Playlist> startup, std::shared_ptr<Playlist> shutdown,
                              std::shared_ptr<Playlist> main, std::shared_ptr<Playlist> musical,
                              std::shared_ptr<Playlist> background,
                              std::shared_ptr<InteractiveGroupList> groups, int32_t startupType,
                              std::shared_ptr<Trigger> trigger, bool preloadSequences);

// The canonical text. Fails with 91 for a null show, playlist or group
// collection, and with 9 for a group without bindings or a binding without
// sequences.
std::string ShowToText(const std::shared_ptr<Show>& show);
std::string ShowToText(const Show& show);

// A new show, or null when one of its playlists cannot be read. Raises the
// list error when the text or its groups field is badly formatted.
std::shared_ptr<Show> ShowFromText(std::string_view text);

}  // namespace tav
