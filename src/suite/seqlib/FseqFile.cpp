#include "suite/seqlib/FseqFile.h"

#include <zlib.h>
#define ZSTD_STATIC_LINKING_ONLY  // for the stable-output-buffer parameter
#include <zstd.h>

#include <algorithm>
#include <cstring>

#include "suite/seqlib/SeqErrors.h"

namespace tav {

namespace {

constexpr const char* kSource = "FseqFile";
constexpr size_t kChunkBytes = 64 * 1024;
constexpr uint32_t kEseqHeaderBytes = 20;
constexpr uint32_t kEseqStepMs = 50;
constexpr uint32_t kV1HeaderBytes = 28;
constexpr uint32_t kV2HeaderBytes = 32;

uint32_t U16(const uint8_t* p) {
  return p[0] | (p[1] << 8);
}
uint32_t U24(const uint8_t* p) {
  return p[0] | (p[1] << 8) | (p[2] << 16);
}
uint32_t U32(const uint8_t* p) {
  return p[0] | (p[1] << 8) | (p[2] << 16) | (static_cast<uint32_t>(p[3]) << 24);
}
uint64_t U64(const uint8_t* p) {
  return U32(p) | (static_cast<uint64_t>(U32(p + 4)) << 32);
}

std::string CString(const uint8_t* p, size_t n) {
  const auto* end = static_cast<const uint8_t*>(std::memchr(p, 0, n));
  return std::string(reinterpret_cast<const char*>(p), end ? static_cast<size_t>(end - p) : n);
}

}  // namespace

struct FseqFile::ZstdContext {
  ZSTD_DCtx* ctx = ZSTD_createDCtx();
  ~ZstdContext() { ZSTD_freeDCtx(ctx); }
};

bool FseqFile::LooksLikeFseq(const void* bytes, size_t size) {
  const auto* p = static_cast<const uint8_t*>(bytes);
  return size >= 4 && (p[0] == 'P' || p[0] == 'F' || p[0] == 'E') && p[1] == 'S' && p[2] == 'E' &&
         p[3] == 'Q';
}

FseqFile::FseqFile(std::shared_ptr<const RandomAccessFile> file) : m_file(std::move(file)) {
  if (!m_file) throw errors::ObjectNotSet(kSource);
  uint8_t magic[8] = {};
  ReadExactly(*m_file, 0, magic, 4, kSource, "the magic number");
  if (!LooksLikeFseq(magic, 4)) {
    throw seqerrors::InvalidFormat(
        kSource, m_file->Name() + " is not an FSEQ file (no PSEQ/FSEQ/ESEQ magic)");
  }
  if (magic[0] == 'E') {
    ParseEseq();
  } else {
    ParseHeader();
  }
}

FseqFile::~FseqFile() = default;

std::string FseqFile::Where() const {
  return m_file->Name() + ": ";
}

void FseqFile::ParseEseq() {
  uint8_t header[kEseqHeaderBytes];
  ReadExactly(*m_file, 0, header, sizeof header, kSource, "the ESEQ header");
  m_effect = true;
  m_major = 2;
  m_minor = 0;
  m_channelCount = U32(header + 8);
  uint32_t modelStart = U32(header + 12);
  uint32_t modelSize = U32(header + 16);
  if (m_channelCount == 0 || m_channelCount > kMaxChannels) {
    throw seqerrors::InvalidFormat(
        kSource, Where() + "ESEQ step size " + std::to_string(m_channelCount) + " is out of range");
  }
  if (modelStart == 0) {
    throw seqerrors::InvalidFormat(kSource,
                                   Where() + "ESEQ model start channel is 0 (it counts from 1)");
  }
  m_stepMs = kEseqStepMs;
  m_dataOffset = kEseqHeaderBytes;
  m_dataEnd = m_file->Size();
  m_frameCount = static_cast<uint32_t>(
      std::min<uint64_t>((m_dataEnd - m_dataOffset) / m_channelCount, UINT32_MAX));
  m_ranges.push_back({modelStart - 1, std::min(modelSize, m_channelCount)});
}

void FseqFile::ParseHeader() {
  uint8_t fixed[8];
  ReadExactly(*m_file, 0, fixed, sizeof fixed, kSource, "the fixed header");
  m_dataOffset = U16(fixed + 4);
  m_minor = fixed[6];
  m_major = fixed[7];
  if (m_major != 1 && m_major != 2) {
    throw seqerrors::InvalidFormat(
        kSource, Where() + "unsupported FSEQ major version " + std::to_string(m_major));
  }
  uint32_t fixedBytes = m_major == 1 ? kV1HeaderBytes : kV2HeaderBytes;
  if (m_dataOffset < fixedBytes) {
    throw seqerrors::InvalidFormat(kSource, Where() + "channel data offset " +
                                                std::to_string(m_dataOffset) + " lies inside the " +
                                                std::to_string(fixedBytes) + "-byte fixed header");
  }
  std::vector<uint8_t> header(m_dataOffset);
  ReadExactly(*m_file, 0, header.data(), header.size(), kSource, "the header");

  m_channelCount = U32(&header[10]);
  m_frameCount = U32(&header[14]);
  m_stepMs = header[18];
  if (m_channelCount == 0 || m_channelCount > kMaxChannels) {
    throw seqerrors::InvalidFormat(
        kSource, Where() + "channel count " + std::to_string(m_channelCount) +
                     " is out of range (1 to " + std::to_string(kMaxChannels) + ")");
  }
  if (m_stepMs == 0) throw seqerrors::InvalidFormat(kSource, Where() + "frame step time is 0 ms");
  m_dataEnd = m_file->Size();
  if (m_dataEnd < m_dataOffset) {
    throw seqerrors::PastEndOfFile(kSource, Where() + "the header ends past the end of the file");
  }

  uint32_t indexEntries = 0;
  size_t variableStart = kV1HeaderBytes;
  if (m_major == 2) {
    uint8_t type = header[20] & 0x0F;
    // Unknown compression types are read as uncompressed, as other players do.
    m_compression = type == 1   ? Compression::Zstd
                    : type == 2 ? Compression::Zlib
                                : Compression::None;
    indexEntries = ((header[20] & 0xF0u) << 4) | header[21];
    uint32_t rangeCount = header[22];
    size_t indexEnd = kV2HeaderBytes + 8ull * indexEntries;
    size_t rangesEnd = indexEnd + 6ull * rangeCount;
    if (rangesEnd > m_dataOffset) {
      throw seqerrors::InvalidFormat(
          kSource, Where() + "block index and sparse ranges (" + std::to_string(rangesEnd) +
                       " bytes) run past the channel data offset " + std::to_string(m_dataOffset));
    }
    uint64_t stored = 0;
    for (uint32_t r = 0; r < rangeCount; ++r) {
      const uint8_t* p = &header[indexEnd + 6 * r];
      uint32_t start = U24(p);
      uint32_t count = U24(p + 3);
      // The stored frame is the ranges back to back; clip what would run
      // past it so a damaged table can never index outside the frame.
      uint64_t usable =
          stored >= m_channelCount ? 0 : std::min<uint64_t>(count, m_channelCount - stored);
      if (usable > 0) m_ranges.push_back({start, static_cast<uint32_t>(usable)});
      stored += count;
    }
    variableStart = rangesEnd;
  }
  if (m_ranges.empty()) m_ranges.push_back({0, m_channelCount});

  ParseVariableHeaders(header, variableStart);
  BuildBlocks(header, indexEntries);
}

void FseqFile::ParseVariableHeaders(const std::vector<uint8_t>& header, size_t pos) {
  const size_t end = header.size();
  while (pos + 4 <= end) {
    uint32_t length = U16(&header[pos]);
    std::string code(reinterpret_cast<const char*>(&header[pos + 2]), 2);
    if (length <= 4) {
      pos += 4;
      continue;
    }
    if (pos + length > end) break;  // keep what was read, still play the file
    VariableHeader vh{code,
                      std::string(reinterpret_cast<const char*>(&header[pos + 4]), length - 4)};
    if (code == "ED" && length >= 18) {
      // The payload lives after the channel data; fetch small ones we use.
      const uint8_t* p = &header[pos + 4];
      std::string realCode(reinterpret_cast<const char*>(p), 2);
      uint64_t offset = U64(p + 2);
      uint32_t size = U32(p + 10);
      if (offset >= m_dataOffset && offset < m_dataEnd) m_dataEnd = offset;
      vh.code = realCode;
      vh.payload.clear();
      if ((realCode == "mf" || realCode == "sp") && size <= 65536 &&
          offset + size <= m_file->Size()) {
        vh.payload.resize(size);
        ReadExactly(*m_file, offset, vh.payload.data(), size, kSource, "an extended header");
      }
    }
    if (vh.code == "mf") {
      m_media = CString(reinterpret_cast<const uint8_t*>(vh.payload.data()), vh.payload.size());
    } else if (vh.code == "sp") {
      m_producer = CString(reinterpret_cast<const uint8_t*>(vh.payload.data()), vh.payload.size());
    }
    m_headers.push_back(std::move(vh));
    pos += length;
  }
}

void FseqFile::BuildBlocks(const std::vector<uint8_t>& header, uint32_t indexEntries) {
  if (m_compression == Compression::None) {
    uint64_t needed = m_dataOffset + static_cast<uint64_t>(m_frameCount) * m_channelCount;
    if (needed > m_dataEnd) {
      throw seqerrors::PastEndOfFile(kSource, Where() + std::to_string(m_frameCount) +
                                                  " frames of " + std::to_string(m_channelCount) +
                                                  " channels need " + std::to_string(needed) +
                                                  " bytes, the channel data ends at " +
                                                  std::to_string(m_dataEnd) + " (truncated file?)");
    }
    return;
  }
  uint64_t offset = m_dataOffset;
  for (uint32_t i = 0; i < indexEntries; ++i) {
    const uint8_t* p = &header[kV2HeaderBytes + 8 * i];
    uint32_t first = U32(p);
    uint32_t length = U32(p + 4);
    if (length == 0) continue;  // reserved entries the writer never filled
    if (m_blocks.empty() ? first != 0 : first < m_blocks.back().firstFrame) {
      throw seqerrors::InvalidFormat(
          kSource, Where() + "compression block index entry " + std::to_string(i) +
                       " starts at frame " + std::to_string(first) +
                       (m_blocks.empty() ? ", the first block must start at frame 0"
                                         : ", before the block ahead of it"));
    }
    if (first > m_frameCount) {
      throw seqerrors::InvalidFormat(kSource, Where() + "compression block index entry " +
                                                  std::to_string(i) + " starts at frame " +
                                                  std::to_string(first) + " of " +
                                                  std::to_string(m_frameCount));
    }
    m_blocks.push_back({first, 0, offset, length});
    offset += length;
  }
  if (m_blocks.empty()) {
    // Flagged as compressed with an empty index: everything is one block.
    m_blocks.push_back({0, 0, m_dataOffset, m_dataEnd - m_dataOffset});
    offset = m_dataEnd;
  }
  if (offset > m_dataEnd) {
    throw seqerrors::PastEndOfFile(kSource, Where() + "compression blocks need " +
                                                std::to_string(offset) +
                                                " bytes, the channel data ends at " +
                                                std::to_string(m_dataEnd) + " (truncated file?)");
  }
  for (size_t k = 0; k < m_blocks.size(); ++k) {
    uint32_t next = k + 1 < m_blocks.size() ? m_blocks[k + 1].firstFrame : m_frameCount;
    m_blocks[k].frames = next - m_blocks[k].firstFrame;
    if (static_cast<uint64_t>(m_blocks[k].frames) * m_channelCount > kMaxBlockBytes) {
      throw seqerrors::InvalidFormat(
          kSource, Where() + "compression block " + std::to_string(k) + " would hold " +
                       std::to_string(m_blocks[k].frames) +
                       " frames, more than this reader accepts in one block");
    }
  }
}

const uint8_t* FseqFile::Frame(uint32_t n) {
  if (n >= m_frameCount) return nullptr;
  if (m_compression == Compression::None) {
    if (n == m_frameHeld) return m_frame.data();
    m_frameHeld = UINT32_MAX;
    m_frame.resize(m_channelCount);
    ReadExactly(*m_file, m_dataOffset + static_cast<uint64_t>(n) * m_channelCount, m_frame.data(),
                m_channelCount, kSource, "frame " + std::to_string(n));
    m_frameHeld = n;
    return m_frame.data();
  }
  auto it = std::upper_bound(m_blocks.begin(), m_blocks.end(), n,
                             [](uint32_t frame, const Block& b) { return frame < b.firstFrame; });
  size_t index = static_cast<size_t>(it - m_blocks.begin()) - 1;
  if (index != m_loadedBlock) LoadBlock(index);
  return m_block.get() + static_cast<size_t>(n - m_blocks[index].firstFrame) * m_channelCount;
}

void FseqFile::LoadBlock(size_t index) {
  m_loadedBlock = kNoBlock;
  const Block& block = m_blocks[index];
  size_t expected = static_cast<size_t>(block.frames) * m_channelCount;
  if (expected > m_blockCapacity) {
    // Left uninitialised: a damaged block that promises much and decodes
    // little costs address space, not memory.
    m_block.reset(new uint8_t[expected]);
    m_blockCapacity = expected;
  }
  m_chunk.resize(kChunkBytes);
  if (m_compression == Compression::Zstd) {
    InflateZstd(block, expected);
  } else {
    InflateZlib(block, expected);
  }
  m_loadedBlock = index;
}

std::string FseqFile::BlockEndsEarly(const Block& block, size_t produced, size_t expected) const {
  return Where() + "compression block at offset " + std::to_string(block.offset) + " ends after " +
         std::to_string(produced) + " of " + std::to_string(expected) + " bytes";
}

void FseqFile::InflateZstd(const Block& block, size_t expected) {
  if (!m_zstd) m_zstd = std::make_unique<ZstdContext>();
  ZSTD_DCtx* ctx = m_zstd->ctx;
  ZSTD_DCtx_reset(ctx, ZSTD_reset_session_only);
  // Decode straight into the block buffer: no window buffer of zstd's own.
  ZSTD_DCtx_setParameter(ctx, ZSTD_d_stableOutBuffer, 1);
  ZSTD_outBuffer out{m_block.get(), expected, 0};
  uint64_t readPos = 0;
  bool frameEnded = false;
  while (out.pos < expected) {
    size_t want = std::min<uint64_t>(kChunkBytes, block.length - readPos);
    if (want == 0)
      throw seqerrors::InvalidFormat(kSource, BlockEndsEarly(block, out.pos, expected));
    ReadExactly(*m_file, block.offset + readPos, m_chunk.data(), want, kSource,
                "a compression block");
    readPos += want;
    ZSTD_inBuffer in{m_chunk.data(), want, 0};
    while (in.pos < in.size && out.pos < expected) {
      if (frameEnded) {
        // A block may hold several zstd frames back to back.
        ZSTD_DCtx_reset(ctx, ZSTD_reset_session_only);
        frameEnded = false;
      }
      size_t rc = ZSTD_decompressStream(ctx, &out, &in);
      if (ZSTD_isError(rc)) {
        throw seqerrors::InvalidFormat(kSource, Where() + "zstd block at offset " +
                                                    std::to_string(block.offset) +
                                                    " is damaged: " + ZSTD_getErrorName(rc));
      }
      if (rc == 0) frameEnded = true;
    }
  }
}

void FseqFile::InflateZlib(const Block& block, size_t expected) {
  z_stream zs{};
  if (inflateInit(&zs) != Z_OK) throw seqerrors::FileAccess(kSource, "zlib could not start");
  struct Guard {
    z_stream* zs;
    ~Guard() { inflateEnd(zs); }
  } guard{&zs};
  zs.next_out = m_block.get();
  uint64_t readPos = 0;
  size_t produced = 0;
  while (produced < expected) {
    if (zs.avail_in == 0) {
      size_t want = std::min<uint64_t>(kChunkBytes, block.length - readPos);
      if (want == 0)
        throw seqerrors::InvalidFormat(kSource, BlockEndsEarly(block, produced, expected));
      ReadExactly(*m_file, block.offset + readPos, m_chunk.data(), want, kSource,
                  "a compression block");
      readPos += want;
      zs.next_in = m_chunk.data();
      zs.avail_in = static_cast<uInt>(want);
    }
    zs.avail_out = static_cast<uInt>(std::min<size_t>(expected - produced, 1u << 30));
    int rc = inflate(&zs, Z_NO_FLUSH);
    produced = static_cast<size_t>(zs.next_out - m_block.get());
    if (rc == Z_STREAM_END && produced < expected) {
      throw seqerrors::InvalidFormat(kSource, BlockEndsEarly(block, produced, expected));
    }
    if (rc != Z_OK && rc != Z_STREAM_END && !(rc == Z_BUF_ERROR && zs.avail_in == 0)) {
      throw seqerrors::InvalidFormat(
          kSource, Where() + "zlib block at offset " + std::to_string(block.offset) +
                       " is damaged: " + (zs.msg ? zs.msg : "inflate failed"));
    }
  }
}

size_t FseqFile::MemoryHeld() const {
  return m_blockCapacity + m_chunk.capacity() + m_frame.capacity() +
         m_blocks.capacity() * sizeof(Block) + (m_zstd ? ZSTD_sizeof_DCtx(m_zstd->ctx) : 0);
}

}  // namespace tav
