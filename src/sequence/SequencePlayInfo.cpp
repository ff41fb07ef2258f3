#include "sequence/SequencePlayInfo.h"

#include <algorithm>
#include <cctype>
#include <exception>
#include <limits>

#include "suite/seqlib/CompressedSequence.h"
#include "suite/seqlib/SequencePlayer.h"
#include "support/Error.h"

namespace tav {
namespace {

std::string CompressedSuffix() {
  return std::string(".") + kCompressedExtension;
}

// What the failure being handled says, whatever was thrown. Call only from
// inside a catch block.
std::string CurrentFailureText() {
  try {
    throw;
  } catch (const Error& e) {
    return e.Description();
  } catch (const std::exception& e) {
    return e.what();
  } catch (...) {
    return "Unknown error";
  }
}

bool EndsWithIgnoringCase(const std::string& text, const std::string& suffix) {
  if (text.size() < suffix.size()) return false;
  return std::equal(suffix.rbegin(), suffix.rend(), text.rbegin(), [](char a, char b) {
    return std::tolower(static_cast<unsigned char>(a)) ==
           std::tolower(static_cast<unsigned char>(b));
  });
}

}  // namespace

int32_t SectionOfPlayType(int32_t playType) {
  switch (playType) {
    case 1:
      return 1;
    case 7:
      return 7;
    case 2:
      return 6;
    case 3:
      return 2;
    case 4:
      return 3;
    case 5:
      return 4;
    case 6:
      return 5;
    default:
      return 0;
  }
}

SequencePlayInfo::SequencePlayInfo(SequencePlayServices services)
    : m_services(std::move(services)) {
  if (!m_services.library || !m_services.resolver || !m_services.fileSystem || !m_services.host) {
    throw errors::ObjectNotSet("SequencePlayInfo");
  }
}

void SequencePlayInfo::SetPlayType(int32_t value) {
  m_playType = value;
  m_section = SectionOfPlayType(value);
}

Sequence* SequencePlayInfo::Held() const {
  if (m_compressed) return m_compressed.get();
  // A sequence whose load failed is held, so that it is not loaded again,
  // but it has nothing to play.
  if (m_Sequence && m_Sequence->IsLoaded()) return m_Sequence.get();
  return nullptr;
}

void SequencePlayInfo::Fail(const std::string& text) {
  m_loadFailed = true;
  m_errorOccurred = true;
  m_errorText = text;
}

void SequencePlayInfo::Log(int32_t level, const std::string& text, bool withSequence) {
  m_services.host->LogMessage(level, text, withSequence ? this : nullptr);
}

std::optional<int32_t> SequencePlayInfo::MemoryNow() const {
  if (!m_services.memory) return std::nullopt;
  try {
    return m_services.memory->PrivateBytes();
  } catch (...) {
    return std::nullopt;
  }
}

// ---- Loading ---------------------------------------------------------------

void SequencePlayInfo::Load() {
  // A load that failed, or a name no playable file was found for, is not
  // tried again until a decache: the engine asks on every tick.
  if (m_loadFailed || m_filename.empty()) return;
  try {
    const FileSystem& files = *m_services.fileSystem;
    if (!files.Stat(m_filename).IsFile()) {
      Log(1, "Checking Q7 sequence: " + m_filename);
      std::string asked = m_filename;
      m_filename = m_services.host->CreatePlaybackFileIfNeeded(m_filename);
      if (m_filename.empty()) {
        Fail("No playable file for " + asked);
        return;
      }
    }
    if (EndsWithIgnoringCase(m_filename, CompressedSuffix())) {
      m_filename.resize(m_filename.size() - CompressedSuffix().size());
    }
    const std::string plainPath =
        m_services.resolver->ResolvePath(m_filename, PathResolver::kKindSequence);
    const std::string compressedPath = plainPath + CompressedSuffix();
    // Stat reports a directory or a path it cannot examine as no file.
    FileStatus plain = files.Stat(plainPath);
    FileStatus compressed = files.Stat(compressedPath);
    if (!plain.IsFile()) plain = FileStatus{};
    if (!compressed.IsFile()) compressed = FileStatus{};

    bool useCompressed =
        m_services.useCompressedSequences ? m_services.useCompressedSequences() : true;
    bool exportStale = false;
    if (compressed.exists && useCompressed) {
      exportStale = !LoadCompressedIfCurrent(plainPath, compressedPath, plain, compressed);
    }
    if (!m_compressed) LoadPlain(plainPath, compressedPath, useCompressed, exportStale);
  } catch (...) {
    Fail(CurrentFailureText());
  }
}

bool SequencePlayInfo::LoadCompressedIfCurrent(const std::string& plainPath,
                                               const std::string& compressedPath,
                                               const FileStatus& plain,
                                               const FileStatus& compressed) {
  // Equal times load the plain file: only a strictly newer export is trusted.
  if (plain.exists && !(compressed.modifiedNs > plain.modifiedNs)) return true;
  Log(1, "Loading compressed sequence: " + compressedPath);
  try {
    m_compressed = m_services.library->LoadCompressed(compressedPath);
    if (!m_compressed) return true;
    if (IncludesAFileNewerThan(compressed.modifiedNs)) {
      Log(1, std::string("Compressed sequence uses a more recent ") +
                 "subsequence - loading sequence instead");
      m_compressed.reset();
      return false;
    }
    // Times can lie: a copy put back from a backup keeps its older time.
    // The export records the hash of the files it was made from.
    if (plain.exists &&
        m_services.library->CurrentSourceHash(plainPath, m_compressed->SubsequenceNames()) !=
            m_compressed->Info().sourceHash) {
      Log(1, "Compressed sequence does not match its sequence file - loading sequence instead");
      m_compressed.reset();
      return false;
    }
  } catch (...) {
    Log(2, "Cannot load compressed sequence file for " + m_filename);
    m_compressed.reset();
  }
  return true;
}

bool SequencePlayInfo::IncludesAFileNewerThan(int64_t modifiedNs) const {
  // The export lists every file it included, nested ones too, where the
  // library found them; older exports name them as the sequence did.
  for (const std::string& name : m_compressed->SubsequenceNames()) {
    std::string path = PathResolver::IsAbsolute(name)
                           ? name
                           : m_services.resolver->ResolvePath(name, PathResolver::kKindSequence);
    FileStatus sub = m_services.fileSystem->Stat(path);
    if (sub.IsFile() && sub.modifiedNs > modifiedNs) return true;
  }
  return false;
}

void SequencePlayInfo::LoadPlain(const std::string& plainPath, const std::string& compressedPath,
                                 bool useCompressed, bool exportStale) {
  auto sequence = m_services.library->CreateSequence();
  sequence->SetKeepAlive([this] {
    if (!m_CIO) return;
    try {
      m_CIO->KeepAlive();
    } catch (...) {
      // A keep-alive that fails must not fail the load.
    }
  });
  // Held before it loads: a load that fails leaves a failed sequence, not
  // one to be tried again at the next question.
  m_Sequence = sequence;
  Log(1, "Loading sequence: " + m_filename);
  std::optional<int32_t> before = MemoryNow();
  try {
    sequence->LoadFile(plainPath);
  } catch (...) {
    Fail(CurrentFailureText());
    return;
  }
  std::optional<int32_t> after = MemoryNow();
  // A measurement that failed leaves the footprint unknown, which counts as 0.
  int64_t growth = before && after ? static_cast<int64_t>(*after) - *before : 0;
  m_loadMemoryFootprint =
      growth > 0
          ? static_cast<int32_t>(std::min<int64_t>(growth, std::numeric_limits<int32_t>::max()))
          : 0;

  if (!useCompressed) return;
  try {
    // An export found stale is written again even if its hash still matches
    // (a subsequence touched but unchanged), or it would never be used again.
    if (!exportStale && sequence->HasBeenExported()) return;
    Log(1, "Exporting compressed sequence for " + m_filename);
    m_services.library->WriteCompressed(*sequence, compressedPath);
  } catch (...) {
    Log(2, "Cannot export compressed sequence for " + m_filename);
  }
}

void SequencePlayInfo::Decache() {
  m_compressed.reset();
  m_Sequence.reset();
  m_loadFailed = false;
}

// ---- Play ------------------------------------------------------------------

void SequencePlayInfo::InitializeForPlay() {
  if (m_filename.empty()) {
    // A name that led to no playable file already says so.
    if (!m_loadFailed) {
      m_errorOccurred = true;
      m_errorText = "No filename specified";
    }
    return;
  }
  try {
    if (!IsCached()) Load();
    if (m_loadFailed) return;
    bool withMedia = !MediaFilename().empty();
    Sequence* held = Held();
    if (!held) return;
    if (held->SequencePlayState() == SequencePlayer::kStateStopping) {
      Log(0, "Forcing stop of still-stopping sequence", true);
      held->ForceStop();
    }
    held->SetLoopAtEnd(m_loopAtEnd);
    held->SetLightsOffAtEnd(m_lightsOffAtEnd);
    held->InitializeForPlay(withMedia);
  } catch (...) {
    m_errorOccurred = true;
    m_errorText = CurrentFailureText();
  }
}

void SequencePlayInfo::StartPlay() {
  Sequence* held = Held();
  if (!held) return;
  held->StartPlay();
  if (m_timesPlayed == std::numeric_limits<int32_t>::max()) {
    throw errors::Overflow("SequencePlayInfo.StartPlay");
  }
  ++m_timesPlayed;
  m_services.host->SendSequenceStartToTAVTray(*this);
}

void SequencePlayInfo::StopPlay() {
  if (Sequence* held = Held()) held->StopPlay();
}

int32_t SequencePlayInfo::SequencePlayState() const {
  Sequence* held = Held();
  return held ? held->SequencePlayState() : 0;
}

void SequencePlayInfo::SyncToMusic(int32_t position) {
  if (Sequence* held = Held()) held->SyncToMusic(position);
}

void SequencePlayInfo::InitMusicSync(int32_t value) {
  // Only the full sequence takes the music sync set-up.
  if (m_Sequence) m_Sequence->InitMusicSync(value);
}

std::optional<int64_t> SequencePlayInfo::MillisecondsUntilDue() {
  Sequence* held = Held();
  return held ? held->MillisecondsUntilDue() : std::nullopt;
}

bool SequencePlayInfo::GetEvent(PlayEvent& event) {
  Sequence* held = Held();
  return held ? held->GetEvent(event) : false;
}

bool SequencePlayInfo::GetEvent(int32_t& playEventType, int32_t& devType, int32_t& lNetwork,
                                uint8_t& byteUnit, int32_t& lCircuit, std::string& szChannelName,
                                int32_t& effectType, int32_t& lDuration, int32_t& lStartIntensity,
                                int32_t& lEndIntensity, int32_t& lPriority,
                                int32_t& nIntensityBlobStartAddress, int32_t& nIntensityBlobCount,
                                std::vector<uint8_t>& byteIntensityBlob) {
  PlayEvent event;
  if (!GetEvent(event)) return false;
  playEventType = event.playEventType;
  devType = event.devType;
  lNetwork = event.lNetwork;
  byteUnit = event.byteUnit;
  lCircuit = event.lCircuit;
  szChannelName = event.szChannelName;
  effectType = event.effectType;
  lDuration = event.lDuration;
  lStartIntensity = event.lStartIntensity;
  lEndIntensity = event.lEndIntensity;
  lPriority = event.lPriority;
  nIntensityBlobStartAddress = event.nIntensityBlobStartAddress;
  nIntensityBlobCount = event.nIntensityBlobCount;
  // The caller's buffer is left alone unless the event carries levels.
  if (playEventType == kPlayEventLevels && nIntensityBlobCount > 0) {
    byteIntensityBlob = std::move(event.byteIntensityBlob);
  }
  return true;
}

// ---- Queries ---------------------------------------------------------------

std::string SequencePlayInfo::MediaFilename() {
  // Only these sections play media: musical, interactive, startup, shutdown.
  if (m_playType != 5 && m_playType != 2 && m_playType != 3 && m_playType != 7) return "";
  if (!IsCached()) Load();
  Sequence* held = Held();
  if (!held) return "";
  std::string media = held->MediaFilename();
  if (media.empty()) return "";
  return m_services.resolver->ResolvePath(media, PathResolver::kKindMedia);
}

bool SequencePlayInfo::UsesTAV() const {
  Sequence* held = Held();
  return held && held->UsesTAV();
}

bool SequencePlayInfo::UsesX10() const {
  Sequence* held = Held();
  return held && held->UsesX10();
}

bool SequencePlayInfo::UsesFennick() const {
  Sequence* held = Held();
  return held && held->UsesFennick();
}

void SequencePlayInfo::ExecuteShellCommand(ShellCommandManager* manager) {
  Sequence* held = Held();
  if (!held || !manager) return;
  try {
    std::string commandLine = held->ShellCommand();
    if (commandLine.empty()) return;
    std::shared_ptr<ShellCommand> command = manager->PrepareCommand(commandLine);
    if (!command) return;
    held->CompleteShellCommand(*command);
    manager->RunCommand(*command);
  } catch (...) {
    // A command that cannot run must never disturb the show.
  }
}

}  // namespace tav
