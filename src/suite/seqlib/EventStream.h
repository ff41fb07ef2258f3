#pragma once
// The events of a sequence in play order, on the sequence's own timeline
// (milliseconds from its start). A player pulls from one stream; streams
// exist for compiled sequences in memory and for FSEQ files read block by
// block. A stream knows nothing of clocks or states.

#include <cstdint>
#include <limits>
#include <vector>

#include "suite/seqlib/PlayEvent.h"

namespace tav {

class EventStream {
 public:
  static constexpr int64_t kEnd = std::numeric_limits<int64_t>::max();

  virtual ~EventStream() = default;
  // Positions the stream at `ms`: what is already under way there comes
  // first, due at `ms` (an effect with its remaining duration, the frame on
  // show), then everything due later.
  virtual void Seek(int64_t ms) = 0;
  // When the next event is due, or kEnd when there is none.
  virtual int64_t NextTime() = 0;
  // Fills `event` with the next event (lDueTime set) and moves past it.
  // Only called when NextTime() is not kEnd.
  virtual void Next(PlayEvent& event) = 0;
  // Events that put out every light the stream addresses.
  virtual std::vector<PlayEvent> LightsOff() const = 0;
  // Bytes of buffers the stream holds while it plays.
  virtual size_t MemoryHeld() const = 0;
};

}  // namespace tav
