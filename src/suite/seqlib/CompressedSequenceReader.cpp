#include "suite/seqlib/CompressedSequenceReader.h"

#define ZSTD_STATIC_LINKING_ONLY  // for the stable-output-buffer parameter
#include <zstd.h>

#include <algorithm>

#include "suite/seqlib/CompressedSequenceLayout.h"
#include "suite/seqlib/PlayEvent.h"

namespace tav {

namespace {

using tcs::kReadSource;
constexpr size_t kChunkBytes = 64 * 1024;

uint32_t BlocksOf(const TrackGroup& group, uint32_t framesPerBlock) {
  return group.frameCount / framesPerBlock + (group.frameCount % framesPerBlock != 0);
}

}  // namespace

struct CompressedSequenceReader::Context {
  ZSTD_DCtx* ctx = ZSTD_createDCtx();
  ~Context() { ZSTD_freeDCtx(ctx); }
};

CompressedSequenceReader::CompressedSequenceReader(std::shared_ptr<const RandomAccessFile> file)
    : m_file(file ? std::move(file) : throw errors::ObjectNotSet(kReadSource)),
      m_name(m_file->Name()),
      m_context(std::make_unique<Context>()) {
  ReadHeader();
  // Left uninitialised: a damaged size that promises much and decodes little
  // costs address space, not memory.
  uint8_t frameHeader[ZSTD_FRAMEHEADERSIZE_MAX] = {};
  size_t got = m_file->ReadAt(m_offset, frameHeader, sizeof frameHeader);
  unsigned long long size = ZSTD_getFrameContentSize(frameHeader, got);
  if (size == ZSTD_CONTENTSIZE_ERROR || size == ZSTD_CONTENTSIZE_UNKNOWN ||
      size > tcs::kMaxHeadBytes) {
    throw seqerrors::InvalidFormat(kReadSource,
                                   m_name + ": the head is damaged (no readable zstd frame)");
  }
  std::unique_ptr<char[]> head(new char[size > 0 ? size : 1]);
  Inflate(reinterpret_cast<uint8_t*>(head.get()), size, "the head");
  ParseHead(head.get(), size);
  // What the groups promise must fit into what is left of the file, so that
  // nobody reserves room for levels a damaged head only claims.
  uint64_t promised = 0;
  for (const auto& group : m_groups) {
    // At most 2^32 frames of 2^24 bytes each; saturate rather than wrap.
    promised =
        std::min<uint64_t>(promised + uint64_t{group.frameCount} * group.FrameBytes(), 1ull << 62);
  }
  uint64_t left = m_file->Size() - m_offset;
  if (promised / tcs::kMaxExpansion > left) {
    throw seqerrors::InvalidFormat(
        kReadSource, m_name + ": the track groups promise " + std::to_string(promised) +
                         " bytes of levels, more than the " + std::to_string(left) +
                         " bytes after the head can hold");
  }
  bool anyBlock = false;
  for (size_t g = 0; g < m_groups.size(); ++g) anyBlock |= m_groups[g].frameCount > 0;
  if (!anyBlock) CheckNothingFollows();
}

CompressedSequenceReader::~CompressedSequenceReader() = default;

void CompressedSequenceReader::ReadHeader() {
  uint8_t h[tcs::kHeaderBytes] = {};
  size_t got = m_file->ReadAt(0, h, sizeof h);
  if (got < 4 || std::memcmp(h, tcs::kMagic, 4) != 0) {
    throw seqerrors::InvalidFormat(kReadSource,
                                   m_name + " is not a compressed sequence (no TCS header)");
  }
  if (got < 8) {
    throw seqerrors::PastEndOfFile(kReadSource, m_name + ": the header is cut short");
  }
  tcs::In in(reinterpret_cast<const char*>(h), got, m_name);
  in.U32("the header");
  uint32_t version = in.U8("the header");
  version |= in.U8("the header") << 8;
  if (version != tcs::kVersion) {
    throw seqerrors::InvalidFormat(
        kReadSource, m_name + ": compressed sequence version " + std::to_string(version) +
                         " is not one this program reads (" + std::to_string(tcs::kVersion) +
                         "); convert the sequence again");
  }
  if (got < tcs::kHeaderBytes) {
    throw seqerrors::PastEndOfFile(kReadSource, m_name + ": the header is cut short");
  }
  uint32_t headerBytes = in.U8("the header");
  headerBytes |= in.U8("the header") << 8;
  if (headerBytes < tcs::kHeaderBytes || headerBytes > m_file->Size()) {
    throw seqerrors::InvalidFormat(
        kReadSource, m_name + ": header size " + std::to_string(headerBytes) + " is wrong");
  }
  m_head.sourceHash = in.U64("the header");
  in.U64("the header");  // bytes decompressed, informational
  uint64_t compressedBytes = in.U64("the header");
  if (compressedBytes != m_file->Size() - headerBytes) {
    throw seqerrors::PastEndOfFile(
        kReadSource, m_name + ": the header promises " + std::to_string(compressedBytes) +
                         " compressed bytes, the file holds " +
                         std::to_string(m_file->Size() - headerBytes) + " (truncated?)");
  }
  m_families = in.U32("the header");
  m_offset = headerBytes;
}

void CompressedSequenceReader::Inflate(uint8_t* out, uint64_t expected, const std::string& what) {
  ZSTD_DCtx* ctx = m_context->ctx;
  ZSTD_DCtx_reset(ctx, ZSTD_reset_session_only);
  // Decode straight into `out`: no window buffer of zstd's own.
  ZSTD_DCtx_setParameter(ctx, ZSTD_d_stableOutBuffer, 1);
  m_chunk.resize(kChunkBytes);
  ZSTD_outBuffer output{out, static_cast<size_t>(expected), 0};
  const uint64_t size = m_file->Size();
  const uint64_t start = m_offset;
  auto damaged = [&](const std::string& why) {
    return seqerrors::InvalidFormat(
        kReadSource, m_name + ": " + what + " at byte " + std::to_string(start) + ": " + why);
  };
  for (;;) {
    size_t want = static_cast<size_t>(std::min<uint64_t>(kChunkBytes, size - m_offset));
    if (want == 0) throw damaged("cut short by the end of the file");
    size_t got = m_file->ReadAt(m_offset, m_chunk.data(), want);
    if (got == 0) throw damaged("cut short by the end of the file");
    ZSTD_inBuffer input{m_chunk.data(), got, 0};
    size_t rc = 1;
    while (input.pos < input.size && rc != 0) {
      size_t before = input.pos + output.pos;
      rc = ZSTD_decompressStream(ctx, &output, &input);
      if (ZSTD_isError(rc)) {
        throw damaged(std::string("damaged data (zstd: ") + ZSTD_getErrorName(rc) + ")");
      }
      if (rc != 0 && input.pos + output.pos == before) {
        // Stuck with the output full: the frame holds more than it should.
        throw damaged("more data than the " + std::to_string(expected) + " bytes it should hold");
      }
    }
    m_offset += input.pos;
    if (rc == 0) break;
  }
  if (output.pos != expected) {
    throw damaged(std::to_string(output.pos) + " bytes where " + std::to_string(expected) +
                  " belong");
  }
}

void CompressedSequenceReader::ParseHead(const char* bytes, size_t size) {
  using tcs::kMaxTime;
  tcs::In p(bytes, size, m_name);
  CompiledSequence& s = m_head;
  s.lengthMs = p.I64("the length");
  if (s.lengthMs < 0 || s.lengthMs > kMaxTime) {
    throw seqerrors::InvalidFormat(kReadSource,
                                   m_name + ": impossible length " + std::to_string(s.lengthMs));
  }
  s.media = p.Text("the media name");
  s.shellCommand = p.Text("the shell command");
  uint32_t subs = p.Count(12, "the subsequence list");
  for (uint32_t i = 0; i < subs; ++i) {
    SubsequenceRef ref;
    ref.file = p.Text("a subsequence");
    ref.offsetMs = p.I64("a subsequence");
    if (ref.offsetMs < 0 || ref.offsetMs > kMaxTime) {
      throw seqerrors::InvalidFormat(kReadSource, m_name + ": impossible subsequence offset");
    }
    s.subsequences.push_back(std::move(ref));
  }
  uint32_t channels = p.Count(17, "the channel table");
  s.channels.reserve(channels);
  for (uint32_t i = 0; i < channels; ++i) {
    CompiledChannel c;
    c.address.family = static_cast<int32_t>(p.U8("a channel"));
    c.address.network = p.I32("a channel");
    c.address.unit = p.I32("a channel");
    c.address.circuit = p.I32("a channel");
    c.name = p.Text("a channel name");
    s.channels.push_back(std::move(c));
  }
  uint32_t effects = p.Count(tcs::kEffectBytes, "the effect list");
  s.effects.resize(effects);
  int64_t previous = INT64_MIN;
  for (auto& e : s.effects) {
    e.atMs = p.I64("an effect");
    e.channel = p.U32("an effect");
    e.durationMs = p.I32("an effect");
    e.type = static_cast<int32_t>(p.U8("an effect"));
    e.startIntensity = static_cast<int32_t>(p.U8("an effect"));
    e.endIntensity = static_cast<int32_t>(p.U8("an effect"));
    e.priority = p.I32("an effect");
    const char* problem = e.channel >= channels             ? " names a channel that does not exist"
                          : e.atMs < previous               ? " is out of play order"
                          : e.atMs < 0 || e.atMs > kMaxTime ? " has an impossible time"
                          : e.durationMs < 0                ? " has a negative duration"
                          : e.type < kEffectOff || e.type > kEffectShimmer
                              ? " has an unknown effect type"
                              : nullptr;
    if (problem) {
      throw seqerrors::InvalidFormat(
          kReadSource, m_name + ": effect " + std::to_string(&e - s.effects.data()) + problem);
    }
    previous = e.atMs;
  }
  uint32_t groups = p.Count(24, "the track group list");
  for (uint32_t g = 0; g < groups; ++g) {
    TrackGroup group;
    group.startMs = p.I64("a track group");
    group.stepMs = p.I32("a track group");
    group.frameCount = p.U32("a track group");
    uint32_t perBlock = p.U32("a track group");
    uint32_t tracks = p.Count(17, "a track group");
    std::string where = m_name + ": track group " + std::to_string(g);
    if (group.stepMs <= 0 || group.stepMs > 60000 || group.startMs < 0 ||
        group.startMs > kMaxTime || group.EndMs() > 2 * kMaxTime) {
      throw seqerrors::InvalidFormat(kReadSource, where + " has an impossible start or step time");
    }
    if (tracks == 0) throw seqerrors::InvalidFormat(kReadSource, where + " has no tracks");
    uint64_t frameBytes = 0;
    for (uint32_t t = 0; t < tracks; ++t) {
      LevelTrack track;
      track.family = static_cast<int32_t>(p.U8("a track"));
      track.network = p.I32("a track");
      track.unit = p.I32("a track");
      track.firstAddress = p.I32("a track");
      track.count = p.I32("a track");
      track.startMs = group.startMs;
      track.stepMs = group.stepMs;
      if (track.count <= 0) {
        throw seqerrors::InvalidFormat(kReadSource, where + " has a track without slots");
      }
      frameBytes += static_cast<uint64_t>(track.count);
      group.tracks.push_back(track);
    }
    if (perBlock == 0 || frameBytes > TrackGroup::kMaxFrameBytes ||
        frameBytes * perBlock > std::max<uint64_t>(tcs::kMaxBlockBytes, frameBytes)) {
      throw seqerrors::InvalidFormat(
          kReadSource, where + " asks for blocks of " + std::to_string(perBlock) + " frames of " +
                           std::to_string(frameBytes) + " bytes, more than this reader accepts");
    }
    m_groups.push_back(std::move(group));
    m_framesPerBlock.push_back(perBlock);
  }
  if (p.Left() != 0) {
    throw seqerrors::InvalidFormat(
        kReadSource, m_name + ": " + std::to_string(p.Left()) + " stray bytes after the head");
  }
}

void CompressedSequenceReader::CheckNothingFollows() const {
  if (m_offset != m_file->Size()) {
    throw seqerrors::InvalidFormat(kReadSource, m_name + ": " +
                                                    std::to_string(m_file->Size() - m_offset) +
                                                    " stray bytes after the last block");
  }
}

void CompressedSequenceReader::LoadNextBlock() {
  while (m_nextGroup < m_groups.size() &&
         m_nextBlock >= BlocksOf(m_groups[m_nextGroup], m_framesPerBlock[m_nextGroup])) {
    ++m_nextGroup;
    m_nextBlock = 0;
  }
  const TrackGroup& group = m_groups[m_nextGroup];
  uint32_t perBlock = m_framesPerBlock[m_nextGroup];
  uint32_t first = m_nextBlock * perBlock;
  uint32_t frames = std::min(perBlock, group.frameCount - first);
  size_t expected = static_cast<size_t>(frames) * group.FrameBytes();
  if (expected > m_blockCapacity) {
    m_block.reset(new uint8_t[expected]);
    m_blockCapacity = expected;
  }
  m_holding = false;
  Inflate(m_block.get(), expected,
          "frames " + std::to_string(first) + "-" + std::to_string(first + frames - 1) +
              " of track group " + std::to_string(m_nextGroup));
  m_heldGroup = m_nextGroup;
  m_heldBlock = m_nextBlock;
  m_holding = true;
  ++m_nextBlock;
  // After the last block of all, nothing may follow.
  size_t g = m_nextGroup;
  uint32_t b = m_nextBlock;
  while (g < m_groups.size() && b >= BlocksOf(m_groups[g], m_framesPerBlock[g])) ++g, b = 0;
  if (g == m_groups.size()) CheckNothingFollows();
}

const uint8_t* CompressedSequenceReader::ReadFrame(size_t group, uint32_t frame) {
  uint32_t block = frame / m_framesPerBlock[group];
  while (!m_holding || m_heldGroup != group || m_heldBlock != block) LoadNextBlock();
  return m_block.get() + static_cast<size_t>(frame - block * m_framesPerBlock[group]) *
                             m_groups[group].FrameBytes();
}

size_t CompressedSequenceReader::MemoryHeld() const {
  return m_blockCapacity + m_chunk.capacity() + ZSTD_sizeof_DCtx(m_context->ctx);
}

}  // namespace tav
