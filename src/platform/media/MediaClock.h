#pragma once
// The position of playing media between the player's reports. mpv reports
// the playback position only when its core wakes (every few hundred
// milliseconds for audio), each report fresh when it arrives; the show
// engine asks every millisecond to keep the lights in step with the music.
// So the position runs on from the latest report at the pace of the steady
// clock, never backwards while it runs (a sequence must not see time go
// back by the jitter between two reports), never beyond the media's end, and
// never more than kMaxRunOn beyond the latest report, so a player that stalls
// does not run away.
//
// The media process hands its clock to the player (Snapshot, Follow): both
// processes read the same steady clock (CLOCK_MONOTONIC), so the player's
// copy runs exactly as the original does.
//
// Pure: the caller passes the times. Owned by the media player adapter.

#include <chrono>

namespace tav {

class MediaClock {
 public:
  using TimePoint = std::chrono::steady_clock::time_point;
  static constexpr std::chrono::milliseconds kMaxRunOn{1000};

  // Nothing loaded: position 0, not running, end unknown.
  void Reset();
  // The player reported `seconds` at `at`.
  void Report(double seconds, TimePoint at);
  // Playback started at `at`: the position runs from the latest report, or
  // from `at` if that report came before the start.
  void Run(TimePoint at);
  // The media's length in seconds; 0 or less: unknown.
  void SetEnd(double seconds);

  // What the clock knows, to be taken over by a clock in another process.
  struct Snapshot {
    double position = 0;  // reported at `at`
    TimePoint at{};
    double end = 0;  // 0 or less: unknown
    bool running = false;
  };
  Snapshot Take() const { return {m_base, m_baseTime, m_end, m_running}; }
  // Takes over what another clock knows. The position this clock has given
  // is still never taken back while it runs.
  void Follow(const Snapshot& other);

  bool Running() const { return m_running; }
  double Position(TimePoint now) const;
  // Seconds until the position reaches the end (0 when the end is unknown
  // or passed).
  double Remaining(TimePoint now) const;

 private:
  double m_base = 0;
  TimePoint m_baseTime{};
  double m_end = 0;
  bool m_running = false;
  mutable double m_lastGiven = 0;
};

}  // namespace tav
