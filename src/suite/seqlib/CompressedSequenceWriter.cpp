#include "suite/seqlib/CompressedSequenceWriter.h"

#include <zstd.h>

#include <algorithm>

#include "suite/seqlib/CompressedSequenceLayout.h"
#include "suite/seqlib/PlayEvent.h"

namespace tav {

namespace {

using tcs::kWriteSource;

uint32_t FamilyMask(const CompiledSequence& head, const std::vector<TrackGroup>& groups) {
  uint32_t mask = 0;
  for (const auto& channel : head.channels) mask |= 1u << (channel.address.family & 31);
  for (const auto& group : groups) {
    for (const auto& track : group.tracks) mask |= 1u << (track.family & 31);
  }
  uint32_t known = 0;
  for (int32_t family : {kFamilyTAV, kFamilyX10, kFamilyFennick, kFamilyDMX}) {
    known |= 1u << family;
  }
  return mask & known;
}

std::string EncodeHead(const CompiledSequence& s, const std::vector<TrackGroup>& groups,
                       const std::vector<uint32_t>& framesPerBlock) {
  tcs::Out p;
  p.I64(s.lengthMs);
  p.Text(s.media);
  p.Text(s.shellCommand);
  p.U32(static_cast<uint32_t>(s.subsequences.size()));
  for (const auto& sub : s.subsequences) {
    p.Text(sub.file);
    p.I64(sub.offsetMs);
  }
  p.U32(static_cast<uint32_t>(s.channels.size()));
  for (const auto& c : s.channels) {
    p.U8(static_cast<uint32_t>(c.address.family));
    p.I32(c.address.network);
    p.I32(c.address.unit);
    p.I32(c.address.circuit);
    p.Text(c.name);
  }
  p.U32(static_cast<uint32_t>(s.effects.size()));
  for (const auto& e : s.effects) {
    p.I64(e.atMs);
    p.U32(e.channel);
    p.I32(e.durationMs);
    p.U8(static_cast<uint32_t>(e.type));
    p.U8(static_cast<uint32_t>(e.startIntensity));
    p.U8(static_cast<uint32_t>(e.endIntensity));
    p.I32(e.priority);
  }
  p.U32(static_cast<uint32_t>(groups.size()));
  for (size_t g = 0; g < groups.size(); ++g) {
    const TrackGroup& group = groups[g];
    p.I64(group.startMs);
    p.I32(group.stepMs);
    p.U32(group.frameCount);
    p.U32(framesPerBlock[g]);
    p.U32(static_cast<uint32_t>(group.tracks.size()));
    for (const auto& t : group.tracks) {
      p.U8(static_cast<uint32_t>(t.family));
      p.I32(t.network);
      p.I32(t.unit);
      p.I32(t.firstAddress);
      p.I32(t.count);
    }
  }
  return std::move(p.Str());
}

}  // namespace

struct CompressedSequenceWriter::Context {
  explicit Context(int level) {
    ZSTD_CCtx_setParameter(ctx, ZSTD_c_compressionLevel, level);
    // A checksum per block, so that verifying finds damage in any byte.
    ZSTD_CCtx_setParameter(ctx, ZSTD_c_checksumFlag, 1);
  }
  ~Context() { ZSTD_freeCCtx(ctx); }
  ZSTD_CCtx* ctx = ZSTD_createCCtx();
};

CompressedSequenceWriter::CompressedSequenceWriter(WritableFile& out, const CompiledSequence& head,
                                                   std::vector<TrackGroup> groups, int level)
    : m_out(out),
      m_groups(std::move(groups)),
      m_sourceHash(head.sourceHash),
      m_families(FamilyMask(head, m_groups)),
      m_context(std::make_unique<Context>(level)) {
  for (const auto& group : m_groups) {
    size_t frameBytes = group.FrameBytes();
    if (group.tracks.empty() || frameBytes == 0 || frameBytes > TrackGroup::kMaxFrameBytes ||
        group.stepMs <= 0) {
      throw seqerrors::InvalidFormat(kWriteSource,
                                     "a frame track group without slots, with frames of more than "
                                     "16 MiB, or without a step cannot be exported");
    }
    auto perBlock = static_cast<uint32_t>(std::max<size_t>(1, tcs::kTargetBlockBytes / frameBytes));
    m_framesPerBlock.push_back(std::max<uint32_t>(1, std::min(perBlock, group.frameCount)));
  }
  if (m_out.Size() != 0) throw errors::InvalidProcedureCall(kWriteSource);
  // The sizes are filled in by Finish.
  m_out.Append(std::string(tcs::kHeaderBytes, '\0'));
  std::string encoded = EncodeHead(head, m_groups, m_framesPerBlock);
  AppendCompressed(encoded.data(), encoded.size());
  SkipEmptyGroups();
}

CompressedSequenceWriter::~CompressedSequenceWriter() = default;

void CompressedSequenceWriter::SkipEmptyGroups() {
  while (m_group < m_groups.size() && m_frame >= m_groups[m_group].frameCount) {
    ++m_group;
    m_frame = 0;
  }
}

void CompressedSequenceWriter::AppendCompressed(const void* bytes, size_t size) {
  m_compressed.resize(ZSTD_compressBound(size));
  size_t written =
      ZSTD_compress2(m_context->ctx, m_compressed.data(), m_compressed.size(), bytes, size);
  if (ZSTD_isError(written)) {
    throw seqerrors::FileAccess(kWriteSource, ZSTD_getErrorName(written));
  }
  m_out.Append(std::string_view(m_compressed.data(), written));
  m_uncompressed += size;
}

void CompressedSequenceWriter::AddFrame(const uint8_t* levels) {
  if (m_group >= m_groups.size()) {
    throw seqerrors::InvalidFormat(kWriteSource, "more frames than the track groups hold");
  }
  const TrackGroup& group = m_groups[m_group];
  m_block.insert(m_block.end(), levels, levels + group.FrameBytes());
  ++m_frame;
  if (m_frame % m_framesPerBlock[m_group] == 0 || m_frame == group.frameCount) FlushBlock();
  SkipEmptyGroups();
}

void CompressedSequenceWriter::FlushBlock() {
  AppendCompressed(m_block.data(), m_block.size());
  m_block.clear();
  if (m_progress) m_progress();
}

void CompressedSequenceWriter::Finish() {
  if (m_group < m_groups.size()) {
    throw seqerrors::InvalidFormat(kWriteSource,
                                   "the export ended before the last frame of its frame tracks");
  }
  tcs::Out h;
  h.Bytes(tcs::kMagic, 4);
  h.U16(tcs::kVersion);
  h.U16(tcs::kHeaderBytes);
  h.U64(m_sourceHash);
  h.U64(m_uncompressed);
  h.U64(m_out.Size() - tcs::kHeaderBytes);
  h.U32(m_families);
  h.U32(0);
  m_out.WriteAt(0, h.Str());
}

size_t CompressedSequenceWriter::MemoryHeld() const {
  return m_block.capacity() + m_compressed.capacity() + ZSTD_sizeof_CCtx(m_context->ctx);
}

void WriteCompressedSequence(StreamedSequence& source, WritableFile& out, int level,
                             const std::function<void()>& progress) {
  CompressedSequenceWriter writer(out, source.Head(), source.Groups(), level);
  writer.SetProgress(progress);
  while (const uint8_t* frame = source.NextFrame()) writer.AddFrame(frame);
  writer.Finish();
}

}  // namespace tav
