#pragma once
// The compressed export (<name>.tcs): a compiled sequence as zstd-compressed
// binary, with the content hash of the file it came from in a small
// uncompressed header so that "is the export current?" costs one short
// read. Layout in docs/tcs-format.md. These functions read and write a
// whole sequence in memory, as the player loads it; CompressedSequenceReader
// and CompressedSequenceWriter do the same piece by piece. Reading checks
// every count and length against the bytes present and reports damage as a
// tav::Error.

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

#include "suite/seqlib/CompiledSequence.h"

namespace tav {

constexpr const char* kCompressedExtension = "tcs";
constexpr size_t kCompressedHeaderBytes = 40;

bool LooksLikeCompressedSequence(std::string_view bytes);

// `progress`, when given, is called now and then while the payload is
// compressed (a large export takes a while).
std::string WriteCompressedSequence(const CompiledSequence& sequence, int level = 3,
                                    const std::function<void()>& progress = {});
// `name` is used in error messages only.
CompiledSequence ReadCompressedSequence(std::string_view bytes, const std::string& name);
// The source hash from the header; nothing when the bytes are no export of
// the version this program reads (an older export counts as out of date).
std::optional<uint64_t> ReadCompressedSourceHash(std::string_view header);

}  // namespace tav
