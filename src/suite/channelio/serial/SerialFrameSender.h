#pragma once
// Puts whole frames on a serial link for the networks that resend their
// complete state every time (dimmer chains, DMX widgets): the newest frame
// wins, none piles up behind the line, and the device gets the current state
// again after a quiet spell or when it comes back.
//
// - Pacing: with a baud rate given, a frame is handed to the device only when
//   the line has nearly finished the previous one, so at most one frame's
//   worth of delay builds up and the frame rate is what the speed carries.
//   A frame that arrives while the line is busy replaces the one waiting.
// - Refresh: the last frame is sent again after `refreshMs` without a new
//   one (receivers treat a silent line as lost, or were power-cycled).
// - Break: for host-timed DMX dongles, every frame goes out behind a break.
// - Connection: the loss of the device and its return are logged once each,
//   as "<name>: lost <path> (<reason>)..." and "<name>: <path> is back";
//   on return the last frame is sent at once.
//
// Owned by one network's transmitter, with the link it sends on. The
// TimerService, Clock and MessageLog must outlive it. Single-threaded.

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "ports/Clock.h"
#include "ports/MessageLog.h"
#include "ports/TimerService.h"
#include "suite/channelio/serial/OneShotTimer.h"
#include "suite/channelio/serial/SerialLineTiming.h"
#include "suite/channelio/serial/SerialLink.h"

namespace tav {

struct FrameSenderOptions {
  std::string name;      // "Fennick network", "TAV network 3", "DMX universe 2"
  std::string path;      // for the log lines
  int32_t paceBaud = 0;  // 0: the device buffers and paces itself
  int32_t stopBits = 1;
  uint32_t refreshMs = 1000;  // 0: never resend
  uint32_t breakMicros = 0;   // 0: no break before a frame
  uint32_t markMicros = 0;
};

struct FrameSenderCounters {
  uint64_t framesSent = 0;
  uint64_t framesReplaced = 0;  // overtaken by a newer frame before they left
  uint64_t refreshes = 0;
  uint64_t refused = 0;  // the link refused the write (queue full)
  uint64_t bytesSent = 0;
};

// Keep this much of the previous frame in the device's buffer when handing
// over the next, so the line never idles between frames.
inline constexpr int64_t kFrameSenderSlackMicros = 3000;

class SerialFrameSender {
 public:
  SerialFrameSender(FrameSenderOptions options, std::unique_ptr<SerialLink> link,
                    TimerService& timers, const Clock& clock, MessageLog& log);
  // A frame still waiting for the line goes to the link at once: closing a
  // network must not lose its last frame (see SerialLink).
  ~SerialFrameSender();
  SerialFrameSender(const SerialFrameSender&) = delete;
  SerialFrameSender& operator=(const SerialFrameSender&) = delete;

  // Takes the frame's bytes (the caller may reuse its buffer) and sends them
  // as soon as the line can take them.
  void Send(std::span<const uint8_t> frame);

  SerialLink& Link() { return *m_link; }
  bool FrameWaiting() const { return m_waiting; }
  const FrameSenderCounters& Counters() const { return m_counters; }

 private:
  void TrySend();
  void OnConnectionChange(bool connected, const std::string& reason);

  FrameSenderOptions m_options;
  std::unique_ptr<SerialLink> m_link;
  const Clock& m_clock;
  MessageLog& m_log;
  LinePacer m_pacer;
  OneShotTimer m_timer;
  std::vector<uint8_t> m_next;  // the frame to send
  std::vector<uint8_t> m_last;  // the frame sent last
  bool m_waiting = false;
  uint32_t m_lastSentTick = 0;
  FrameSenderCounters m_counters;
};

}  // namespace tav
