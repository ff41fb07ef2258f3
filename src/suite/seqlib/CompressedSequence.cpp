#include "suite/seqlib/CompressedSequence.h"

#include <zstd.h>

#include <algorithm>
#include <cstring>
#include <memory>

#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {

namespace {

constexpr const char* kSource = "CompressedSequence.Read";
constexpr char kMagic[4] = {'T', 'C', 'S', 0x1A};
constexpr uint16_t kVersion = 1;
constexpr uint64_t kMaxPayload = 1ull << 31;
// at, channel, duration, type, start, end, priority: 8 + 4 + 4 + 1 + 1 + 1 + 4.
constexpr size_t kEffectBytes = 23;
constexpr int64_t kMaxTime = int64_t{1} << 40;

class Out {
 public:
  void U8(uint32_t v) { m_s.push_back(static_cast<char>(v & 0xFF)); }
  void U16(uint32_t v) { U8(v), U8(v >> 8); }
  void U32(uint32_t v) { U16(v & 0xFFFF), U16(v >> 16); }
  void U64(uint64_t v) { U32(static_cast<uint32_t>(v)), U32(static_cast<uint32_t>(v >> 32)); }
  void I32(int32_t v) { U32(static_cast<uint32_t>(v)); }
  void I64(int64_t v) { U64(static_cast<uint64_t>(v)); }
  void Text(const std::string& s) {
    U32(static_cast<uint32_t>(s.size()));
    m_s += s;
  }
  void Bytes(const void* p, size_t n) { m_s.append(static_cast<const char*>(p), n); }
  std::string& Str() { return m_s; }

 private:
  std::string m_s;
};

class In {
 public:
  In(const char* p, size_t n, const std::string& name)
      : m_p(reinterpret_cast<const uint8_t*>(p)), m_n(n), m_name(name) {}

  void Need(uint64_t n, const char* what) const {
    if (n > m_n - m_pos) {
      throw seqerrors::InvalidFormat(kSource, m_name + ": the data ends inside " + what +
                                                  " (at byte " + std::to_string(m_pos) +
                                                  " of the payload)");
    }
  }
  uint32_t U8(const char* what) {
    Need(1, what);
    return m_p[m_pos++];
  }
  uint32_t U32(const char* what) {
    Need(4, what);
    uint32_t v = m_p[m_pos] | (m_p[m_pos + 1] << 8) | (m_p[m_pos + 2] << 16) |
                 (static_cast<uint32_t>(m_p[m_pos + 3]) << 24);
    m_pos += 4;
    return v;
  }
  uint64_t U64(const char* what) {
    uint64_t low = U32(what);
    return low | (static_cast<uint64_t>(U32(what)) << 32);
  }
  int32_t I32(const char* what) { return static_cast<int32_t>(U32(what)); }
  int64_t I64(const char* what) { return static_cast<int64_t>(U64(what)); }
  std::string Text(const char* what) {
    uint32_t n = U32(what);
    Need(n, what);
    std::string s(reinterpret_cast<const char*>(m_p + m_pos), n);
    m_pos += n;
    return s;
  }
  // A count of records of at least `recordBytes` each, checked against
  // what is left so a damaged count cannot reserve absurd memory.
  uint32_t Count(size_t recordBytes, const char* what) {
    uint32_t n = U32(what);
    Need(static_cast<uint64_t>(n) * recordBytes, what);
    return n;
  }
  void Copy(void* dst, size_t n, const char* what) {
    Need(n, what);
    if (n == 0) return;
    std::memcpy(dst, m_p + m_pos, n);
    m_pos += n;
  }
  size_t Left() const { return m_n - m_pos; }

 private:
  const uint8_t* m_p;
  size_t m_n;
  size_t m_pos = 0;
  const std::string& m_name;
};

uint32_t FamilyMask(const CompiledSequence& s) {
  uint32_t mask = 0;
  for (int32_t family : {kFamilyTAV, kFamilyX10, kFamilyFennick, kFamilyDMX}) {
    if (s.UsesFamily(family)) mask |= 1u << family;
  }
  return mask;
}

}  // namespace

bool LooksLikeCompressedSequence(std::string_view bytes) {
  return bytes.size() >= 4 && std::memcmp(bytes.data(), kMagic, 4) == 0;
}

namespace {

// One zstd frame holding `payload`, its size stated in the frame header,
// compressed a piece at a time so that `progress` can be called between
// pieces.
std::string CompressPayload(const std::string& payload, int level,
                            const std::function<void()>& progress) {
  constexpr size_t kPiece = 1 << 20;
  std::unique_ptr<ZSTD_CCtx, size_t (*)(ZSTD_CCtx*)> context(ZSTD_createCCtx(), ZSTD_freeCCtx);
  if (!context) throw seqerrors::FileAccess("CompressedSequence.Write", "out of memory");
  auto check = [](size_t result) {
    if (ZSTD_isError(result))
      throw seqerrors::FileAccess("CompressedSequence.Write", ZSTD_getErrorName(result));
    return result;
  };
  check(ZSTD_CCtx_setParameter(context.get(), ZSTD_c_compressionLevel, level));
  check(ZSTD_CCtx_setPledgedSrcSize(context.get(), payload.size()));
  std::string compressed(ZSTD_compressBound(payload.size()), '\0');
  ZSTD_outBuffer out{compressed.data(), compressed.size(), 0};
  size_t done = 0;
  while (true) {
    size_t piece = std::min(kPiece, payload.size() - done);
    bool last = done + piece == payload.size();
    ZSTD_inBuffer in{payload.data() + done, piece, 0};
    size_t left;
    do {
      left = check(
          ZSTD_compressStream2(context.get(), &out, &in, last ? ZSTD_e_end : ZSTD_e_continue));
    } while (last ? left != 0 : in.pos < in.size);
    done += piece;
    if (progress) progress();
    if (last) break;
  }
  compressed.resize(out.pos);
  return compressed;
}

}  // namespace

std::string WriteCompressedSequence(const CompiledSequence& s, int level,
                                    const std::function<void()>& progress) {
  Out p;
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
  p.U32(static_cast<uint32_t>(s.tracks.size()));
  for (const auto& t : s.tracks) {
    p.U8(static_cast<uint32_t>(t.family));
    p.I32(t.network);
    p.I32(t.unit);
    p.I32(t.firstAddress);
    p.I32(t.count);
    p.I64(t.startMs);
    p.I32(t.stepMs);
    p.U32(static_cast<uint32_t>(t.FrameCount()));
    p.Bytes(t.levels.data(), t.FrameCount() * static_cast<size_t>(t.count));
  }
  const std::string& payload = p.Str();
  std::string compressed = CompressPayload(payload, level, progress);

  Out h;
  h.Bytes(kMagic, 4);
  h.U16(kVersion);
  h.U16(kCompressedHeaderBytes);
  h.U64(s.sourceHash);
  h.U64(payload.size());
  h.U64(compressed.size());
  h.U32(FamilyMask(s));
  h.U32(0);
  h.Str() += compressed;
  return std::move(h.Str());
}

std::optional<uint64_t> ReadCompressedSourceHash(std::string_view header) {
  if (header.size() < 16 || !LooksLikeCompressedSequence(header)) return std::nullopt;
  uint64_t hash = 0;
  for (int i = 7; i >= 0; --i) hash = hash << 8 | static_cast<uint8_t>(header[8 + i]);
  return hash;
}

CompiledSequence ReadCompressedSequence(std::string_view bytes, const std::string& name) {
  if (!LooksLikeCompressedSequence(bytes)) {
    throw seqerrors::InvalidFormat(kSource, name + " is not a compressed sequence (no TCS header)");
  }
  In h(bytes.data(), bytes.size(), name);
  h.U32("the header");
  uint32_t version = h.U8("the header");
  version |= h.U8("the header") << 8;
  if (version != kVersion) {
    throw seqerrors::InvalidFormat(
        kSource, name + ": compressed sequence version " + std::to_string(version) +
                     " is not one this program reads (" + std::to_string(kVersion) + ")");
  }
  uint32_t headerBytes = h.U8("the header");
  headerBytes |= h.U8("the header") << 8;
  if (headerBytes < kCompressedHeaderBytes || headerBytes > bytes.size()) {
    throw seqerrors::InvalidFormat(
        kSource, name + ": header size " + std::to_string(headerBytes) + " is wrong");
  }
  CompiledSequence s;
  s.sourceHash = h.U64("the header");
  uint64_t payloadBytes = h.U64("the header");
  uint64_t compressedBytes = h.U64("the header");
  if (compressedBytes != bytes.size() - headerBytes) {
    throw seqerrors::PastEndOfFile(
        kSource, name + ": the header promises " + std::to_string(compressedBytes) +
                     " compressed bytes, the file holds " +
                     std::to_string(bytes.size() - headerBytes) + " (truncated?)");
  }
  if (payloadBytes > kMaxPayload) {
    throw seqerrors::InvalidFormat(
        kSource, name + ": payload of " + std::to_string(payloadBytes) + " bytes is too large");
  }
  const char* compressed = bytes.data() + headerBytes;
  unsigned long long declared = ZSTD_getFrameContentSize(compressed, compressedBytes);
  if (declared != payloadBytes) {
    throw seqerrors::InvalidFormat(kSource, name + ": compressed data does not match the header");
  }
  // Left uninitialised: only what really decodes is ever touched.
  std::unique_ptr<char[]> payload(new char[payloadBytes > 0 ? payloadBytes : 1]);
  size_t got = ZSTD_decompress(payload.get(), payloadBytes, compressed, compressedBytes);
  if (ZSTD_isError(got) || got != payloadBytes) {
    throw seqerrors::InvalidFormat(
        kSource, name + ": compressed data is damaged" +
                     (ZSTD_isError(got) ? std::string(" (") + ZSTD_getErrorName(got) + ")" : ""));
  }

  In p(payload.get(), payloadBytes, name);
  s.lengthMs = p.I64("the length");
  if (s.lengthMs < 0 || s.lengthMs > kMaxTime) {
    throw seqerrors::InvalidFormat(kSource,
                                   name + ": impossible length " + std::to_string(s.lengthMs));
  }
  s.media = p.Text("the media name");
  s.shellCommand = p.Text("the shell command");
  uint32_t subs = p.Count(12, "the subsequence list");
  for (uint32_t i = 0; i < subs; ++i) {
    SubsequenceRef ref;
    ref.file = p.Text("a subsequence");
    ref.offsetMs = p.I64("a subsequence");
    if (ref.offsetMs < 0 || ref.offsetMs > kMaxTime) {
      throw seqerrors::InvalidFormat(kSource, name + ": impossible subsequence offset");
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
  uint32_t effects = p.Count(kEffectBytes, "the effect list");
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
          kSource, name + ": effect " + std::to_string(&e - s.effects.data()) + problem);
    }
    previous = e.atMs;
  }
  uint32_t tracks = p.Count(33, "the track list");
  for (uint32_t i = 0; i < tracks; ++i) {
    LevelTrack t;
    t.family = static_cast<int32_t>(p.U8("a track"));
    t.network = p.I32("a track");
    t.unit = p.I32("a track");
    t.firstAddress = p.I32("a track");
    t.count = p.I32("a track");
    t.startMs = p.I64("a track");
    t.stepMs = p.I32("a track");
    uint32_t frames = p.U32("a track");
    if (t.count <= 0 || t.stepMs <= 0 || t.stepMs > 60000 || t.startMs < 0 ||
        t.startMs > kMaxTime) {
      throw seqerrors::InvalidFormat(kSource,
                                     name + ": track " + std::to_string(i) +
                                         " has no slots, or an impossible start or step time");
    }
    uint64_t size = static_cast<uint64_t>(frames) * static_cast<uint64_t>(t.count);
    p.Need(size, "a track's levels");
    t.levels.resize(size);
    p.Copy(t.levels.data(), size, "a track's levels");
    s.tracks.push_back(std::move(t));
  }
  if (p.Left() != 0) {
    throw seqerrors::InvalidFormat(
        kSource, name + ": " + std::to_string(p.Left()) + " stray bytes after the tracks");
  }
  return s;
}

}  // namespace tav
