#pragma once
// Port: the suite's sequence library as the sequence play info uses it. It
// makes sequence objects (which then load a file), loads compressed exports,
// writes them and tells whether one still matches its sources. FileSequenceLibrary is the real one;
// MemorySequenceLibrary (testing/) serves sequences held in memory.

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "suite/seqlib/Sequence.h"

namespace tav {

class SequenceLibrary {
 public:
  virtual ~SequenceLibrary() = default;
  // An empty sequence object; LoadFile fills it.
  virtual std::shared_ptr<Sequence> CreateSequence() = 0;
  // A sequence loaded from the compressed export at `path`. Throws tav::Error.
  virtual std::shared_ptr<Sequence> LoadCompressed(const std::string& path) = 0;
  // Writes the compressed export of a loaded sequence, raising the
  // sequence's KeepAlive while it compresses and writes. Throws tav::Error.
  virtual void WriteCompressed(const Sequence& sequence, const std::string& path) = 0;
  // The source hash an export of the sequence file at `sequencePath` would
  // record now, given the files the export lists as included (its
  // SubsequenceNames): compared with the hash an export recorded, it tells
  // whether the export still matches its sources. Nothing when any of them
  // cannot be read.
  virtual std::optional<uint64_t> CurrentSourceHash(
      const std::string& sequencePath, const std::vector<std::string>& includedFiles) = 0;
};

}  // namespace tav
