#pragma once
// Writes FSEQ files (version 2 with none, zstd or zlib compression and
// optional sparse ranges, or version 1), laid out as the common free
// sequencers write them: a short first block so playback starts fast,
// reserved index entries left zero, NUL-terminated `mf`/`sp` headers.
// Used by conversion, benchmarks and tests. Frames are compressed as they
// arrive; the finished file is returned as bytes.

#include <cstdint>
#include <string>
#include <vector>

#include "suite/seqlib/FseqFile.h"

namespace tav {

class FseqWriter {
 public:
  struct Options {
    uint8_t major = 2;
    uint8_t minor = 0;
    FseqFile::Compression compression = FseqFile::Compression::Zstd;
    int level = 2;
    uint32_t stepMs = 50;
    uint32_t firstBlockFrames = 10;
    uint32_t framesPerBlock = 40;
    uint32_t spareIndexEntries = 2;
    std::vector<FseqFile::SparseRange> ranges;
    std::string media;
    std::string producer;
  };

  // channelCount is the stored frame size (the sum of the sparse ranges).
  FseqWriter(uint32_t channelCount, Options options);
  void AddFrame(const uint8_t* frame);
  std::string Finish();

 private:
  void FlushBlock();

  uint32_t m_channelCount;
  Options m_options;
  uint32_t m_frames = 0;
  std::vector<uint8_t> m_pending;
  uint32_t m_pendingFrames = 0;
  struct BlockEntry {
    uint32_t firstFrame;
    uint32_t length;
  };
  std::vector<BlockEntry> m_index;
  std::string m_data;
};

}  // namespace tav
