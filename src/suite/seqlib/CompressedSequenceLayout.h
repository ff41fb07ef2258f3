#pragma once
// What the compressed export's reader and writer share: the header's
// constants and the little-endian field coding of the head. Internal to the
// two; the layout itself is described in docs/tcs-format.md.

#include <cstdint>
#include <cstring>
#include <string>

#include "suite/seqlib/SeqErrors.h"

namespace tav::tcs {

constexpr const char* kReadSource = "CompressedSequence.Read";
constexpr const char* kWriteSource = "CompressedSequence.Write";
constexpr char kMagic[4] = {'T', 'C', 'S', 0x1A};
constexpr uint16_t kVersion = 2;
constexpr uint32_t kHeaderBytes = 40;
// The head (metadata, channels, effects, track shapes) may be this large.
constexpr uint64_t kMaxHeadBytes = 1ull << 31;
// A block of frames may be this large decompressed; the writer aims at
// kTargetBlockBytes, or one frame when a frame is larger.
constexpr uint64_t kMaxBlockBytes = 64ull << 20;
constexpr size_t kTargetBlockBytes = 1 << 20;
// zstd turns at most 128 KiB out of a block that costs at least 4 bytes (a
// block header and one byte repeated), so compressed bytes can hold at most
// this many times their size: the bound for levels a head may promise.
constexpr uint64_t kMaxExpansion = (128 * 1024) / 4;
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
      throw seqerrors::InvalidFormat(kReadSource, m_name + ": the data ends inside " + what +
                                                      " (at byte " + std::to_string(m_pos) +
                                                      " of the head)");
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
  size_t Left() const { return m_n - m_pos; }

 private:
  const uint8_t* m_p;
  size_t m_n;
  size_t m_pos = 0;
  const std::string& m_name;
};

}  // namespace tav::tcs
