#pragma once
// Writes a compressed export piece by piece (docs/tcs-format.md): the head
// (metadata, channels, effects and the shape of the frame tracks) at once,
// then the frames of each track group in order, compressed a block at a
// time, and last the sizes into the header. Holds one block, so an export of
// any length is written with a few megabytes.
//
// The caller owns the file and commits it once Finish has returned; a
// writer given up half way leaves an uncommitted file, which changes
// nothing. Throws tav::Error.

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "suite/seqlib/CompiledSequence.h"
#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/StreamedSequence.h"
#include "suite/seqlib/TrackGroup.h"

namespace tav {

class CompressedSequenceWriter {
 public:
  // `head.tracks` is not written; the groups say what frames follow.
  CompressedSequenceWriter(WritableFile& out, const CompiledSequence& head,
                           std::vector<TrackGroup> groups, int level = 3);
  ~CompressedSequenceWriter();
  CompressedSequenceWriter(const CompressedSequenceWriter&) = delete;
  CompressedSequenceWriter& operator=(const CompressedSequenceWriter&) = delete;

  // The next frame: the current group's FrameBytes() levels.
  void AddFrame(const uint8_t* levels);
  // After the last frame of the last group.
  void Finish();
  // Called after each block is compressed: a long export raises the
  // sequence's KeepAlive through it so outputs keep refreshing.
  void SetProgress(std::function<void()> progress) { m_progress = std::move(progress); }
  size_t MemoryHeld() const;

 private:
  void FlushBlock();
  void AppendCompressed(const void* bytes, size_t size);
  void SkipEmptyGroups();

  WritableFile& m_out;
  std::vector<TrackGroup> m_groups;
  std::vector<uint32_t> m_framesPerBlock;
  uint64_t m_sourceHash;
  uint32_t m_families;
  uint64_t m_uncompressed = 0;
  size_t m_group = 0;
  uint32_t m_frame = 0;  // frames of the current group given so far
  std::vector<uint8_t> m_block;
  std::string m_compressed;
  struct Context;
  std::unique_ptr<Context> m_context;
  std::function<void()> m_progress;
};

// Copies what is left of a stream into an export at `out`; `progress`, when
// given, is called after each block.
void WriteCompressedSequence(StreamedSequence& source, WritableFile& out, int level = 3,
                             const std::function<void()>& progress = {});

}  // namespace tav
