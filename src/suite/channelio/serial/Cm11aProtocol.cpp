#include "suite/channelio/serial/Cm11aProtocol.h"

#include <algorithm>

namespace tav {
namespace {

bool Reached(uint32_t tick, uint32_t deadline) {
  return static_cast<int32_t>(tick - deadline) >= 0;
}

}  // namespace

Cm11aProtocol::Cm11aProtocol(Cm11aTiming timing, int32_t monitoredHouse)
    : m_timing(timing), m_monitoredHouse(monitoredHouse) {}

void Cm11aProtocol::Write(std::initializer_list<uint8_t> bytes) {
  if (m_write) m_write(std::span<const uint8_t>(bytes.begin(), bytes.size()));
}

void Cm11aProtocol::Arm(uint32_t tick, uint32_t ms) {
  m_deadline = tick + ms;
}

void Cm11aProtocol::Report(int32_t level, const std::string& text) {
  if (m_notice) m_notice(level, text);
}

bool Cm11aProtocol::Busy() const {
  return m_phase != Phase::kIdle || m_step < m_command.size() || m_clockWanted;
}

std::optional<uint32_t> Cm11aProtocol::Deadline() const {
  return m_deadline;
}

void Cm11aProtocol::SetOnline(bool online, uint32_t tick) {
  m_online = online;
  m_phase = Phase::kIdle;
  m_deadline.reset();
  // The interface may have lost the address: a command not yet sent in full
  // starts again from it.
  if (m_step < m_command.size()) m_step = 0;
  m_resumeAt.reset();
  m_failures = 0;
  m_pauseMs = 0;
  m_failing = false;
  if (online) StartNext(tick);
}

void Cm11aProtocol::Pump(uint32_t tick) {
  if (m_phase == Phase::kIdle) StartNext(tick);
}

void Cm11aProtocol::StartNext(uint32_t tick) {
  m_phase = Phase::kIdle;
  m_deadline.reset();
  if (!m_online) return;
  if (m_resumeAt) {
    if (!Reached(tick, *m_resumeAt)) {
      m_phase = Phase::kPause;
      m_deadline = m_resumeAt;
      return;
    }
    m_resumeAt.reset();
  }
  if (m_clockWanted) {
    const auto message = Cm11aSetClockMessage(m_now ? m_now() : DateTime(), m_monitoredHouse);
    m_exchange.assign(message.begin(), message.end());
    m_expected = X10Checksum(std::span<const uint8_t>(message).subspan(1));
    m_exchangeIsClock = true;
    SendExchange(tick);
    return;
  }
  if (m_step >= m_command.size()) {
    m_command = m_source ? m_source() : std::vector<X10Transmission>{};
    m_step = 0;
    if (m_command.empty()) return;
  }
  const auto bytes = m_command[m_step].Bytes();
  m_exchange.assign(bytes.begin(), bytes.end());
  m_expected = X10Checksum(bytes);
  m_exchangeIsClock = false;
  SendExchange(tick);
}

void Cm11aProtocol::SendExchange(uint32_t tick) {
  if (m_write) m_write(m_exchange);
  m_phase = Phase::kChecksum;
  Arm(tick, m_timing.checksumTimeoutMs);
}

void Cm11aProtocol::Finished(uint32_t tick) {
  if (m_exchangeIsClock) {
    m_clockWanted = false;
    ++m_counters.clockSets;
  } else {
    ++m_step;
    ++m_counters.transmissions;
  }
  m_failures = 0;
  m_pauseMs = 0;
  if (m_failing) {
    m_failing = false;
    Report(1, "the X10 interface answers again");
  }
  StartNext(tick);
}

void Cm11aProtocol::Failed(uint32_t tick, bool wrongChecksum) {
  if (wrongChecksum) {
    ++m_counters.wrongChecksums;
  } else {
    ++m_counters.timeouts;
  }
  if (++m_failures < m_timing.maxAttempts) {
    SendExchange(tick);
    return;
  }
  m_failures = 0;
  m_pauseMs =
      m_pauseMs == 0 ? m_timing.firstPauseMs : std::min(m_pauseMs * 2, m_timing.longestPauseMs);
  if (!m_failing) {
    m_failing = true;
    Report(2, std::string(wrongChecksum ? "the X10 interface keeps answering a wrong checksum"
                                        : "the X10 interface does not answer") +
                  "; commands wait and are tried again");
  }
  m_resumeAt = tick + m_pauseMs;
  StartNext(tick);
}

bool Cm11aProtocol::Unprompted(uint8_t byte, uint32_t tick) {
  switch (byte) {
    case kCm11aPoll:
      Write({kCm11aPollReply});
      m_phase = Phase::kUploadSize;
      Arm(tick, m_timing.uploadTimeoutMs);
      return true;
    case kCm11aClockRequest:
    case kCm11aClockRequestCP10:
      m_clockWanted = true;
      StartNext(tick);
      return true;
    case kCm11aMacro:
      m_phase = Phase::kMacro;
      m_macroBytes = 0;
      Arm(tick, m_timing.uploadTimeoutMs);
      return true;
    default:
      return false;
  }
}

void Cm11aProtocol::OnBytes(std::span<const uint8_t> bytes, uint32_t tick) {
  for (uint8_t byte : bytes) OnByte(byte, tick);
}

void Cm11aProtocol::OnByte(uint8_t byte, uint32_t tick) {
  switch (m_phase) {
    case Phase::kChecksum:
      // The checksum first: it may happen to equal a control byte.
      if (byte == m_expected) {
        Write({kCm11aTransmitOk});
        m_phase = Phase::kReady;
        // Waiting too short would send a relative dim twice.
        const int32_t steps = m_exchangeIsClock ? 0 : m_command[m_step].dimSteps;
        Arm(tick, m_timing.readyTimeoutMs +
                      m_timing.readyTimeoutPerDimStepMs * static_cast<uint32_t>(steps));
      } else if (!Unprompted(byte, tick) && byte != kCm11aReady) {
        // (A late 0x55 belongs to an exchange that timed out; ignore it.)
        Failed(tick, true);
      }
      return;
    case Phase::kReady:
      if (byte == kCm11aReady) {
        Finished(tick);
      } else {
        Unprompted(byte, tick);
      }
      return;
    case Phase::kUploadSize:
      if (byte >= 1 && byte <= kCm11aMaxUpload) {
        m_uploadSize = byte;
        m_upload.clear();
        m_phase = Phase::kUpload;
        Arm(tick, m_timing.uploadTimeoutMs);
      } else if (byte == kCm11aPoll) {
        // Our 0xC3 crossed a repeated poll; ask again.
        Write({kCm11aPollReply});
        Arm(tick, m_timing.uploadTimeoutMs);
      } else {
        StartNext(tick);
      }
      return;
    case Phase::kUpload:
      m_upload.push_back(byte);
      if (m_upload.size() == m_uploadSize) {
        ++m_counters.polls;
        const auto received = m_decoder.Decode(m_upload);
        StartNext(tick);
        for (const X10Received& event : received) {
          if (m_onReceived) m_onReceived(event);
        }
      }
      return;
    case Phase::kMacro:
      if (++m_macroBytes == 2) StartNext(tick);
      return;
    case Phase::kIdle:
    case Phase::kPause:
      if (byte == kCm11aFilterFailed) {
        Report(2, "the X10 interface reports that its input filter failed");
        return;
      }
      Unprompted(byte, tick);
      return;
  }
}

void Cm11aProtocol::OnTimer(uint32_t tick) {
  if (!m_deadline || !Reached(tick, *m_deadline)) return;
  m_deadline.reset();
  switch (m_phase) {
    case Phase::kChecksum:
    case Phase::kReady:
      Failed(tick, false);
      return;
    case Phase::kUploadSize:
    case Phase::kUpload:
    case Phase::kMacro:
    case Phase::kPause:
    case Phase::kIdle:
      StartNext(tick);
      return;
  }
}

}  // namespace tav
