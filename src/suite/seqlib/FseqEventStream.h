#pragma once
// Plays an FSEQ file: each frame becomes one block of levels per universe
// piece its channels map onto, read from the file one compression block at
// a time. Owns its reader; memory is the reader's block plus one frame.

#include <memory>
#include <vector>

#include "suite/seqlib/EventStream.h"
#include "suite/seqlib/FseqFile.h"
#include "suite/seqlib/UniverseMap.h"

namespace tav {

class FseqEventStream : public EventStream {
 public:
  FseqEventStream(std::unique_ptr<FseqFile> file, const UniverseMap& map);

  void Seek(int64_t ms) override;
  int64_t NextTime() override;
  void Next(PlayEvent& event) override;
  std::vector<PlayEvent> LightsOff() const override;
  size_t MemoryHeld() const override;

  // One universe piece of the stored frame.
  struct Segment {
    int32_t universe;
    int32_t firstSlot;
    uint32_t count;
    uint32_t storedOffset;
  };
  const std::vector<Segment>& Segments() const { return m_segments; }

 private:
  std::unique_ptr<FseqFile> m_file;
  std::vector<Segment> m_segments;
  int64_t m_floor = 0;
  uint32_t m_frame = 0;
  size_t m_segment = 0;
};

// The universe pieces of an FSEQ file's stored frame under `map`.
std::vector<FseqEventStream::Segment> FseqSegments(const FseqFile& file, const UniverseMap& map);

}  // namespace tav
