#pragma once
// Plays one event stream against time: the sequence's own clock (the Clock
// port's millisecond tick) or, once music synchronisation is fed, the media
// position, following it when it drifts and re-seeking when it jumps.
// Events are handed out when due, a few milliseconds early (the lookahead)
// with their due tick, so the I/O control can send them on time. Stopping
// passes through state 3 while the lights-off events drain; looping starts
// the timeline again at the end.
//
// Owned by its Sequence; shares the clock. Single-threaded.

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

#include "ports/Clock.h"
#include "suite/seqlib/EventStream.h"

namespace tav {

class SequencePlayer {
 public:
  static constexpr int32_t kStateStopped = 0;
  static constexpr int32_t kStatePlaying = 1;
  static constexpr int32_t kStateStopping = 3;
  static constexpr int32_t kDefaultLookaheadMs = 5;
  // A media position further than this from where the sequence expected
  // it is a jump (seek); anything closer is drift (followed smoothly).
  static constexpr int32_t kJumpMs = 250;
  // How long a sequence with media waits at its start for the first music
  // position before it runs on its own clock.
  static constexpr int32_t kMusicWaitMs = 3000;

  SequencePlayer(std::shared_ptr<const Clock> clock, std::unique_ptr<EventStream> stream,
                 int64_t lengthMs);

  void SetLoopAtEnd(bool loop) { m_loop = loop; }
  void SetLightsOffAtEnd(bool lightsOff) { m_lightsOff = lightsOff; }
  void SetLookaheadMs(int32_t ms) { m_lookahead = ms < 0 ? 0 : ms; }
  int32_t LookaheadMs() const { return m_lookahead; }

  // Back to the start, not playing; with media the timeline will follow the
  // music once SyncToMusic is fed.
  void InitializeForPlay(bool withMedia);
  void StartPlay();
  // Playing -> stopping (3); the lights-off events, when asked for, then
  // come from GetEvent, after which the state is 0.
  void StopPlay();
  // Straight to 0, dropping what was still to come.
  void ForceStop();
  int32_t SequencePlayState() const { return m_state; }

  // The sequence follows the music from now on; it starts (or stands) at
  // `positionMs`. Called before or after StartPlay.
  void InitMusicSync(int32_t positionMs);
  void SyncToMusic(int32_t positionMs);

  // The next due event; false when none is due yet or play has ended.
  bool GetEvent(PlayEvent& event);
  // Milliseconds from now until GetEvent next has something to do (an event
  // within the lookahead, the end of the timeline, the lights-off of a
  // stop), on the present timeline: 0 when that is now, nothing when the
  // sequence is stopped. Lets a caller sleep until then instead of polling;
  // a music position fed later may move the moment.
  std::optional<int64_t> MillisecondsUntilDue();

  // Where the timeline stands now, in milliseconds.
  int64_t Position() const;
  int64_t LengthMs() const { return m_length; }
  size_t MemoryHeld() const { return m_stream->MemoryHeld(); }

 private:
  void Finish();
  void Restart(int64_t position);

  std::shared_ptr<const Clock> m_clock;
  std::unique_ptr<EventStream> m_stream;
  int64_t m_length;
  bool m_loop = false;
  bool m_lightsOff = false;
  int32_t m_lookahead = kDefaultLookaheadMs;
  int32_t m_state = kStateStopped;

  // The timeline: position = m_basePosition + (tick - m_baseTick).
  uint32_t m_baseTick = 0;
  int64_t m_basePosition = 0;
  bool m_musicMode = false;
  bool m_musicSynced = false;
  int64_t m_musicStart = 0;

  std::vector<PlayEvent> m_offEvents;
  size_t m_nextOff = 0;
};

}  // namespace tav
