#pragma once
// The writes the show engine hands over, held until their frame is due.
// Every level block and effect command carries the tick it is due at; the
// writes due at one tick form one frame. A frame becomes sendable once the
// engine seals what it has accumulated ("send what has been accumulated"),
// so a frame is never sent half-filled while the engine is still pumping
// events into it.
//
// Frames are kept in due order; writes of one frame keep the order they
// arrived in, so a later write to a channel wins. The byte copies of level
// blocks live in per-frame buffers that are reused, so a steady show
// allocates nothing once it runs. Owned by the control.

#include <cstdint>
#include <deque>
#include <optional>
#include <vector>

#include "suite/channelio/EffectEngine.h"

namespace tav {

struct FrameWrite {
  enum class Kind { kDMXLevels, kTAVLevels, kEffect };
  Kind kind = Kind::kDMXLevels;
  // Levels: DMX (universe, 0, first slot) or TAV (network, unit, first
  // circuit), `count` bytes at `offset` in the frame's bytes.
  int32_t network = 0;
  int32_t unit = 0;
  int32_t first = 0;
  int32_t count = 0;
  size_t offset = 0;
  EffectCommand effect;  // kEffect only
  uint32_t dueTick = 0;
};

struct Frame {
  uint32_t dueTick = 0;
  bool sealed = false;
  std::vector<FrameWrite> writes;
  std::vector<uint8_t> bytes;
};

class FrameQueue {
 public:
  void AddLevels(FrameWrite::Kind kind, uint32_t dueTick, int32_t network, int32_t unit,
                 int32_t first, const uint8_t* levels, int32_t count);
  void AddEffect(uint32_t dueTick, const EffectCommand& effect);
  // Makes every frame accumulated so far sendable.
  void SealAll();
  // The due tick of the earliest sealed frame.
  std::optional<uint32_t> NextSealedDue() const;
  // Moves the sealed frames due at or before `now` to `due`, oldest first
  // (a frame still open stops the taking: it may not overtake). Hand them
  // back with Recycle once applied.
  void TakeDue(uint32_t now, std::vector<Frame>& due);
  // Every sealed frame, however far ahead (the control is closing).
  void TakeAllSealed(std::vector<Frame>& due);
  // The due tick of the latest frame held, sealed or not.
  std::optional<uint32_t> LastDue() const;
  void Recycle(std::vector<Frame>& frames);
  bool Empty() const { return m_frames.empty(); }
  size_t Size() const { return m_frames.size(); }
  void Clear();

 private:
  Frame& FrameAt(uint32_t dueTick);

  std::deque<Frame> m_frames;
  std::vector<Frame> m_spare;
};

}  // namespace tav
