#include "suite/seqlib/ContentHash.h"

#include <algorithm>
#include <cstring>

namespace tav {

namespace {

constexpr uint64_t kPrime1 = 0x9E3779B185EBCA87ull;
constexpr uint64_t kPrime2 = 0xC2B2AE3D27D4EB4Full;
constexpr uint64_t kPrime3 = 0x165667B19E3779F9ull;
constexpr uint64_t kPrime4 = 0x85EBCA77C2B2AE63ull;
constexpr uint64_t kPrime5 = 0x27D4EB2F165667C5ull;

uint64_t RotateLeft(uint64_t value, int bits) {
  return (value << bits) | (value >> (64 - bits));
}

uint64_t Read64(const unsigned char* p) {
  uint64_t value = 0;
  for (int i = 7; i >= 0; --i) value = value << 8 | p[i];
  return value;
}

uint32_t Read32(const unsigned char* p) {
  return static_cast<uint32_t>(p[0]) | static_cast<uint32_t>(p[1]) << 8 |
         static_cast<uint32_t>(p[2]) << 16 | static_cast<uint32_t>(p[3]) << 24;
}

uint64_t Round(uint64_t lane, uint64_t input) {
  lane += input * kPrime2;
  return RotateLeft(lane, 31) * kPrime1;
}

uint64_t MergeRound(uint64_t hash, uint64_t lane) {
  hash ^= Round(0, lane);
  return hash * kPrime1 + kPrime4;
}

}  // namespace

ContentHasher::ContentHasher() : m_lanes{kPrime1 + kPrime2, kPrime2, 0, 0 - kPrime1}, m_buffer{} {}

void ContentHasher::Stripe(const unsigned char* p) {
  for (int lane = 0; lane < 4; ++lane) m_lanes[lane] = Round(m_lanes[lane], Read64(p + 8 * lane));
}

void ContentHasher::Update(std::string_view bytes) {
  auto p = reinterpret_cast<const unsigned char*>(bytes.data());
  size_t left = bytes.size();
  m_total += left;
  if (m_buffered > 0) {
    size_t take = std::min(left, sizeof m_buffer - m_buffered);
    std::memcpy(m_buffer + m_buffered, p, take);
    m_buffered += take;
    p += take;
    left -= take;
    if (m_buffered < sizeof m_buffer) return;
    Stripe(m_buffer);
    m_buffered = 0;
  }
  for (; left >= 32; p += 32, left -= 32) Stripe(p);
  if (left > 0) std::memcpy(m_buffer, p, left);
  m_buffered = left;
}

uint64_t ContentHasher::Value() const {
  uint64_t hash;
  if (m_total >= 32) {
    hash = RotateLeft(m_lanes[0], 1) + RotateLeft(m_lanes[1], 7) + RotateLeft(m_lanes[2], 12) +
           RotateLeft(m_lanes[3], 18);
    for (uint64_t lane : m_lanes) hash = MergeRound(hash, lane);
  } else {
    hash = kPrime5;  // the seed, 0, plus the fifth prime
  }
  hash += m_total;
  const unsigned char* p = m_buffer;
  size_t left = m_buffered;
  for (; left >= 8; p += 8, left -= 8) {
    hash ^= Round(0, Read64(p));
    hash = RotateLeft(hash, 27) * kPrime1 + kPrime4;
  }
  if (left >= 4) {
    hash ^= static_cast<uint64_t>(Read32(p)) * kPrime1;
    hash = RotateLeft(hash, 23) * kPrime2 + kPrime3;
    p += 4;
    left -= 4;
  }
  for (; left > 0; ++p, --left) {
    hash ^= *p * kPrime5;
    hash = RotateLeft(hash, 11) * kPrime1;
  }
  hash ^= hash >> 33;
  hash *= kPrime2;
  hash ^= hash >> 29;
  hash *= kPrime3;
  hash ^= hash >> 32;
  return hash;
}

uint64_t ContentHash(std::string_view bytes) {
  ContentHasher hasher;
  hasher.Update(bytes);
  return hasher.Value();
}

uint64_t CombinedContentHash(uint64_t own, const std::vector<uint64_t>& included) {
  if (included.empty()) return own;
  ContentHasher hasher;
  auto add = [&hasher](uint64_t hash) {
    char bytes[8];
    for (int i = 0; i < 8; ++i) bytes[i] = static_cast<char>(hash >> (8 * i));
    hasher.Update(std::string_view(bytes, 8));
  };
  add(own);
  for (uint64_t hash : included) add(hash);
  return hasher.Value();
}

uint64_t ContentHash(const RandomAccessFile& file) {
  std::string chunk(64 * 1024, '\0');
  ContentHasher hasher;
  for (uint64_t offset = 0; offset < file.Size();) {
    size_t got = file.ReadAt(offset, chunk.data(), chunk.size());
    if (got == 0) break;
    hasher.Update(std::string_view(chunk.data(), got));
    offset += got;
  }
  return hasher.Value();
}

std::string ContentHashText(uint64_t hash) {
  static const char* digits = "0123456789abcdef";
  std::string text(16, '0');
  for (int i = 15; i >= 0; --i, hash >>= 4) text[i] = digits[hash & 15];
  return text;
}

}  // namespace tav
