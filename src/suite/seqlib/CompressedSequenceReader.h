#pragma once
// Reads a compressed export piece by piece (docs/tcs-format.md). Opening
// reads and checks the header and the head (metadata, channels, effects and
// the shape of the frame tracks) and nothing more, so asking what an export
// holds costs a short read whatever its length. Frames are read on demand,
// a compressed block at a time, in stream order; the memory held is one
// block.
//
// Every damage is a tav::Error naming the file and, for frames, the block
// and the frames it holds. Owns its file; single-threaded.

#include <cstdint>
#include <memory>
#include <vector>

#include "suite/seqlib/RandomAccessFile.h"
#include "suite/seqlib/StreamedSequence.h"

namespace tav {

class CompressedSequenceReader : public StreamedSequence {
 public:
  explicit CompressedSequenceReader(std::shared_ptr<const RandomAccessFile> file);
  ~CompressedSequenceReader() override;

  const CompiledSequence& Head() const override { return m_head; }
  const std::vector<TrackGroup>& Groups() const override { return m_groups; }
  // Device families the header records (bit n for family n).
  uint32_t FamilyMask() const { return m_families; }
  // Frames per compressed block of each group.
  const std::vector<uint32_t>& FramesPerBlock() const { return m_framesPerBlock; }
  // File bytes read through so far, for progress.
  uint64_t Position() const { return m_offset; }
  uint64_t FileSize() const { return m_file->Size(); }
  size_t MemoryHeld() const override;

 protected:
  const uint8_t* ReadFrame(size_t group, uint32_t frame) override;

 private:
  void ReadHeader();
  void ParseHead(const char* bytes, size_t size);
  // Decompresses the zstd frame at m_offset into `out` (exactly `expected`
  // bytes) and moves m_offset past it; `what` names it in errors.
  void Inflate(uint8_t* out, uint64_t expected, const std::string& what);
  void LoadNextBlock();
  void CheckNothingFollows() const;

  std::shared_ptr<const RandomAccessFile> m_file;
  const std::string& m_name;
  uint32_t m_families = 0;
  uint64_t m_offset = 0;
  CompiledSequence m_head;
  std::vector<TrackGroup> m_groups;
  std::vector<uint32_t> m_framesPerBlock;

  // The next block to load and the one held.
  size_t m_nextGroup = 0;
  uint32_t m_nextBlock = 0;
  size_t m_heldGroup = 0;
  uint32_t m_heldBlock = 0;
  bool m_holding = false;
  std::unique_ptr<uint8_t[]> m_block;
  size_t m_blockCapacity = 0;
  std::vector<uint8_t> m_chunk;
  struct Context;
  std::unique_ptr<Context> m_context;
};

}  // namespace tav
