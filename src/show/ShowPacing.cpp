// When the show timer ticks next. A tick that changes nothing would change
// nothing a millisecond later either, except through time: a sequence's
// next event, the end of the musical pause, or the media position. So after
// a tick that changed something the engine ticks again a millisecond later
// (as a 1 ms timer would), and after one that changed nothing it sleeps
// until the earliest of those moments. Outside events wake it at once.
// Part of ShowPlayer.

#include <algorithm>
#include <cmath>

#include "show/ShowPlayer.h"
#include "support/Error.h"

namespace tav {

// Everything a tick may change besides the sequences' own timelines. Log
// lines stand for the actions that have no field of their own (a stop, a
// start that replaced an ended sequence of the same count).
struct ShowPlayer::Signature {
  const Show* current;
  const Show* next;
  uint64_t logCount;
  int32_t counts[10];
  bool flags[6];
  int32_t numbers[7];
  int64_t delayEnd;
  const void* lastMusical;
  const void* mediaSequence;
  bool videoShown;
  bool networks[3];
  bool timerEnabled;

  friend bool operator==(const Signature& a, const Signature& b) {
    return a.current == b.current && a.next == b.next && a.logCount == b.logCount &&
           std::equal(std::begin(a.counts), std::end(a.counts), std::begin(b.counts)) &&
           std::equal(std::begin(a.flags), std::end(a.flags), std::begin(b.flags)) &&
           std::equal(std::begin(a.numbers), std::end(a.numbers), std::begin(b.numbers)) &&
           a.delayEnd == b.delayEnd && a.lastMusical == b.lastMusical &&
           a.mediaSequence == b.mediaSequence && a.videoShown == b.videoShown &&
           std::equal(std::begin(a.networks), std::end(a.networks), std::begin(b.networks)) &&
           a.timerEnabled == b.timerEnabled;
  }
};

// The tick's frame: its failure handler, and the next tick.
void ShowPlayer::tmrShowPlayer_Timer() {
  if (!m_host) return;
  m_inTick = true;
  m_lastTickAt = m_clock.TickCount();
  const Signature before = TakeSignature();
  try {
    RunTick();
  } catch (const Error& e) {
    Log(3, "tmrShowPlayer_Timer Error: " + e.Description());
  } catch (const std::exception& e) {
    Log(3, "tmrShowPlayer_Timer Error: " + std::string(e.what()));
  }
  m_inTick = false;
  bool changed = m_wokenDuringTick || !(TakeSignature() == before);
  m_wokenDuringTick = false;
  ScheduleNextTick(changed);
}

ShowPlayer::Signature ShowPlayer::TakeSignature() const {
  const ShowState& s = m_state;
  return Signature{
      m_currentShow.get(),
      m_nextShow.get(),
      m_logCount,
      {s.BackgroundList.Count(), s.StartupList.Count(), s.MainList.Count(), s.MusicalList.Count(),
       s.MusicalPool.Count(), s.CleanUpList.Count(), s.ShutdownList.Count(),
       static_cast<int32_t>(s.InteractiveList.size()), s.PlayingList.Count(), s.PlayQueue.Count()},
      {s.BackgroundReleased, s.MainReleased, s.ShutdownStopsIssued, s.ShuttingDown,
       s.TriggersRegistered, s.RegistrationsActive},
      {s.AnimationType, s.MainIndex, s.MusicalType, s.MusicalPhase, s.MusicalIndex, s.CleanUpIndex,
       s.DecacheMode + (s.DelayStarted ? 16 : 0)},
      s.DelayEnd,
      s.LastMusical.get(),
      m_media.MediaSequence().get(),
      m_media.VideoFormShown(),
      {m_networks.TAVInitialized(), m_networks.X10Initialized(), m_networks.FennickInitialized()},
      m_tmrShowPlayer && m_tmrShowPlayer->Enabled(),
  };
}

void ShowPlayer::SetPacing(Pacing pacing) {
  m_pacing = pacing;
  if (!m_tmrShowPlayer) return;
  if (pacing == Pacing::kEveryMillisecond) {
    m_tmrShowPlayer->SetInterval(1);  // keeps it enabled or not
  } else {
    Wake();
  }
}

void ShowPlayer::WakeUp() {
  Wake();
}

// At once; but a tick has already run at this very millisecond, the next
// one comes a millisecond later, as with a 1 ms timer.
void ShowPlayer::Wake() {
  if (m_pacing != Pacing::kWakeWhenDue || !m_tmrShowPlayer || !m_tmrShowPlayer->Enabled()) return;
  if (m_inTick) {
    m_wokenDuringTick = true;
    return;
  }
  const bool tickedNow = m_lastTickAt && *m_lastTickAt == m_clock.TickCount();
  m_tmrShowPlayer->SetNextTickIn(tickedNow ? 1 : 0);
}

void ShowPlayer::ScheduleNextTick(bool changed) {
  if (m_pacing != Pacing::kWakeWhenDue || !m_tmrShowPlayer || !m_tmrShowPlayer->Enabled()) return;
  int64_t wait = changed ? 1 : MillisecondsUntilNextCheck();
  m_tmrShowPlayer->SetNextTickIn(static_cast<uint32_t>(std::clamp<int64_t>(wait, 1, kMaxSleepMs)));
}

int64_t ShowPlayer::MillisecondsUntilNextCheck() {
  if (!m_currentShow || !m_state.PlayQueue.Empty()) return 1;
  int64_t wait = kMaxSleepMs;
  for (const SequenceRef& item : m_state.PlayingList) {
    // A playing-list sequence with nothing due any more ends at its next
    // service.
    wait = std::min(wait, item->MillisecondsUntilDue().value_or(0));
    if (wait <= 0) return 0;
  }
  if (m_media.MediaSequence()) wait = std::min<int64_t>(wait, kMediaSyncPeriodMs);
  // The pause between musical pieces ends when the seconds clock reaches
  // DelayEnd; one at 86400 or beyond is never reached.
  if (m_state.DelayStarted && m_state.DelayEnd < 86400) {
    double remaining = static_cast<double>(m_state.DelayEnd) - m_clock.SecondsSinceMidnight();
    wait = std::min(wait, static_cast<int64_t>(std::ceil(remaining * 1000.0 - 1e-6)));
  }
  return wait;
}

}  // namespace tav
