#pragma once
// Test double for the SequenceLibrary port: sequences held in memory under
// a path, as if they were files. Records every load and write, can be told
// to fail any of them, and raises KeepAlive once per load so callers can see
// it forwarded. Sequences it makes play for real on the given clock.

#include <map>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "suite/seqlib/SequenceData.h"
#include "suite/seqlib/SequenceLibrary.h"

namespace tav {

class MemorySequenceLibrary : public SequenceLibrary {
 public:
  explicit MemorySequenceLibrary(std::shared_ptr<const Clock> clock);

  // A plain sequence at `path`; `exported` is what HasBeenExported reports
  // until WriteCompressed writes its export.
  void AddSequence(const std::string& path, SequenceData data, bool exported = false);
  // A compressed export at `path`.
  void AddCompressed(const std::string& path, SequenceData data);
  void FailLoading(const std::string& path) { m_failing.insert(path); }
  void FailWriting(bool fail) { m_failWrites = fail; }

  std::shared_ptr<Sequence> CreateSequence() override;
  std::shared_ptr<Sequence> LoadCompressed(const std::string& path) override;
  void WriteCompressed(const Sequence& sequence, const std::string& path) override;
  // The source hash the plain sequence at the path was compiled with (0);
  // an export written from it records the same.
  std::optional<uint64_t> CurrentSourceHash(const std::string& sequencePath,
                                            const std::vector<std::string>& includedFiles) override;

  const std::vector<std::string>& Loads() const { return m_loads; }
  const std::vector<std::string>& CompressedLoads() const { return m_compressedLoads; }
  const std::vector<std::string>& Writes() const { return m_writes; }

  struct State;

 private:
  std::shared_ptr<const Clock> m_clock;
  std::shared_ptr<State> m_state;
  std::vector<std::string>& m_loads;
  std::vector<std::string> m_compressedLoads;
  std::vector<std::string> m_writes;
  std::set<std::string>& m_failing;
  bool m_failWrites = false;
};

}  // namespace tav
