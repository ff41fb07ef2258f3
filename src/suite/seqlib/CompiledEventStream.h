#pragma once
// Plays a compiled sequence from memory: its effects, already in play
// order, merged with the frames of its tracks. Shares the compiled
// sequence, which must not change while the stream exists.

#include <memory>

#include "suite/seqlib/CompiledSequence.h"
#include "suite/seqlib/EventStream.h"

namespace tav {

class CompiledEventStream : public EventStream {
 public:
  explicit CompiledEventStream(std::shared_ptr<const CompiledSequence> sequence);

  void Seek(int64_t ms) override;
  int64_t NextTime() override;
  void Next(PlayEvent& event) override;
  std::vector<PlayEvent> LightsOff() const override;
  size_t MemoryHeld() const override;

 private:
  void FillEffect(const CompiledEffect& effect, PlayEvent& event) const;
  // The track whose next frame is due first, or -1.
  int NextTrack() const;

  std::shared_ptr<const CompiledSequence> m_sequence;
  int64_t m_floor = 0;  // nothing is due before the last seek
  size_t m_nextEffect = 0;
  std::vector<CompiledEffect> m_resumed;  // effects under way at the seek
  size_t m_nextResumed = 0;
  std::vector<size_t> m_nextFrame;  // per track
};

}  // namespace tav
