#pragma once
// The media player of a simulation: the scripted player on virtual time
// (its position follows the virtual clock, its events come on the loop),
// told before each file opens what that file will do, as found from the
// file itself (MediaLength):
//  - a length read from its header: it plays that long and ends;
//  - a length not read from the file (AAC, WMA, video): it plays until the
//    sequence that started it ends and stops it, so the sequence's own
//    length decides;
//  - a file that is missing or cannot be opened: it fails to load with the
//    error the real player reports ("Cannot play "<path>": file not found").
// Each opening is reported, with what was found, to `onOpened`.
//
// Owned by the simulation; the clock, the timer service and the file system
// must outlive it.

#include <functional>
#include <memory>
#include <string>

#include "MediaLength.h"
#include "ports/Clock.h"
#include "ports/TimerService.h"
#include "show/testing/ScriptedMediaPlayer.h"
#include "suite/seqlib/FileSystem.h"

namespace tav::simulation {

class SimulatedMediaPlayer : public ScriptedMediaPlayer {
 public:
  using OnOpened = std::function<void(const std::string& path, const MediaLength& length)>;

  // How long a file of unknown length plays when nothing stops it: far
  // longer than any sequence, within the player's 32-bit millisecond ticks.
  static constexpr double kOpenEndedSeconds = 7 * 86400.0;

  SimulatedMediaPlayer(const Clock& clock, TimerService& timers,
                       std::shared_ptr<const FileSystem> files, OnOpened onOpened);

  void OpenMedia(const std::string& path) override;

 private:
  std::shared_ptr<const FileSystem> m_files;
  OnOpened m_onOpened;
};

}  // namespace tav::simulation
