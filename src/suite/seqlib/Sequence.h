#pragma once
// One sequence as the player holds it: what was loaded (plain, FSEQ or
// compressed export) and a player for it. This is the object behind the
// suite's sequence interface: metadata (media, shell command, subsequences,
// families used, whether its export is current), play (start, stop through
// state 3, loop, lights off, music sync) and the next due event.
//
// Made by a SequenceLibrary, which supplies the loader; before a load every
// play operation is a harmless no-op. Shares the clock. Single-threaded.

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "ports/Clock.h"
#include "suite/seqlib/CompiledSequence.h"
#include "suite/seqlib/EventStream.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SequencePlayer.h"
#include "suite/shellcmd/ShellCommand.h"

namespace tav {

struct SequenceInfo {
  std::string format;  // "plain", "fseq" or "tcs"
  std::string path;
  int64_t lengthMs = 0;
  std::string media;
  std::string shellCommand;
  std::vector<SubsequenceRef> subsequences;
  std::vector<int32_t> families;  // in ascending order
  size_t channelCount = 0;        // effect channels, or FSEQ channels
  size_t effectCount = 0;
  size_t frameCount = 0;       // frames of the timeline
  size_t levelBlockCount = 0;  // level blocks over all tracks and frames
  uint64_t sourceHash = 0;
};

// What a load produces; immutable and shared by the players.
struct SequenceContent {
  SequenceInfo info;
  // The compiled form (plain and compressed sequences); FSEQ has none.
  std::shared_ptr<const CompiledSequence> compiled;
  std::function<std::unique_ptr<EventStream>()> openStream;
  std::function<bool()> hasBeenExported;
};

using SequenceLoader = std::function<std::shared_ptr<const SequenceContent>(
    const std::string& path, const std::function<void()>& keepAlive)>;

class Sequence {
 public:
  // KeepAlive is raised at most this often while a file loads.
  static constexpr uint32_t kKeepAliveIntervalMs = 50;

  Sequence(std::shared_ptr<const Clock> clock, SequenceLoader loader);

  // The KeepAlive event: raised while a large file loads or its export is
  // written, so outputs keep refreshing although the loop is busy.
  void SetKeepAlive(std::function<void()> handler) { m_keepAlive = std::move(handler); }
  // For long work on this sequence (loading it, writing its export): a
  // function to call now and then that raises KeepAlive at most every
  // kKeepAliveIntervalMs, the first call always.
  std::function<void()> KeepAliveRaiser() const;
  // Loads the file (format judged by content). Throws tav::Error.
  void LoadFile(const std::string& path);
  void Attach(std::shared_ptr<const SequenceContent> content);
  bool IsLoaded() const { return m_content != nullptr; }
  std::shared_ptr<const SequenceContent> Content() const { return m_content; }
  const SequenceInfo& Info() const;

  std::string MediaFilename() const;
  std::string ShellCommand() const;
  std::vector<std::string> SubsequenceNames() const;
  bool UsesFamily(int32_t family) const;
  bool UsesTAV() const { return UsesFamily(kFamilyTAV); }
  bool UsesX10() const { return UsesFamily(kFamilyX10); }
  bool UsesFennick() const { return UsesFamily(kFamilyFennick); }
  bool UsesDMX() const { return UsesFamily(kFamilyDMX); }
  // Whether a compressed export beside the file records its current
  // content. FSEQ files play directly and always report true.
  bool HasBeenExported() const;

  void SetLoopAtEnd(bool loop);
  void SetLightsOffAtEnd(bool lightsOff);
  void SetLookaheadMs(int32_t ms);
  void InitializeForPlay(bool withMedia);
  void StartPlay();
  void StopPlay();
  void ForceStop();
  int32_t SequencePlayState() const;
  void InitMusicSync(int32_t positionMs);
  void SyncToMusic(int32_t positionMs);
  bool GetEvent(PlayEvent& event);
  // SequencePlayer::MillisecondsUntilDue; nothing before a load.
  std::optional<int64_t> MillisecondsUntilDue();
  int64_t Position() const;

  // Completes a command the shell-command manager prepared: it runs in the
  // sequence's folder and learns the sequence and media file names from
  // TAV_SEQUENCE_FILE and TAV_MEDIA_FILE.
  void CompleteShellCommand(tav::ShellCommand& command) const;
  size_t MemoryHeld() const;

 private:
  std::shared_ptr<const Clock> m_clock;
  SequenceLoader m_loader;
  std::function<void()> m_keepAlive;
  std::shared_ptr<const SequenceContent> m_content;
  std::unique_ptr<SequencePlayer> m_player;
  bool m_loop = false;
  bool m_lightsOff = false;
  int32_t m_lookahead = SequencePlayer::kDefaultLookaheadMs;
};

}  // namespace tav
