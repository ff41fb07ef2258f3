#pragma once
// The sequence library on real files. Formats are told apart by content:
// the plain JSON format, FSEQ (and ESEQ), and compressed exports. Plain
// sequences include their subsequences (found beside the including file or
// through the path resolver, kind 2) when they load; FSEQ files play from
// disk block by block; absolute FSEQ channels land on DMX universes through
// the universe map.
//
// An export lists every file its sequence included, nested ones too, as the
// library found them, and records the combined content hash of the sequence
// file and all of those (ContentHash.h): editing any of them, or putting
// back an older copy with an older time, makes the export stale.
//
// Shares the clock, the file system and the resolver with whoever made it;
// the sequences it makes keep what they need alive on their own.

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/FseqBlockCache.h"
#include "suite/seqlib/PathResolver.h"
#include "suite/seqlib/SequenceData.h"
#include "suite/seqlib/SequenceLibrary.h"
#include "suite/seqlib/StreamedSequence.h"
#include "suite/seqlib/UniverseMap.h"

namespace tav {

class FileSequenceLibrary : public SequenceLibrary {
 public:
  // Subsequences may include subsequences, this deep.
  static constexpr int kMaxSubsequenceDepth = 16;

  FileSequenceLibrary(std::shared_ptr<const Clock> clock, std::shared_ptr<FileSystem> fileSystem,
                      std::shared_ptr<const PathResolver> resolver,
                      UniverseMap universes = UniverseMap::Uniform());

  // Network preferences may move universes; later loads use the new map.
  void SetUniverseMap(const UniverseMap& universes);
  // FSEQ files opened later share decoded blocks through `cache` (see
  // FseqBlockCache.h for who should); null, the default, shares nothing.
  void SetFseqBlockCache(std::shared_ptr<FseqBlockCache> cache);

  std::shared_ptr<Sequence> CreateSequence() override;
  std::shared_ptr<Sequence> LoadCompressed(const std::string& path) override;
  void WriteCompressed(const Sequence& sequence, const std::string& path) override;
  std::optional<uint64_t> CurrentSourceHash(const std::string& sequencePath,
                                            const std::vector<std::string>& includedFiles) override;

  // What a load produces, without a sequence object around it.
  std::shared_ptr<const SequenceContent> LoadContent(
      const std::string& path, const std::function<void()>& keepAlive = {}) const;
  // Any sequence file in the compiled form (an FSEQ file read whole).
  std::shared_ptr<const CompiledSequence> LoadCompiled(
      const std::string& path, const std::function<void()>& keepAlive = {}) const;

  // "plain", "fseq" or "tcs", judged by the content. Throws tav::Error for
  // a missing file or one of no known format.
  std::string FormatOf(const std::string& path) const;
  // Any sequence file as a stream of frames: an export or an FSEQ file is
  // read a block at a time (opening reads its headers only); a plain
  // sequence is compiled in memory first. An FSEQ file's source hash is
  // left 0 unless `hashFseq`, which reads the whole file once more.
  std::unique_ptr<StreamedSequence> OpenStreamed(const std::string& path,
                                                 bool hashFseq = false) const;

  struct Core;

 private:
  std::shared_ptr<const Clock> m_clock;
  std::shared_ptr<Core> m_core;
};

}  // namespace tav
