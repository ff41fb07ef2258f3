#pragma once
// A model of a CM11A-style X10 interface, written from the interface's
// description (not from Cm11aProtocol), for tests and benchmarks of the host
// side. It checksums what the host sends, waits for 0x00, "transmits" on a
// modelled power line (lamps that react to On, Off, Dim and Bright), and
// answers 0x55. A script makes it awkward: a wrong checksum, a poll or a
// clock request instead of a checksum or instead of the transmission, or no
// answer at all, at chosen exchanges; traffic heard on the power line makes
// it poll (0x5A, repeated every second until the host answers 0xC3) and
// upload.
//
// Time is the harness's: FromHost and Advance carry the current time in
// milliseconds, and answers that take time (the power line) come out of
// Advance. While it polls or wants its clock set, it takes no command, as
// the real interface does.

#include <array>
#include <cstdint>
#include <deque>
#include <functional>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <vector>

namespace tav {

struct Cm11aModelScript {
  // Exchange numbers (every transmission or set-clock message the model
  // receives in full counts, from 1).
  std::set<int> wrongChecksumAt;
  std::set<int> silentAt;                 // no checksum at all
  std::set<int> pollInsteadOfChecksumAt;  // traffic heard just then: polls
  std::set<int> pollInsteadOfReadyAt;     // traffic heard before transmitting: polls, sends nothing
  std::set<int> clockRequestInsteadOfChecksumAt;  // power glitch: wants its clock
  std::set<int> clockRequestInsteadOfReadyAt;
  // The upload that a scripted poll delivers (mask + data): "A1 A On" heard.
  std::vector<uint8_t> scriptedUpload = {0x02, 0x66, 0x62};
};

// The power line's timing: an X10 frame is 11 cycles sent twice plus a
// 3-cycle gap; every dim step beyond the first adds one more frame of 11
// cycles. Serial bytes at 4800 baud take 2.08 ms each.
struct Cm11aModelTiming {
  double lineHz = 60.0;
  bool instant = false;  // answer 0x55 at once (unit tests)
};

struct ModelTransmission {
  bool isFunction = false;
  char house = 'A';
  int unit = 0;          // addresses
  int functionCode = 0;  // functions
  int dimSteps = 0;
  std::string Text() const;  // "A1", "A f2", "A f4 x11"
};

class Cm11aModel {
 public:
  explicit Cm11aModel(Cm11aModelScript script = {}, Cm11aModelTiming timing = {});

  // Bytes for the host come out here.
  std::function<void(const std::vector<uint8_t>&)> toHost;

  void FromHost(std::span<const uint8_t> bytes, uint64_t nowMs);
  void Advance(uint64_t nowMs);
  // The next moment Advance has something to do.
  std::optional<uint64_t> NextEventMs() const;

  // Traffic heard on the power line: upload bytes (mask + data, at most 9).
  void Hear(std::vector<uint8_t> upload, uint64_t nowMs);
  // A power failure: from now on it asks for the clock.
  void LosePower(uint64_t nowMs);

  const std::vector<ModelTransmission>& Transmissions() const { return m_transmissions; }
  const std::vector<std::array<uint8_t, 7>>& ClockSets() const { return m_clockSets; }
  // Lamp level in dim steps (0-22) of a house letter and unit.
  int Lamp(char house, int unit) const;
  int Exchanges() const { return m_exchange; }
  int UploadsSent() const { return m_uploadsSent; }
  // Bytes the host sent when it should not have: during a transmission, a
  // 0x00 after a wrong checksum, or anything the model could not place.
  int ProtocolErrors() const { return m_protocolErrors; }
  bool Idle() const { return m_state == State::kIdle && m_uploads.empty() && !m_wantsClock; }

 private:
  enum class State {
    kIdle,
    kCode,
    kAwaitOk,
    kTransmitting,
    kPolling,
    kClockWanted,
    kClockBytes,
    kAwaitOkClock
  };

  void Emit(std::vector<uint8_t> bytes) {
    if (toHost) toHost(bytes);
  }
  void OnByte(uint8_t byte, uint64_t nowMs);
  void StartPolling(uint64_t nowMs);
  void WantClock(uint64_t nowMs);
  void Transmit(uint64_t nowMs);
  void Apply(const ModelTransmission& t);

  Cm11aModelScript m_script;
  Cm11aModelTiming m_timing;
  State m_state = State::kIdle;
  uint8_t m_header = 0;
  uint8_t m_code = 0;
  bool m_sentWrongChecksum = false;
  std::vector<uint8_t> m_clockBytes;
  int m_exchange = 0;
  uint64_t m_doneAt = 0;
  uint64_t m_nextRepeatAt = 0;
  bool m_wantsClock = false;
  std::deque<std::vector<uint8_t>> m_uploads;
  std::vector<ModelTransmission> m_transmissions;
  std::vector<std::array<uint8_t, 7>> m_clockSets;
  std::array<std::array<int, 17>, 16> m_lamps{};
  std::array<std::vector<int>, 16> m_addressed{};
  std::array<bool, 16> m_functionSeen{};
  int m_uploadsSent = 0;
  int m_protocolErrors = 0;
};

}  // namespace tav
