#pragma once
// The host's side of a CM11A-style X10 interface, as a state machine driven
// by the bytes that arrive and by timeouts; it never touches a device or a
// clock itself. The X10 transmitter feeds it and writes what it asks for.
//
// One exchange at a time: the host sends a transmission's two bytes, the
// interface answers their checksum, the host confirms with 0x00 and the
// interface answers 0x55 once the power line has carried it. A wrong checksum
// sends the two bytes again. Meanwhile the interface may interrupt with a
// poll (0x5A: it heard something; the host answers 0xC3 and reads the
// upload), a clock request (0xA5/0xA6: the host sends the set-clock message,
// an exchange of its own), or a macro notice (0x5B and two bytes); the
// interrupted transmission is then sent again from its start.
//
// A command (an address and its functions) is taken from the command source
// only when the previous one has gone out in full, so nothing is skipped.
// After `maxAttempts` failed tries in a row (wrong checksums or silence) the
// machine pauses with a growing back-off and reports it once; it reports once
// more when the interface answers again. The command is kept throughout.
//
// Ticks are the Clock port's wrapping milliseconds.

#include <cstdint>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "suite/channelio/serial/X10Codes.h"
#include "suite/channelio/serial/X10UploadDecoder.h"
#include "support/DateTime.h"

namespace tav {

struct Cm11aTiming {
  uint32_t checksumTimeoutMs = 1000;  // the checksum comes within milliseconds
  // A power-line transmission takes about half a second, and every dim step
  // beyond the first another 11 mains cycles (220 ms at 50 Hz).
  uint32_t readyTimeoutMs = 3000;
  uint32_t readyTimeoutPerDimStepMs = 250;
  uint32_t uploadTimeoutMs = 1000;
  int32_t maxAttempts = 4;
  uint32_t firstPauseMs = 1000;
  uint32_t longestPauseMs = 30000;
};

struct Cm11aCounters {
  uint64_t transmissions = 0;  // confirmed with 0x55
  uint64_t wrongChecksums = 0;
  uint64_t timeouts = 0;
  uint64_t polls = 0;      // uploads read
  uint64_t clockSets = 0;  // set-clock exchanges confirmed
};

class Cm11aProtocol {
 public:
  using Writer = std::function<void(std::span<const uint8_t>)>;
  using CommandSource = std::function<std::vector<X10Transmission>()>;
  using Notice = std::function<void(int32_t level, const std::string& text)>;

  explicit Cm11aProtocol(Cm11aTiming timing = {}, int32_t monitoredHouse = 1);

  void SetWriter(Writer writer) { m_write = std::move(writer); }
  // Asked for the next command whenever the previous one is done; an empty
  // answer means nothing is waiting.
  void SetCommandSource(CommandSource source) { m_source = std::move(source); }
  void SetOnReceived(std::function<void(const X10Received&)> handler) {
    m_onReceived = std::move(handler);
  }
  void SetOnNotice(Notice notice) { m_notice = std::move(notice); }
  // The wall-clock time the set-clock message carries.
  void SetTimeSource(std::function<DateTime()> now) { m_now = std::move(now); }

  // Starts the next exchange when none is in progress and a command waits.
  void Pump(uint32_t tick);
  void OnBytes(std::span<const uint8_t> bytes, uint32_t tick);
  // Call when the tick has reached Deadline().
  void OnTimer(uint32_t tick);
  // When OnTimer wants to be called next, if at all.
  std::optional<uint32_t> Deadline() const;

  // The device went away: the exchange in progress is dropped and the
  // current command will start again from its address. Nothing is sent
  // until SetOnline(true).
  void SetOnline(bool online, uint32_t tick);

  // In an exchange, or holding a command not yet fully sent.
  bool Busy() const;
  const Cm11aCounters& Counters() const { return m_counters; }

 private:
  enum class Phase { kIdle, kChecksum, kReady, kUploadSize, kUpload, kMacro, kPause };

  void StartNext(uint32_t tick);
  void SendExchange(uint32_t tick);
  void Finished(uint32_t tick);
  void Failed(uint32_t tick, bool wrongChecksum);
  bool Unprompted(uint8_t byte, uint32_t tick);
  void OnByte(uint8_t byte, uint32_t tick);
  void Write(std::initializer_list<uint8_t> bytes);
  void Arm(uint32_t tick, uint32_t ms);
  void Report(int32_t level, const std::string& text);

  Cm11aTiming m_timing;
  int32_t m_monitoredHouse;
  Writer m_write;
  CommandSource m_source;
  std::function<void(const X10Received&)> m_onReceived;
  Notice m_notice;
  std::function<DateTime()> m_now;

  Phase m_phase = Phase::kIdle;
  bool m_online = true;
  std::optional<uint32_t> m_deadline;
  std::optional<uint32_t> m_resumeAt;  // paused until then after repeated failures
  std::vector<X10Transmission> m_command;
  size_t m_step = 0;
  bool m_clockWanted = false;
  bool m_exchangeIsClock = false;
  std::vector<uint8_t> m_exchange;
  uint8_t m_expected = 0;
  int32_t m_failures = 0;
  uint32_t m_pauseMs = 0;
  bool m_failing = false;
  std::vector<uint8_t> m_upload;
  size_t m_uploadSize = 0;
  size_t m_macroBytes = 0;
  X10UploadDecoder m_decoder;
  Cm11aCounters m_counters;
};

}  // namespace tav
