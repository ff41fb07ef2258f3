#pragma once
// Port: the suite's sequence library as the sequence play info uses it. It
// makes sequence objects (which then load a file), loads compressed exports
// and writes them. FileSequenceLibrary is the real one;
// MemorySequenceLibrary (testing/) serves sequences held in memory.

#include <memory>
#include <string>

#include "suite/seqlib/Sequence.h"

namespace tav {

class SequenceLibrary {
 public:
  virtual ~SequenceLibrary() = default;
  // An empty sequence object; LoadFile fills it.
  virtual std::shared_ptr<Sequence> CreateSequence() = 0;
  // A sequence loaded from the compressed export at `path`. Throws tav::Error.
  virtual std::shared_ptr<Sequence> LoadCompressed(const std::string& path) = 0;
  // Writes the compressed export of a loaded sequence. Throws tav::Error.
  virtual void WriteCompressed(const Sequence& sequence, const std::string& path) = 0;
};

}  // namespace tav
