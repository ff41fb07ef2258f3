#include "show/PlaylistFunctions.h"

#include "support/Error.h"
#include "support/Numbers.h"
#include "support/Serialize.h"

namespace tav {
namespace {

// The lenient number read of playlist fields, which never fails: a field
// without a number gives 0, and so does one whose number does not fit in 32
// bits ("99999999999", "1e10"), since such a number is no order, type or
// delay anybody meant and must not cost the whole show.
int32_t NumberField(const std::string& field) {
  try {
    return NumberOf(UnescapeText(field));
  } catch (const Error&) {
    return 0;  // the overflow error, the only one NumberOf raises
  }
}

}  // namespace

std::shared_ptr<Playlist> NewAnimationPlaylist(int32_t animationType) {
  auto playlist = std::make_shared<Playlist>();
  playlist->SetPlaylistType(1);
  playlist->SetAnimationType(animationType);
  return playlist;
}

std::shared_ptr<Playlist> NewMusicalPlaylist(int32_t musicalType, int32_t delay) {
  auto playlist = std::make_shared<Playlist>();
  playlist->SetPlaylistType(2);
  playlist->SetMusicalType(musicalType);
  playlist->SetDelay(delay);
  return playlist;
}

std::string PlaylistToText(const std::shared_ptr<Playlist>& playlist) {
  if (!playlist) throw errors::ObjectNotSet("PlaylistFunctions.PlaylistToText");
  return PlaylistToText(*playlist);
}

std::string PlaylistToText(const Playlist& playlist) {
  std::string names;
  if (playlist.Count() > 0) {
    std::vector<std::string> entries;
    entries.reserve(static_cast<size_t>(playlist.Count()));
    for (const auto& entry : playlist.List()) entries.push_back(EscapeText(entry));
    names = ListToText(entries);
  }
  return ListToText(std::vector<std::string>{
      std::to_string(playlist.AnimationType()),
      std::to_string(playlist.MusicalType()),
      std::to_string(playlist.PlaylistType()),
      std::to_string(playlist.Delay()),
      EscapeText(playlist.CleanUp()),
      names,
      BoolToText(playlist.LightsOffAtEnd()),
      BoolToText(playlist.ShuffleAllowsBackToBack()),
      BoolToText(playlist.ShuffleWithReplacement()),
  });
}

std::shared_ptr<Playlist> PlaylistFromText(std::string_view text) {
  TextArray fields = ListFromText(text, 1);
  auto playlist = std::make_shared<Playlist>();
  // Type first: the setters then drop the order fields of the other kind.
  playlist->SetPlaylistType(NumberField(fields[3]));
  playlist->SetAnimationType(NumberField(fields[1]));
  playlist->SetMusicalType(NumberField(fields[2]));
  playlist->SetDelay(NumberField(fields[4]));
  playlist->SetCleanUp(UnescapeText(fields[5]));

  // An empty names field is no list and gives no entries; "()" gives one
  // empty entry.
  TextArray names = ListFromText(fields[6], 1);
  for (const auto& name : names.Items()) playlist->List().Add(UnescapeText(name));

  int32_t count = ArrayCount(fields);
  if (count >= 7) playlist->SetLightsOffAtEnd(BoolFromText(fields[7]));
  playlist->SetShuffleAllowsBackToBack(count < 8 || BoolFromText(fields[8]));
  playlist->SetShuffleWithReplacement(count < 9 || BoolFromText(fields[9]));
  return playlist;
}

}  // namespace tav
