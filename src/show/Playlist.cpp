#include "show/Playlist.h"

namespace tav {

namespace {
constexpr int32_t kAnimationPlaylist = 1;
constexpr int32_t kMusicalPlaylist = 2;
}  // namespace

Playlist::Playlist() {
  // Going through the type setter from the zero state runs the type-1 resets.
  SetPlaylistType(kAnimationPlaylist);
  SetAnimationType(1);
  SetLightsOffAtEnd(true);
}

void Playlist::SetAnimationType(int32_t value) {
  if (m_playlistType == kAnimationPlaylist) m_animationType = value;
}

void Playlist::SetDelay(int32_t value) {
  if (m_playlistType == kMusicalPlaylist) m_delay = value;
}

void Playlist::SetMusicalType(int32_t value) {
  if (m_playlistType == kMusicalPlaylist) m_musicalType = value;
}

void Playlist::SetPlaylistType(int32_t value) {
  if (value == m_playlistType) return;
  m_playlistType = value;
  // The resets write the fields directly: the setters would ignore the order
  // fields that do not belong to the new type, which are exactly the ones
  // that must be cleared.
  if (value == kAnimationPlaylist) {
    m_animationType = 1;
    m_musicalType = 0;
    m_delay = 0;
  } else if (value == kMusicalPlaylist) {
    m_animationType = 0;
    m_musicalType = 1;
  }
}

}  // namespace tav
