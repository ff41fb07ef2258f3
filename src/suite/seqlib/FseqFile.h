#pragma once
// Reader of FSEQ files, versions 1 and 2 (uncompressed, zstd, zlib, sparse
// ranges, variable headers including extended ones) and of ESEQ effect
// files. Opening reads only the headers and the block index; frames are
// read on demand, one compression block at a time, so the memory held is
// about one decompressed block whatever the length of the file.
//
// Ownership: the reader owns its file. Not thread-safe; one reader per
// playing sequence. Every malformed or truncated input gives a tav::Error
// saying what is wrong and where, never undefined behaviour.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "suite/seqlib/RandomAccessFile.h"

namespace tav {

class FseqFile {
 public:
  enum class Compression : uint8_t { None = 0, Zstd = 1, Zlib = 2 };

  struct SparseRange {
    uint32_t start;  // absolute channel, 0-based
    uint32_t count;
  };

  struct VariableHeader {
    std::string code;
    std::string payload;
  };

  // Limits that keep a damaged header from asking for absurd memory.
  static constexpr uint32_t kMaxChannels = 1u << 24;
  static constexpr uint64_t kMaxBlockBytes = 256ull << 20;

  explicit FseqFile(std::shared_ptr<const RandomAccessFile> file);
  ~FseqFile();
  FseqFile(const FseqFile&) = delete;
  FseqFile& operator=(const FseqFile&) = delete;

  // Whether the first bytes look like FSEQ or ESEQ (by content, not name).
  static bool LooksLikeFseq(const void* bytes, size_t size);

  uint8_t MajorVersion() const { return m_major; }
  uint8_t MinorVersion() const { return m_minor; }
  bool IsEffectSequence() const { return m_effect; }
  Compression CompressionType() const { return m_compression; }
  // Bytes of one stored frame: the sparse ranges back to back.
  uint32_t ChannelCount() const { return m_channelCount; }
  uint32_t FrameCount() const { return m_frameCount; }
  uint32_t StepMs() const { return m_stepMs; }
  uint64_t DurationMs() const { return static_cast<uint64_t>(m_frameCount) * m_stepMs; }
  // Never empty: a file without sparse ranges has one range from channel 0.
  // Clipped to the stored frame size.
  const std::vector<SparseRange>& Ranges() const { return m_ranges; }
  size_t BlockCount() const { return m_blocks.size(); }
  const std::vector<VariableHeader>& VariableHeaders() const { return m_headers; }
  // The `mf` header as written (often a path from the authoring machine).
  const std::string& MediaFilename() const { return m_media; }
  const std::string& Producer() const { return m_producer; }

  // The stored bytes of frame n (ChannelCount() of them), valid until the
  // next call; nullptr when n is past the last frame.
  const uint8_t* Frame(uint32_t n);
  // Bytes of buffers held right now (decompressed block, read chunk, frame).
  size_t MemoryHeld() const;

 private:
  struct Block {
    uint32_t firstFrame;
    uint32_t frames;
    uint64_t offset;
    uint64_t length;
  };

  void ParseEseq();
  void ParseHeader();
  void ParseVariableHeaders(const std::vector<uint8_t>& header, size_t start);
  void BuildBlocks(const std::vector<uint8_t>& header, uint32_t indexEntries);
  void LoadBlock(size_t index);
  void InflateZstd(const Block& block, size_t expected);
  void InflateZlib(const Block& block, size_t expected);
  std::string BlockEndsEarly(const Block& block, size_t produced, size_t expected) const;
  std::string Where() const;

  std::shared_ptr<const RandomAccessFile> m_file;
  uint8_t m_major = 0;
  uint8_t m_minor = 0;
  bool m_effect = false;
  Compression m_compression = Compression::None;
  uint32_t m_dataOffset = 0;
  uint64_t m_dataEnd = 0;
  uint32_t m_channelCount = 0;
  uint32_t m_frameCount = 0;
  uint32_t m_stepMs = 0;
  std::vector<SparseRange> m_ranges;
  std::vector<VariableHeader> m_headers;
  std::string m_media;
  std::string m_producer;
  std::vector<Block> m_blocks;

  // The decompressed block in m_block (or the one frame of an uncompressed
  // file in m_frame).
  static constexpr size_t kNoBlock = static_cast<size_t>(-1);
  size_t m_loadedBlock = kNoBlock;
  std::unique_ptr<uint8_t[]> m_block;
  size_t m_blockCapacity = 0;
  std::vector<uint8_t> m_chunk;
  std::vector<uint8_t> m_frame;
  // Which frame m_frame holds: a player asks for one frame once per
  // universe it spans, and reading it again each time would cost a whole
  // frame per universe.
  uint32_t m_frameHeld = UINT32_MAX;
  struct ZstdContext;
  std::unique_ptr<ZstdContext> m_zstd;
};

}  // namespace tav
