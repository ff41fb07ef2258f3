#pragma once
// FSEQ files in the compiled form, for conversion and for FSEQ files
// included as subsequences; playing an FSEQ file never does this.
// FseqToSequenceData reads a file whole into the authored form;
// FseqStreamedSequence reads it as a stream of frames, a compression block
// at a time, for conversions of any length.

#include <functional>
#include <memory>
#include <vector>

#include "suite/seqlib/FseqEventStream.h"
#include "suite/seqlib/FseqFile.h"
#include "suite/seqlib/SequenceData.h"
#include "suite/seqlib/StreamedSequence.h"
#include "suite/seqlib/UniverseMap.h"

namespace tav {

// One DMX track per universe piece, every frame.
SequenceData FseqToSequenceData(FseqFile& file, const UniverseMap& map,
                                const std::function<void()>& keepAlive = {});

// One track group: a DMX track per universe piece, the file's frames.
class FseqStreamedSequence : public StreamedSequence {
 public:
  FseqStreamedSequence(std::unique_ptr<FseqFile> file, const UniverseMap& map,
                       uint64_t sourceHash = 0);

  const CompiledSequence& Head() const override { return m_head; }
  const std::vector<TrackGroup>& Groups() const override { return m_groups; }
  const FseqFile& File() const { return *m_file; }
  size_t MemoryHeld() const override { return m_file->MemoryHeld() + m_frame.capacity(); }

 protected:
  const uint8_t* ReadFrame(size_t group, uint32_t frame) override;

 private:
  std::unique_ptr<FseqFile> m_file;
  std::vector<FseqEventStream::Segment> m_segments;
  CompiledSequence m_head;
  std::vector<TrackGroup> m_groups;
  std::vector<uint8_t> m_frame;
};

}  // namespace tav
