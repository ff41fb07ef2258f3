#include "suite/seqlib/Sequence.h"

#include <algorithm>

#include "support/Error.h"

namespace tav {

namespace {
const SequenceInfo kNoInfo;
}

Sequence::Sequence(std::shared_ptr<const Clock> clock, SequenceLoader loader)
    : m_clock(std::move(clock)), m_loader(std::move(loader)) {
  if (!m_clock) throw errors::ObjectNotSet("Sequence");
}

std::function<void()> Sequence::KeepAliveRaiser() const {
  if (!m_keepAlive) return [] {};
  struct Pace {
    uint32_t last = 0;
    bool raised = false;
  };
  return [clock = m_clock, handler = m_keepAlive, pace = std::make_shared<Pace>()] {
    uint32_t now = clock->TickCount();
    if (pace->raised && now - pace->last < kKeepAliveIntervalMs) return;
    pace->raised = true;
    pace->last = now;
    handler();
  };
}

void Sequence::LoadFile(const std::string& path) {
  if (!m_loader) throw errors::ObjectNotSet("Sequence.LoadFile");
  Attach(m_loader(path, KeepAliveRaiser()));
}

void Sequence::Attach(std::shared_ptr<const SequenceContent> content) {
  if (!content || !content->openStream) throw errors::ObjectNotSet("Sequence.Attach");
  auto player =
      std::make_unique<SequencePlayer>(m_clock, content->openStream(), content->info.lengthMs);
  player->SetLoopAtEnd(m_loop);
  player->SetLightsOffAtEnd(m_lightsOff);
  player->SetLookaheadMs(m_lookahead);
  m_content = std::move(content);
  m_player = std::move(player);
}

const SequenceInfo& Sequence::Info() const {
  return m_content ? m_content->info : kNoInfo;
}

std::string Sequence::MediaFilename() const {
  return Info().media;
}
std::string Sequence::ShellCommand() const {
  return Info().shellCommand;
}

std::vector<std::string> Sequence::SubsequenceNames() const {
  std::vector<std::string> names;
  for (const auto& sub : Info().subsequences) names.push_back(sub.file);
  return names;
}

bool Sequence::UsesFamily(int32_t family) const {
  const auto& families = Info().families;
  return std::find(families.begin(), families.end(), family) != families.end();
}

bool Sequence::HasBeenExported() const {
  return m_content && m_content->hasBeenExported ? m_content->hasBeenExported() : false;
}

void Sequence::SetLoopAtEnd(bool loop) {
  m_loop = loop;
  if (m_player) m_player->SetLoopAtEnd(loop);
}

void Sequence::SetLightsOffAtEnd(bool lightsOff) {
  m_lightsOff = lightsOff;
  if (m_player) m_player->SetLightsOffAtEnd(lightsOff);
}

void Sequence::SetLookaheadMs(int32_t ms) {
  m_lookahead = ms;
  if (m_player) m_player->SetLookaheadMs(ms);
}

void Sequence::InitializeForPlay(bool withMedia) {
  if (m_player) m_player->InitializeForPlay(withMedia);
}
void Sequence::StartPlay() {
  if (m_player) m_player->StartPlay();
}
void Sequence::StopPlay() {
  if (m_player) m_player->StopPlay();
}
void Sequence::ForceStop() {
  if (m_player) m_player->ForceStop();
}
int32_t Sequence::SequencePlayState() const {
  return m_player ? m_player->SequencePlayState() : SequencePlayer::kStateStopped;
}
void Sequence::InitMusicSync(int32_t positionMs) {
  if (m_player) m_player->InitMusicSync(positionMs);
}
void Sequence::SyncToMusic(int32_t positionMs) {
  if (m_player) m_player->SyncToMusic(positionMs);
}
bool Sequence::GetEvent(PlayEvent& event) {
  return m_player ? m_player->GetEvent(event) : false;
}
std::optional<int64_t> Sequence::MillisecondsUntilDue() {
  return m_player ? m_player->MillisecondsUntilDue() : std::nullopt;
}
int64_t Sequence::Position() const {
  return m_player ? m_player->Position() : 0;
}

void Sequence::CompleteShellCommand(tav::ShellCommand& command) const {
  const std::string& path = Info().path;
  auto slash = path.find_last_of('/');
  if (command.workingDirectory.empty() && slash != std::string::npos) {
    command.workingDirectory = slash == 0 ? "/" : path.substr(0, slash);
  }
  command.environment.emplace_back("TAV_SEQUENCE_FILE", path);
  command.environment.emplace_back("TAV_MEDIA_FILE", Info().media);
}

size_t Sequence::MemoryHeld() const {
  return m_player ? m_player->MemoryHeld() : 0;
}

}  // namespace tav
