// The show's sections: preparing their sequences when a show starts, and
// stepping Main and Musical while it runs. Part of ShowPlayer.

#include <algorithm>
#include <cmath>

#include "show/ShowPlayer.h"
#include "support/Numbers.h"

namespace tav {

// ---- Preparing -------------------------------------------------------------

SequenceRef ShowPlayer::MakeSequence(const std::string& filename, int32_t playType, bool loop,
                                     bool lightsOff, std::shared_ptr<InteractiveGroup> group) {
  auto item = std::make_shared<SequencePlayInfo>(m_services.sequences);
  item->SetCIO(m_CIO);
  item->SetPlayType(playType);
  item->SetFilename(filename);
  item->SetLightsOffAtEnd(lightsOff);
  item->SetLoopAtEnd(loop);
  item->SetPreload(m_currentShow->PreloadSequences());
  item->SetGroup(std::move(group));
  if (item->Preload()) {
    // Memory is checked before each load, so preloading a big show stays
    // within the limit.
    RunDecachePass();
    item->InitializeForPlay();
  }
  return item;
}

void ShowPlayer::PrepareList(const std::shared_ptr<Playlist>& playlist, SequenceList& target,
                             int32_t playType, bool loop, bool lightsOff) {
  if (!playlist) return;
  for (const std::string& name : playlist->List()) {
    target.Add(MakeSequence(name, playType, loop, lightsOff, nullptr));
  }
}

void ShowPlayer::PrepareSections() {
  const Show& show = *m_currentShow;
  if (const auto& background = show.Background()) {
    PrepareList(background, m_state.BackgroundList, 1, true, background->LightsOffAtEnd());
  }
  if (const auto& startup = show.Startup()) {
    PrepareList(startup, m_state.StartupList, 3, false, startup->LightsOffAtEnd());
  }
  if (const auto& main = show.Main()) {
    m_state.AnimationType = main->AnimationType();
    PrepareList(main, m_state.MainList, 4, m_state.AnimationType == 2, main->LightsOffAtEnd());
  }
  if (const auto& musical = show.Musical()) {
    m_state.MusicalType = musical->MusicalType();
    m_state.Delay = musical->Delay();
    PrepareList(musical, m_state.MusicalList, 5, false, musical->LightsOffAtEnd());
    for (const SequenceRef& item : m_state.MusicalList) m_state.MusicalPool.Add(item);
    if (!musical->CleanUp().empty()) {
      m_state.CleanUpList.Add(
          MakeSequence(musical->CleanUp(), 6, false, musical->LightsOffAtEnd(), nullptr));
    }
  }
  if (const auto& groups = show.InteractiveGroups()) {
    for (const auto& group : *groups) {
      if (!group) continue;
      InteractiveEntry entry{group, {}};
      for (int32_t i = 0; i < group->Count(); ++i) {
        InteractiveSet set{group->GetTriggeredSequences(i), {}};
        for (int32_t k = 0; k < set.binding->NumSequences(); ++k) {
          // Interactive sequences play once per trigger; the group has no
          // setting that asks for looping.
          set.sequences.Add(
              MakeSequence(set.binding->Sequence(k), 2, false, group->LightsOffAtEnd(), group));
        }
        entry.sets.push_back(std::move(set));
      }
      m_state.InteractiveList.push_back(std::move(entry));
    }
  }
  if (const auto& shutdown = show.Shutdown()) {
    PrepareList(shutdown, m_state.ShutdownList, 7, false, shutdown->LightsOffAtEnd());
  }
}

// ---- Queueing --------------------------------------------------------------

SequenceRef ShowPlayer::Queue(SequenceList& list, int32_t index, bool remove,
                              std::shared_ptr<TriggeredSequences> bumpee) {
  if (index < 1 || index > list.Count()) return nullptr;
  SequenceRef item = list.Item(index);
  item->SetRoundRobinBumpee(std::move(bumpee));
  if (remove) list.Remove(index);
  Log(0, "Queueing", item.get());
  m_state.PlayQueue.Add(item);
  switch (item->PlayType()) {
    case 7:
      m_state.DecacheMode = kDecacheShutdown;
      break;
    case 4:
    case 5:
    case 6:
      m_state.DecacheMode = kDecacheRunning;
      break;
    default:
      break;
  }
  RunDecachePass();
  return item;
}

void ShowPlayer::ReleaseBackground() {
  // All background sequences start together, and loop.
  while (!m_state.BackgroundList.Empty()) Queue(m_state.BackgroundList, 1, true, nullptr);
}

// ---- Main ------------------------------------------------------------------

void ShowPlayer::StepMain() {
  SequenceList& main = m_state.MainList;
  if (main.Empty()) return;
  if (m_state.AnimationType != 2) {
    // One at a time, in order, cycling for as long as the show runs.
    if (m_state.MainIndex < 1 || m_state.MainIndex > main.Count()) m_state.MainIndex = 1;
    Queue(main, m_state.MainIndex, false, nullptr);
    ++m_state.MainIndex;
    return;
  }
  // All at once, looping; the list is empty afterwards.
  while (!main.Empty()) Queue(main, 1, true, nullptr);
}

// ---- Musical ---------------------------------------------------------------

// Each piece is followed by the clean-up sequence (if any), then the pause
// (if any), then the next piece is chosen.
void ShowPlayer::StepMusical() {
  if (m_state.MusicalList.Empty()) {
    m_media.HideVideoForm();
    return;
  }
  switch (m_state.MusicalPhase) {
    case kMusicalCleanUp:
      if (m_state.CleanUpIndex < 1 || m_state.CleanUpIndex > m_state.CleanUpList.Count()) {
        m_state.CleanUpIndex = 1;
        m_state.MusicalPhase = kMusicalDelay;
        m_state.DelayStarted = false;
      } else {
        Queue(m_state.CleanUpList, m_state.CleanUpIndex, false, nullptr);
        ++m_state.CleanUpIndex;
      }
      return;
    case kMusicalDelay:
      StepMusicalDelay();
      return;
    default:
      ChooseMusicalPiece();
      return;
  }
}

// The pause is timed on the seconds-since-midnight clock. An end computed
// past midnight (86400 or more) is never reached once the clock starts again
// from 0, so the musical section then rests until the show ends.
void ShowPlayer::StepMusicalDelay() {
  if (m_state.Delay <= 0) {
    m_state.MusicalPhase = kMusicalChoose;
    return;
  }
  if (!m_state.DelayStarted) {
    Log(1, "Delaying between Musical sequences for " + std::to_string(m_state.Delay) + " seconds");
    m_state.DelayStarted = true;
    m_state.DelayEnd =
        static_cast<int64_t>(RoundHalfEven(m_clock.SecondsSinceMidnight() + m_state.Delay));
    return;
  }
  if (m_clock.SecondsSinceMidnight() >= static_cast<double>(m_state.DelayEnd)) {
    Log(0, "Delay finished");
    m_state.MusicalPhase = kMusicalChoose;
    m_state.DelayStarted = false;
  }
}

void ShowPlayer::ChooseMusicalPiece() {
  m_state.MusicalPhase = kMusicalCleanUp;
  SequenceList& pool = m_state.MusicalPool;
  const Playlist& musical = *m_currentShow->Musical();
  if (pool.Empty()) {
    for (const SequenceRef& item : m_state.MusicalList) pool.Add(item);
  }
  if (m_state.MusicalType == 2) {
    // Shuffle: draw until the piece differs from the last one played, unless
    // it is the only piece, back to back is allowed, or the pool holds
    // nothing else.
    bool poolHasOther = false;
    for (const SequenceRef& item : pool) poolHasOther |= item != m_state.LastMusical;
    const bool anyWillDo =
        m_state.MusicalList.Count() == 1 || musical.ShuffleAllowsBackToBack() || !poolHasOther;
    do {
      double draw = m_random();
      auto index = static_cast<int32_t>(std::floor(draw * pool.Count() + 1));
      m_state.MusicalIndex = std::clamp(index, 1, pool.Count());
    } while (!anyWillDo && pool.Item(m_state.MusicalIndex) == m_state.LastMusical);
  } else if (m_state.MusicalIndex < 1 || m_state.MusicalIndex > pool.Count()) {
    m_state.MusicalIndex = 1;
  }
  const bool remove = m_state.MusicalType == 2 && !musical.ShuffleWithReplacement();
  m_state.LastMusical = Queue(pool, m_state.MusicalIndex, remove, nullptr);
  if (pool.Empty()) {
    // Shuffle without replacement has played every piece: refill, in
    // playlist order.
    for (const SequenceRef& item : m_state.MusicalList) pool.Add(item);
  }
  ++m_state.MusicalIndex;
}

// ---- The decache pass ------------------------------------------------------

void ShowPlayer::RunDecachePass() {
  m_decache.Run([this] { return DecacheCandidates(); }, *m_host);
}

// Which cached sequences may be released, and in which order. Never one
// that plays or is queued. The rank says how soon a sequence will be wanted
// again, from what has been queued so far (DecacheMode):
//  - while the show prepares or its Startup section plays: Shutdown first
//    (needed last), then Main, Musical and clean-up, Startup last;
//  - while Main and Musical run: Startup and Shutdown first (played already,
//    or needed only at the end), then Main, Musical and clean-up (they come
//    round again);
//  - once the Shutdown section is under way: Startup, Main, Musical and
//    clean-up first (they will not play again), Shutdown last.
// Within a rank the largest load goes first (DecachePass).
std::vector<DecacheCandidate> ShowPlayer::DecacheCandidates() const {
  int32_t startupRank = 2, cyclingRank = 1, shutdownRank = 0;
  if (m_state.DecacheMode == kDecacheRunning) {
    startupRank = 0;
    cyclingRank = 1;
    shutdownRank = 0;
  } else if (m_state.DecacheMode == kDecacheShutdown) {
    startupRank = 0;
    cyclingRank = 0;
    shutdownRank = 1;
  }
  std::vector<DecacheCandidate> candidates;
  auto consider = [&](const SequenceList& list, int32_t rank) {
    for (const SequenceRef& item : list) {
      if (!item->IsCached()) continue;
      if (m_state.PlayingList.Contains(item.get()) || m_state.PlayQueue.Contains(item.get())) {
        continue;
      }
      bool seen = false;
      for (const auto& candidate : candidates) seen |= candidate.sequence == item;
      if (!seen) candidates.push_back({item, rank});
    }
  };
  consider(m_state.StartupList, startupRank);
  consider(m_state.MainList, cyclingRank);
  consider(m_state.MusicalList, cyclingRank);
  consider(m_state.CleanUpList, cyclingRank);
  consider(m_state.ShutdownList, shutdownRank);
  return candidates;
}

}  // namespace tav
