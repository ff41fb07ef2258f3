#pragma once
// The memory watchdog's decache pass: while a show is being prepared and
// its sequences queued, cached sequences are released once the process's
// memory reaches the high mark, one at a time, until it falls below the low
// mark. The two marks give the pass its hysteresis, so it does not run on
// every call. The settings are read at every pass, so a change in the
// registry counts at once.
//
// The engine supplies the candidates, already ranked (see
// ShowPlayer::DecacheCandidates); the pass releases them in rank order and,
// within a rank, the largest load first, since that frees the most for one
// reload later. Owned by the ShowPlayer; the settings and the memory probe
// must outlive it.

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "config/Settings.h"
#include "ports/MessageLog.h"
#include "ports/ProcessMemory.h"
#include "sequence/SequencePlayInfo.h"

namespace tav {

struct DecacheCandidate {
  std::shared_ptr<SequencePlayInfo> sequence;
  // Lower ranks go first: 0 for sequences the show will not need soon.
  int32_t rank = 0;
};

class DecachePass {
 public:
  DecachePass(const Settings& settings, std::shared_ptr<const ProcessMemory> memory);

  // Runs one pass; `collect` is asked for the candidates only when memory
  // is over the high mark. A failing memory query ends the pass and is
  // raised to the caller. Returns how many sequences were released.
  int Run(const std::function<std::vector<DecacheCandidate>()>& collect, MessageLog& log);

 private:
  const Settings& m_settings;
  std::shared_ptr<const ProcessMemory> m_memory;
};

}  // namespace tav
