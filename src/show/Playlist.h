#pragma once
// A playlist of a show section: sequence file names in play order with the
// options the engine plays them by. The playlist type decides which order
// field is live: AnimationType only on an animation playlist (type 1),
// MusicalType and Delay only on a musical one (type 2). Writes to a field that
// is not live are ignored without an error, and changing the type resets the
// order fields, so a playlist never carries stale settings of the other kind.
// Shows own their playlists through shared pointers; callers that change a
// show's playlist change the show.

#include <cstdint>
#include <string>

#include "show/TextCollection.h"

namespace tav {

class Playlist {
 public:
  // Type 1, AnimationType 1, MusicalType 0, Delay 0, LightsOffAtEnd true,
  // both shuffle flags false, no entries.
  Playlist();

  // 2 queues every sequence at once and loops; anything else plays one at a
  // time in list order. Written only while PlaylistType is 1.
  int32_t AnimationType() const { return m_animationType; }
  void SetAnimationType(int32_t value);
  // File name of the cleanup sequence; empty for none.
  const std::string& CleanUp() const { return m_cleanUp; }
  void SetCleanUp(std::string value) { m_cleanUp = std::move(value); }
  int32_t Count() const { return m_list.Count(); }
  // Seconds between two musical sequences. Written only while PlaylistType is 2.
  int32_t Delay() const { return m_delay; }
  void SetDelay(int32_t value);
  bool LightsOffAtEnd() const { return m_lightsOffAtEnd; }
  void SetLightsOffAtEnd(bool value) { m_lightsOffAtEnd = value; }
  // The sequence names themselves, numbered from 1.
  TextCollection& List() { return m_list; }
  const TextCollection& List() const { return m_list; }
  // Written only while PlaylistType is 2.
  int32_t MusicalType() const { return m_musicalType; }
  void SetMusicalType(int32_t value);
  // 1 = animation, 2 = musical. Writing the current value does nothing; a new
  // 1 sets AnimationType 1, MusicalType 0, Delay 0; a new 2 sets AnimationType
  // 0 and MusicalType 1 and keeps Delay; any other value resets nothing.
  int32_t PlaylistType() const { return m_playlistType; }
  void SetPlaylistType(int32_t value);
  bool ShuffleAllowsBackToBack() const { return m_shuffleAllowsBackToBack; }
  void SetShuffleAllowsBackToBack(bool value) { m_shuffleAllowsBackToBack = value; }
  bool ShuffleWithReplacement() const { return m_shuffleWithReplacement; }
  void SetShuffleWithReplacement(bool value) { m_shuffleWithReplacement = value; }

 private:
  TextCollection m_list;
  int32_t m_playlistType = 0;
  int32_t m_animationType = 0;
  int32_t m_musicalType = 0;
  std::string m_cleanUp;
  int32_t m_delay = 0;
  bool m_lightsOffAtEnd = false;
  bool m_shuffleAllowsBackToBack = false;
  bool m_shuffleWithReplacement = false;
};

}  // namespace tav
