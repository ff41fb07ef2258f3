#pragma once
// Building playlists and their text form inside a show file: nine fields,
// AnimationType, MusicalType, PlaylistType, Delay (plain decimal numbers with
// no sign blank), CleanUp (escaped), the names as a nested list of escaped
// entries (an empty field when there are none, since "()" would read back as
// one empty name), then LightsOffAtEnd, ShuffleAllowsBackToBack and
// ShuffleWithReplacement.
//
// The number fields are read leniently (leading number, 0 when there is
// none), and the type is written first so that the order fields of the other
// kind are dropped. Older texts without the last fields keep LightsOffAtEnd
// true and read both shuffle flags as true, although a new playlist has them
// false: that is how those files were played.

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "show/Playlist.h"

namespace tav {

std::shared_ptr<Playlist> NewAnimationPlaylist(int32_t animationType);
std::shared_ptr<Playlist> NewMusicalPlaylist(int32_t musicalType, int32_t delay);

// Null fails with error 91.
std::string PlaylistToText(const std::shared_ptr<Playlist>& playlist);
std::string PlaylistToText(const Playlist& playlist);

// Raises list errors of the text or of its names field, and the subscript
// error (9) when one of the first six fields is missing; after that nothing
// fails.
std::shared_ptr<Playlist> PlaylistFromText(std::string_view text);

}  // namespace tav
