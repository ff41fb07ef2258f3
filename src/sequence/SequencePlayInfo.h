#pragma once
// One sequence file as the show engine handles it: what the show asked of it
// (file, play type, looping, lights off, preloading), the loaded sequence,
// either from its compressed export when that is current or from the file
// itself, and every play operation forwarded to whichever of the two is held.
//
// Made by the show engine, one per playlist entry or triggered sequence; the
// services it is given must outlive it. The interactive group and binding it
// refers to belong to the show. Single-threaded.

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "ports/ProcessMemory.h"
#include "sequence/SequenceHost.h"
#include "suite/channelio/ChannelIO.h"
#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/PathResolver.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SequenceLibrary.h"
#include "suite/shellcmd/ShellCommandManager.h"

namespace tav {

class InteractiveGroup;
class TriggeredSequences;

// What a sequence play info needs from the rest of the program.
struct SequencePlayServices {
  std::shared_ptr<SequenceLibrary> library;
  std::shared_ptr<const PathResolver> resolver;
  std::shared_ptr<const FileSystem> fileSystem;
  // Logging, tray notices and the playback-file creator. Not owned.
  SequenceHost* host = nullptr;
  // Measures each load of a plain file; may be null.
  std::shared_ptr<const ProcessMemory> memory;
  // The UseCompressedSequences setting, read at each load.
  std::function<bool()> useCompressedSequences;
};

class SequencePlayInfo : public SequenceIdentity {
 public:
  explicit SequencePlayInfo(SequencePlayServices services);
  SequencePlayInfo(const SequencePlayInfo&) = delete;
  SequencePlayInfo& operator=(const SequencePlayInfo&) = delete;

  std::string Filename() const override { return m_filename; }
  void SetFilename(std::string value) { m_filename = std::move(value); }
  int32_t PlayType() const override { return m_playType; }
  // Also derives Section.
  void SetPlayType(int32_t value);
  int32_t Section() const override { return m_section; }
  bool LoopAtEnd() const { return m_loopAtEnd; }
  void SetLoopAtEnd(bool value) { m_loopAtEnd = value; }
  bool LightsOffAtEnd() const { return m_lightsOffAtEnd; }
  void SetLightsOffAtEnd(bool value) { m_lightsOffAtEnd = value; }
  bool Preload() const { return m_preload; }
  void SetPreload(bool value) { m_preload = value; }
  const std::shared_ptr<InteractiveGroup>& Group() const { return m_group; }
  void SetGroup(std::shared_ptr<InteractiveGroup> value) { m_group = std::move(value); }
  const std::shared_ptr<TriggeredSequences>& RoundRobinBumpee() const { return m_bumpee; }
  void SetRoundRobinBumpee(std::shared_ptr<TriggeredSequences> value) {
    m_bumpee = std::move(value);
  }
  void SetCIO(std::shared_ptr<ChannelIO> value) { m_CIO = std::move(value); }
  bool ErrorOccurred() const { return m_errorOccurred; }
  const std::string& ErrorText() const { return m_errorText; }
  void SetErrorText(std::string value) { m_errorText = std::move(value); }
  int32_t TimesPlayed() const { return m_timesPlayed; }

  // Loads when nothing is held and prepares for play. Failures of any kind
  // set ErrorOccurred and ErrorText instead of raising.
  void InitializeForPlay();
  // Counts the start and tells the tray; does nothing when nothing is held.
  void StartPlay();
  void StopPlay();
  // 0 not playing, 3 stopping, anything else playing.
  int32_t SequencePlayState() const;
  void SyncToMusic(int32_t position);
  void InitMusicSync(int32_t value);
  bool GetEvent(int32_t& playEventType, int32_t& devType, int32_t& lNetwork, uint8_t& byteUnit,
                int32_t& lCircuit, std::string& szChannelName, int32_t& effectType,
                int32_t& lDuration, int32_t& lStartIntensity, int32_t& lEndIntensity,
                int32_t& lPriority, int32_t& nIntensityBlobStartAddress,
                int32_t& nIntensityBlobCount, std::vector<uint8_t>& byteIntensityBlob);
  // The whole event, with its due time, for callers that want it at once.
  bool GetEvent(PlayEvent& event);
  // Milliseconds until GetEvent next has work (0: now); nothing when the
  // sequence is not playing or nothing is held. The show engine sleeps
  // until the earliest of these.
  std::optional<int64_t> MillisecondsUntilDue();

  // The media file, resolved, for musical, interactive, startup and shutdown
  // sequences; "" for the other play types and when the load failed. Loads
  // when nothing is held.
  std::string MediaFilename();
  bool UsesTAV() const;
  bool UsesX10() const;
  bool UsesFennick() const;
  // Also true for a sequence whose load failed, until Decache.
  bool IsCached() const { return m_compressed != nullptr || m_Sequence != nullptr; }
  bool IsCompressed() const { return m_compressed != nullptr; }
  // Releases what is held; the next operation that needs it loads again.
  void Decache();
  // Growth of private memory across the last plain load; 0 until one.
  int32_t LoadMemoryFootprint() const { return m_loadMemoryFootprint; }
  // Runs the sequence's shell command, if it has one. Never raises.
  void ExecuteShellCommand(ShellCommandManager* manager);

 private:
  // Never raises: a failure marks the sequence failed (ErrorOccurred) and
  // is not tried again until Decache.
  void Load();
  // Loads the export when it is current. False when it was found stale (a
  // newer included file, or sources that no longer match its hash), so the
  // plain load writes it again.
  bool LoadCompressedIfCurrent(const std::string& plainPath, const std::string& compressedPath,
                               const FileStatus& plain, const FileStatus& compressed);
  bool IncludesAFileNewerThan(int64_t modifiedNs) const;
  void LoadPlain(const std::string& plainPath, const std::string& compressedPath,
                 bool useCompressed, bool exportStale);
  void Fail(const std::string& text);
  // Nothing when the memory cannot be measured.
  std::optional<int32_t> MemoryNow() const;
  // The compressed sequence when held, else the full one when it loaded,
  // else null.
  Sequence* Held() const;
  void Log(int32_t level, const std::string& text, bool withSequence = false);

  SequencePlayServices m_services;
  std::string m_filename;
  int32_t m_playType = 0;
  int32_t m_section = 0;
  bool m_loopAtEnd = false;
  bool m_lightsOffAtEnd = false;
  bool m_preload = false;
  std::shared_ptr<InteractiveGroup> m_group;
  std::shared_ptr<TriggeredSequences> m_bumpee;
  std::shared_ptr<ChannelIO> m_CIO;
  bool m_errorOccurred = false;
  std::string m_errorText;
  int32_t m_timesPlayed = 0;
  int32_t m_loadMemoryFootprint = 0;
  bool m_loadFailed = false;
  std::shared_ptr<Sequence> m_Sequence;
  std::shared_ptr<Sequence> m_compressed;
};

// The section number a play type reports to the tray.
int32_t SectionOfPlayType(int32_t playType);

}  // namespace tav
