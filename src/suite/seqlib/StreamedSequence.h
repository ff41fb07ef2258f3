#pragma once
// A compiled sequence read as a stream: its metadata, channels, effects and
// the shape of its frame tracks at once, then its frame levels one frame at
// a time, group after group (TrackGroup.h). Conversions and checks use it to
// handle a sequence of any length while holding a few blocks of frames.
//
// Sources: the compressed-export reader, FSEQ files (FseqConversion.h) and
// compiled sequences in memory (below). Single-threaded; the source owns
// what it reads from.

#include <cstdint>
#include <memory>
#include <vector>

#include "suite/seqlib/CompiledSequence.h"
#include "suite/seqlib/TrackGroup.h"

namespace tav {

class StreamedSequence {
 public:
  virtual ~StreamedSequence() = default;

  // Everything but the frame levels: `tracks` is empty.
  virtual const CompiledSequence& Head() const = 0;
  virtual const std::vector<TrackGroup>& Groups() const = 0;

  // The levels of the next frame (Groups()[GroupIndex()].FrameBytes() of
  // them), valid until the next call; nullptr after the last frame of the
  // last group. Throws tav::Error where the data is damaged.
  const uint8_t* NextFrame();
  // Moves on to frame `frame` of group `group` without handing out the
  // frames between (a source may still have to read them). Never back.
  void SkipTo(size_t group, uint32_t frame);
  // Which frame NextFrame hands out next.
  size_t GroupIndex() const { return m_group; }
  uint32_t FrameIndex() const { return m_frame; }

  // Bytes of buffers held right now.
  virtual size_t MemoryHeld() const = 0;

 protected:
  // Frame `frame` of group `group`. Calls come in stream order, except that
  // skipped frames are left out.
  virtual const uint8_t* ReadFrame(size_t group, uint32_t frame) = 0;

 private:
  void MovePastEmptyGroups();

  size_t m_group = 0;
  uint32_t m_frame = 0;
};

// A compiled sequence in memory as a stream.
class CompiledStreamedSequence : public StreamedSequence {
 public:
  explicit CompiledStreamedSequence(std::shared_ptr<const CompiledSequence> sequence);

  const CompiledSequence& Head() const override { return m_head; }
  const std::vector<TrackGroup>& Groups() const override { return m_groups; }
  size_t MemoryHeld() const override { return m_frame.capacity(); }

 protected:
  const uint8_t* ReadFrame(size_t group, uint32_t frame) override;

 private:
  std::shared_ptr<const CompiledSequence> m_sequence;
  CompiledSequence m_head;
  std::vector<TrackGroup> m_groups;
  std::vector<size_t> m_firstTrack;  // per group, into m_sequence->tracks
  std::vector<uint8_t> m_frame;
};

// Reads the rest of the stream into a whole compiled sequence.
CompiledSequence ReadWhole(StreamedSequence& source);

// The sequence reduced to what is on show at `ms`: every effect, and of
// each frame track only the frame on show then (none when the track has
// not begun or has ended). Reads from the current position; holds one
// frame per track.
CompiledSequence FramesAt(StreamedSequence& source, int64_t ms);

}  // namespace tav
