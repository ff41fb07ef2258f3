#include "suite/seqlib/FseqWriter.h"

#include <zlib.h>
#include <zstd.h>

#include <cstring>

#include "suite/seqlib/SeqErrors.h"

namespace tav {

namespace {

constexpr const char* kSource = "FseqWriter";

void Put16(std::string& s, uint32_t v) {
  s.push_back(static_cast<char>(v & 0xFF));
  s.push_back(static_cast<char>((v >> 8) & 0xFF));
}
void Put24(std::string& s, uint32_t v) {
  Put16(s, v & 0xFFFF);
  s.push_back(static_cast<char>((v >> 16) & 0xFF));
}
void Put32(std::string& s, uint32_t v) {
  Put16(s, v & 0xFFFF);
  Put16(s, v >> 16);
}

void PutStringHeader(std::string& s, const char* code, const std::string& text) {
  Put16(s, static_cast<uint32_t>(text.size() + 5));
  s.append(code, 2);
  s.append(text);
  s.push_back('\0');
}

}  // namespace

FseqWriter::FseqWriter(uint32_t channelCount, Options options)
    : m_channelCount(channelCount), m_options(std::move(options)) {
  if (channelCount == 0 || m_options.stepMs == 0 || m_options.stepMs > 255 ||
      m_options.framesPerBlock == 0) {
    throw errors::InvalidProcedureCall(kSource);
  }
  if (m_options.major == 1) m_options.compression = FseqFile::Compression::None;
}

void FseqWriter::AddFrame(const uint8_t* frame) {
  if (m_options.compression == FseqFile::Compression::None) {
    m_data.append(reinterpret_cast<const char*>(frame), m_channelCount);
    ++m_frames;
    return;
  }
  m_pending.insert(m_pending.end(), frame, frame + m_channelCount);
  ++m_pendingFrames;
  ++m_frames;
  uint32_t limit = m_index.empty() && m_options.firstBlockFrames > 0 ? m_options.firstBlockFrames
                                                                     : m_options.framesPerBlock;
  if (m_pendingFrames >= limit) FlushBlock();
}

void FseqWriter::FlushBlock() {
  if (m_pendingFrames == 0) return;
  std::string out;
  if (m_options.compression == FseqFile::Compression::Zstd) {
    out.resize(ZSTD_compressBound(m_pending.size()));
    // No content size in the frame header, as common writers stream blocks.
    ZSTD_CCtx* ctx = ZSTD_createCCtx();
    ZSTD_CCtx_setParameter(ctx, ZSTD_c_compressionLevel, m_options.level);
    ZSTD_CCtx_setParameter(ctx, ZSTD_c_contentSizeFlag, 0);
    ZSTD_outBuffer o{out.data(), out.size(), 0};
    ZSTD_inBuffer i{m_pending.data(), m_pending.size(), 0};
    size_t rc = ZSTD_compressStream2(ctx, &o, &i, ZSTD_e_end);
    ZSTD_freeCCtx(ctx);
    if (ZSTD_isError(rc) || rc != 0)
      throw seqerrors::FileAccess(kSource, "zstd compression failed");
    out.resize(o.pos);
  } else {
    uLongf size = compressBound(m_pending.size());
    out.resize(size);
    if (compress2(reinterpret_cast<Bytef*>(out.data()), &size, m_pending.data(), m_pending.size(),
                  m_options.level) != Z_OK) {
      throw seqerrors::FileAccess(kSource, "zlib compression failed");
    }
    out.resize(size);
  }
  m_index.push_back({m_frames - m_pendingFrames, static_cast<uint32_t>(out.size())});
  m_data.append(out);
  m_pending.clear();
  m_pendingFrames = 0;
}

std::string FseqWriter::Finish() {
  FlushBlock();
  std::string h;
  h.append("PSEQ");
  Put16(h, 0);  // data offset, patched below
  h.push_back(static_cast<char>(m_options.major == 1 ? 0 : m_options.minor));
  h.push_back(static_cast<char>(m_options.major));
  uint32_t entries = 0;
  if (m_options.major == 1) {
    Put16(h, 28);
    Put32(h, m_channelCount);
    Put32(h, m_frames);
    h.push_back(static_cast<char>(m_options.stepMs));
    h.push_back(0);
    Put16(h, 0);
    Put16(h, 0);
    h.push_back(1);
    h.push_back(2);
    Put16(h, 0);
  } else {
    if (m_options.compression != FseqFile::Compression::None) {
      entries = static_cast<uint32_t>(m_index.size()) + m_options.spareIndexEntries;
    }
    if (entries > 4095 || m_options.ranges.size() > 255) throw errors::Overflow(kSource);
    Put16(h, 32 + 8 * entries + 6 * static_cast<uint32_t>(m_options.ranges.size()));
    Put32(h, m_channelCount);
    Put32(h, m_frames);
    h.push_back(static_cast<char>(m_options.stepMs));
    h.push_back(0);
    h.push_back(
        static_cast<char>(static_cast<uint8_t>(m_options.compression) | ((entries >> 4) & 0xF0)));
    h.push_back(static_cast<char>(entries & 0xFF));
    h.push_back(static_cast<char>(m_options.ranges.size()));
    h.push_back(0);
    Put32(h, 0x5441560A);  // unique id: informational only
    Put32(h, 0);
    for (uint32_t i = 0; i < entries; ++i) {
      Put32(h, i < m_index.size() ? m_index[i].firstFrame : 0);
      Put32(h, i < m_index.size() ? m_index[i].length : 0);
    }
    for (const auto& range : m_options.ranges) {
      Put24(h, range.start);
      Put24(h, range.count);
    }
  }
  if (!m_options.media.empty()) PutStringHeader(h, "mf", m_options.media);
  if (!m_options.producer.empty()) PutStringHeader(h, "sp", m_options.producer);
  while (h.size() % 4 != 0) h.push_back('\0');
  if (h.size() > 0xFFFF) throw errors::Overflow(kSource);
  h[4] = static_cast<char>(h.size() & 0xFF);
  h[5] = static_cast<char>(h.size() >> 8);
  h.append(m_data);
  return h;
}

}  // namespace tav
