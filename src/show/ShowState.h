#pragma once
// What the show engine knows about the show it is running: the sequences of
// each section, the play queue and the playing list, the gates that hold
// sections back, and where Main and Musical stand. All of it starts afresh
// with each show (a new ShowState), so nothing of one show leaks into the
// next. Plain data, owned by the ShowPlayer.

#include <cstdint>
#include <memory>
#include <vector>

#include "show/InteractiveGroup.h"
#include "show/SequenceList.h"
#include "show/TriggeredSequences.h"

namespace tav {

// The prepared sequences of one trigger binding of an interactive group, in
// the binding's order.
struct InteractiveSet {
  std::shared_ptr<TriggeredSequences> binding;
  SequenceList sequences;
};

// One interactive group with its bindings, in the group's order.
struct InteractiveEntry {
  std::shared_ptr<InteractiveGroup> group;
  std::vector<InteractiveSet> sets;
};

// MusicalPhase values: choose the next piece, play the clean-up, wait.
constexpr int32_t kMusicalChoose = 0;
constexpr int32_t kMusicalCleanUp = 1;
constexpr int32_t kMusicalDelay = 2;

// DecacheMode values: set as sections are queued, read by the decache pass.
constexpr int32_t kDecacheNone = 0;
constexpr int32_t kDecacheRunning = 1;   // Main, Musical or clean-up queued
constexpr int32_t kDecacheShutdown = 2;  // a Shutdown sequence queued

struct ShowState {
  SequenceList BackgroundList;
  SequenceList StartupList;
  SequenceList MainList;
  SequenceList MusicalList;  // every prepared musical piece; never consumed
  SequenceList MusicalPool;  // the pieces still to be drawn from
  SequenceList CleanUpList;  // zero or one clean-up sequence
  SequenceList ShutdownList;
  std::vector<InteractiveEntry> InteractiveList;
  SequenceList PlayingList;  // started and not yet ended
  SequenceList PlayQueue;    // to be started on the next tick

  bool BackgroundReleased = false;
  bool MainReleased = false;
  bool ShutdownStopsIssued = false;
  // The show is being wound down because a next show has been set.
  bool ShuttingDown = false;
  bool TriggersRegistered = false;
  // Some input (startup or interactive) is registered with the I/O control.
  bool RegistrationsActive = false;

  int32_t AnimationType = 0;
  int32_t MainIndex = 1;

  int32_t MusicalType = 0;
  int32_t Delay = 0;
  int32_t MusicalPhase = kMusicalChoose;
  int32_t MusicalIndex = 1;
  // From 1, so that the first piece is followed by its clean-up as every
  // later one is.
  int32_t CleanUpIndex = 1;
  bool DelayStarted = false;
  // Whole seconds since midnight; may lie beyond 86399 (then never reached).
  int64_t DelayEnd = 0;
  // The last musical piece queued; kept across pool refills so a shuffle
  // never repeats a piece back to back across the refill either.
  SequenceRef LastMusical;

  int32_t DecacheMode = kDecacheNone;
};

}  // namespace tav
