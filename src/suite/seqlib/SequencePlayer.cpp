#include "suite/seqlib/SequencePlayer.h"

#include "support/Error.h"

namespace tav {

SequencePlayer::SequencePlayer(std::shared_ptr<const Clock> clock,
                               std::unique_ptr<EventStream> stream, int64_t lengthMs)
    : m_clock(std::move(clock)), m_stream(std::move(stream)), m_length(lengthMs) {
  if (!m_clock || !m_stream) throw errors::ObjectNotSet("SequencePlayer");
}

int64_t SequencePlayer::Position() const {
  // Unsigned difference: correct across the tick's 2^32 wrap.
  int64_t elapsed = static_cast<uint32_t>(m_clock->TickCount() - m_baseTick);
  if (m_musicMode && !m_musicSynced && m_state == kStatePlaying) {
    // Media takes a moment to start: hold at the start rather than run
    // ahead of the music, but not for ever if it never reports.
    elapsed = elapsed < kMusicWaitMs ? 0 : elapsed - kMusicWaitMs;
  }
  return m_basePosition + elapsed;
}

void SequencePlayer::Restart(int64_t position) {
  m_baseTick = m_clock->TickCount();
  m_basePosition = position;
  m_stream->Seek(position);
}

void SequencePlayer::InitializeForPlay(bool withMedia) {
  m_state = kStateStopped;
  m_offEvents.clear();
  m_nextOff = 0;
  m_musicMode = withMedia;
  m_musicSynced = false;
  m_musicStart = 0;
  Restart(0);
}

void SequencePlayer::StartPlay() {
  m_offEvents.clear();
  m_nextOff = 0;
  m_musicSynced = false;
  Restart(m_musicMode ? m_musicStart : 0);
  m_state = kStatePlaying;
}

void SequencePlayer::StopPlay() {
  if (m_state != kStatePlaying) return;
  Finish();
}

void SequencePlayer::Finish() {
  m_state = kStateStopping;
  m_offEvents.clear();
  m_nextOff = 0;
  if (m_lightsOff) m_offEvents = m_stream->LightsOff();
}

void SequencePlayer::ForceStop() {
  m_state = kStateStopped;
  m_offEvents.clear();
  m_nextOff = 0;
}

void SequencePlayer::InitMusicSync(int32_t positionMs) {
  m_musicMode = true;
  m_musicSynced = false;
  m_musicStart = positionMs < 0 ? 0 : positionMs;
  if (m_state == kStatePlaying) Restart(m_musicStart);
}

void SequencePlayer::SyncToMusic(int32_t positionMs) {
  if (m_state != kStatePlaying) return;
  int64_t difference = positionMs - Position();
  m_musicMode = true;
  m_musicSynced = true;
  if (difference > kJumpMs || difference < -kJumpMs) {
    // A jump: play from there. What is under way at the new position comes
    // again so the lights match the music.
    Restart(positionMs);
    return;
  }
  // Drift: adopt the media's position as the new base. Events already
  // handed out are not repeated; the next ones fall due by the music.
  m_baseTick = m_clock->TickCount();
  m_basePosition = positionMs;
}

std::optional<int64_t> SequencePlayer::MillisecondsUntilDue() {
  if (m_state == kStateStopped) return std::nullopt;
  if (m_state == kStateStopping) return 0;
  const int64_t position = Position();
  const int64_t next = m_stream->NextTime();
  // The position GetEvent waits for: the next event less the lookahead, or
  // the end of the timeline once the events are exhausted.
  int64_t target;
  if (next != EventStream::kEnd) {
    target = next - m_lookahead;
  } else if (position < m_length) {
    target = m_length;
  } else {
    return 0;
  }
  int64_t wait = target - position;
  if (wait <= 0) return 0;
  if (m_musicMode && !m_musicSynced) {
    // Held at the start while waiting for the music (see Position): the
    // timeline only moves once the wait is over.
    int64_t elapsed = static_cast<uint32_t>(m_clock->TickCount() - m_baseTick);
    if (elapsed < kMusicWaitMs) wait += kMusicWaitMs - elapsed;
  }
  return wait;
}

bool SequencePlayer::GetEvent(PlayEvent& event) {
  if (m_state == kStateStopped) return false;
  uint32_t now = m_clock->TickCount();
  if (m_state == kStateStopping) {
    if (m_nextOff < m_offEvents.size()) {
      event = m_offEvents[m_nextOff++];
      event.lDueTime = Position();
      event.dueTick = now;
      return true;
    }
    m_offEvents.clear();
    m_nextOff = 0;
    m_state = kStateStopped;
    return false;
  }
  for (int pass = 0; pass < 2; ++pass) {
    int64_t position = Position();
    int64_t next = m_stream->NextTime();
    if (next != EventStream::kEnd && next <= position + m_lookahead) {
      m_stream->Next(event);
      event.dueTick = now + static_cast<uint32_t>(event.lDueTime - position);
      return true;
    }
    if (next != EventStream::kEnd || position < m_length) return false;
    if (!m_loop || m_length <= 0 || pass > 0) break;
    // Loop: the next round starts where this one ended, keeping the beat.
    m_basePosition -= m_length;
    m_musicMode = false;
    m_stream->Seek(0);
  }
  Finish();
  return GetEvent(event);
}

}  // namespace tav
