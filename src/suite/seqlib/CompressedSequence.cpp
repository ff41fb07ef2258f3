#include "suite/seqlib/CompressedSequence.h"

#include <cstring>
#include <memory>

#include "suite/seqlib/CompressedSequenceLayout.h"
#include "suite/seqlib/CompressedSequenceReader.h"
#include "suite/seqlib/CompressedSequenceWriter.h"

namespace tav {

bool LooksLikeCompressedSequence(std::string_view bytes) {
  return bytes.size() >= 4 && std::memcmp(bytes.data(), tcs::kMagic, 4) == 0;
}

std::string WriteCompressedSequence(const CompiledSequence& s, int level,
                                    const std::function<void()>& progress) {
  // Shares the tracks rather than copying them.
  std::shared_ptr<const CompiledSequence> shared(&s, [](const CompiledSequence*) {});
  CompiledStreamedSequence source(shared);
  MemoryWritableFile out;
  WriteCompressedSequence(source, out, level, progress);
  return std::move(out.Bytes());
}

std::optional<uint64_t> ReadCompressedSourceHash(std::string_view header) {
  if (header.size() < 16 || !LooksLikeCompressedSequence(header)) return std::nullopt;
  uint32_t version = static_cast<uint8_t>(header[4]) | static_cast<uint8_t>(header[5]) << 8;
  if (version != tcs::kVersion) return std::nullopt;
  uint64_t hash = 0;
  for (int i = 7; i >= 0; --i) hash = hash << 8 | static_cast<uint8_t>(header[8 + i]);
  return hash;
}

CompiledSequence ReadCompressedSequence(std::string_view bytes, const std::string& name) {
  CompressedSequenceReader reader(std::make_shared<MemoryView>(bytes, name));
  return ReadWhole(reader);
}

}  // namespace tav
