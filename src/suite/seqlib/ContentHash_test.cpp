#include "suite/seqlib/ContentHash.h"

#include <gtest/gtest.h>

namespace tav {
namespace {

std::string Bytes(size_t count) {
  std::string bytes;
  for (size_t i = 0; i < count; ++i) bytes.push_back(static_cast<char>(i * 31 + 7));
  return bytes;
}

TEST(ContentHash, MatchesTheReferenceValuesOfXXH64) {
  // From the reference implementation (libxxhash 0.8.1), seed 0.
  EXPECT_EQ(ContentHash(""), 0xEF46DB3751D8E999ull);
  EXPECT_EQ(ContentHash("a"), 0xD24EC4F1A98C6E5Bull);
  EXPECT_EQ(ContentHash("abc"), 0x44BC2CF5AD770999ull);
  EXPECT_EQ(ContentHash("0123456789abcdef0123456789abcdef0123456789"), 0xA76190C3ACF08A1Cull);
  std::string all;
  for (int i = 0; i < 3 * 256; ++i) all.push_back(static_cast<char>(i & 0xFF));
  EXPECT_EQ(ContentHash(all), 0x8E03C838C596036Full);
}

TEST(ContentHash, PiecesOfAnySizeGiveTheSameHash) {
  std::string bytes = Bytes(1000);
  for (size_t piece : {1u, 3u, 7u, 31u, 32u, 33u, 100u, 999u}) {
    ContentHasher hasher;
    for (size_t at = 0; at < bytes.size(); at += piece) {
      hasher.Update(std::string_view(bytes).substr(at, piece));
    }
    EXPECT_EQ(hasher.Value(), ContentHash(bytes)) << piece;
  }
}

TEST(ContentHash, CombinedHashDependsOnEveryFileAndTheirOrder) {
  uint64_t own = ContentHash("main"), a = ContentHash("a"), b = ContentHash("b");
  EXPECT_EQ(CombinedContentHash(own, {}), own);
  EXPECT_NE(CombinedContentHash(own, {a}), own);
  EXPECT_NE(CombinedContentHash(own, {a, b}), CombinedContentHash(own, {b, a}));
  EXPECT_NE(CombinedContentHash(own, {a, b}), CombinedContentHash(own, {a}));
  EXPECT_EQ(ContentHashText(0x0123456789abcdefull), "0123456789abcdef");
}

}  // namespace
}  // namespace tav
