#pragma once
// A measurement of how closely the lights follow the music, in the whole
// running player: a sequence that carries its own frame number as a time
// code in two DMX slots (the demo's bells.fseq does, in universe 13, slots
// 511 and 512) is watched as its frames go out; for each new frame number n
// the media player's position at that moment is compared with the frame's
// place in the music, n times the frame period. At the end it reports the
// offsets (position minus frame time): 0 means the frame left exactly when
// the music reached it.
//
// Switched on with TAV_SYNC_PROBE=UNIVERSE:SLOT:PERIOD_MS (the high byte in
// SLOT, the low byte in SLOT+1), e.g. 13:511:25. Off otherwise; it costs
// nothing then. Owned by the composition root; runs on the loop.

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "show/MediaPlayer.h"
#include "suite/channelio/LevelBuffers.h"

namespace tav::player {

class SyncProbe {
 public:
  struct Where {
    int32_t universe = 13;
    int32_t slot = 511;
    int32_t periodMs = 25;
  };
  // "13:511:25"; nothing for text that is not three numbers in range.
  static std::optional<Where> Parse(const std::string& text);

  SyncProbe(const LevelBuffers& levels, const MediaPlayer& media, Where where);

  // After every frame sent.
  void OnFrame();
  // "sync probe: 612 frames; offset p50 0.4 ms, p99 1.1 ms, max 1.6 ms" (absolute
  // values), or a line saying no frame was seen.
  std::string Report() const;
  const std::vector<double>& OffsetsMs() const { return m_offsets; }

 private:
  const LevelBuffers& m_levels;
  const MediaPlayer& m_media;
  Where m_where;
  std::optional<int32_t> m_lastFrame;
  std::vector<double> m_offsets;
};

}  // namespace tav::player
