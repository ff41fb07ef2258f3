#pragma once
// The X10 network: lamp levels become X10 commands queued for a CM11A-style
// interface, and what the interface hears on the power line comes back as
// received commands (the I/O control turns them into input events).
//
// X10 is slow (one or two commands a second), so changes wait in the send
// queue, delayed but never lost. When the queue grows past `warnDepth` the
// depth is logged, again each time it doubles, and once more when the queue
// has caught up. The device going away and coming back is logged once each;
// while it is away commands keep queueing (the lamps keep their state, so
// the queue carries on from where it was).
//
// Owned by the I/O control. The TimerService, Clock and MessageLog must
// outlive it.

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "ports/Clock.h"
#include "ports/MessageLog.h"
#include "ports/TimerService.h"
#include "suite/channelio/serial/Cm11aProtocol.h"
#include "suite/channelio/serial/OneShotTimer.h"
#include "suite/channelio/serial/SerialLink.h"
#include "suite/channelio/serial/X10SendQueue.h"

namespace tav {

struct X10NetworkSettings {
  std::string path;
  // The house codes in use ("A", "ACP"); the first is the one the interface
  // monitors.
  std::string houseCodes = "A";
  size_t warnDepth = 16;
  Cm11aTiming timing;
};

class X10Transmitter {
 public:
  static constexpr const char* kName = "X10 network";
  static SerialSettings PortSettings(const X10NetworkSettings& settings);

  X10Transmitter(X10NetworkSettings settings, std::unique_ptr<SerialLink> link,
                 TimerService& timers, const Clock& clock, MessageLog& log);
  ~X10Transmitter();
  X10Transmitter(const X10Transmitter&) = delete;
  X10Transmitter& operator=(const X10Transmitter&) = delete;

  // One unit's level (house and unit 1-16, level 0-255).
  void SetLevel(int32_t house, int32_t unit, uint8_t level);
  // All 256 units, house-major: (house - 1) * 16 + (unit - 1). Only units
  // whose level changed since the last call are looked at; every lamp
  // starts dark.
  void SetLevels(std::span<const uint8_t> levels);

  void SetOnReceived(std::function<void(const X10Received&)> handler);

  // Commands waiting, counting the one in progress.
  size_t QueueDepth() const;
  const X10SendQueue& Queue() const { return m_queue; }
  const Cm11aCounters& Counters() const { return m_protocol.Counters(); }

 private:
  void AfterProtocol();
  void CheckDepth();
  void OnConnectionChange(bool connected, const std::string& reason);

  X10NetworkSettings m_settings;
  std::unique_ptr<SerialLink> m_link;
  const Clock& m_clock;
  MessageLog& m_log;
  X10SendQueue m_queue;
  Cm11aProtocol m_protocol;
  OneShotTimer m_timer;
  std::vector<uint8_t> m_levels = std::vector<uint8_t>(256, 0);
  size_t m_warnAt;
  std::function<void(const X10Received&)> m_onReceived;
};

}  // namespace tav
