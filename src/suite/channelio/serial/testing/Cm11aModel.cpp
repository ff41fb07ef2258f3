#include "suite/channelio/serial/testing/Cm11aModel.h"

#include <algorithm>
#include <cmath>

namespace tav {
namespace {

// The code nibble's house letter and unit number, from the X10 code table.
constexpr const char* kHouseOfNibble = "MECKOGAINFDLPHBJ";
constexpr std::array<int, 16> kUnitOfNibble = {13, 5, 3, 11, 15, 7, 1, 9,
                                               14, 6, 4, 12, 16, 8, 2, 10};
constexpr uint64_t kRepeatMs = 1000;  // polls and clock requests repeat this often
constexpr double kByteMs = 10.0 * 1000.0 / 4800.0;

int HouseIndex(char house) {
  return house - 'A';
}

}  // namespace

std::string ModelTransmission::Text() const {
  std::string text(1, house);
  if (!isFunction) return text + std::to_string(unit);
  text += " f" + std::to_string(functionCode);
  if (dimSteps) text += " x" + std::to_string(dimSteps);
  return text;
}

Cm11aModel::Cm11aModel(Cm11aModelScript script, Cm11aModelTiming timing)
    : m_script(std::move(script)), m_timing(timing) {}

int Cm11aModel::Lamp(char house, int unit) const {
  return m_lamps[static_cast<size_t>(HouseIndex(house))][static_cast<size_t>(unit)];
}

void Cm11aModel::Hear(std::vector<uint8_t> upload, uint64_t nowMs) {
  m_uploads.push_back(std::move(upload));
  if (m_state == State::kIdle) StartPolling(nowMs);
}

void Cm11aModel::LosePower(uint64_t nowMs) {
  WantClock(nowMs);
}

void Cm11aModel::StartPolling(uint64_t nowMs) {
  if (m_uploads.empty()) m_uploads.push_back(m_script.scriptedUpload);
  m_state = State::kPolling;
  m_nextRepeatAt = nowMs + kRepeatMs;
  Emit({0x5A});
}

void Cm11aModel::WantClock(uint64_t nowMs) {
  m_wantsClock = true;
  m_state = State::kClockWanted;
  m_nextRepeatAt = nowMs + kRepeatMs;
  Emit({0xA5});
}

std::optional<uint64_t> Cm11aModel::NextEventMs() const {
  switch (m_state) {
    case State::kTransmitting:
      return m_doneAt;
    case State::kPolling:
    case State::kClockWanted:
      return m_nextRepeatAt;
    default:
      return std::nullopt;
  }
}

void Cm11aModel::Advance(uint64_t nowMs) {
  if (m_state == State::kTransmitting && nowMs >= m_doneAt) {
    m_state = State::kIdle;
    Emit({0x55});
    if (m_wantsClock) {
      WantClock(nowMs);
    } else if (!m_uploads.empty()) {
      StartPolling(nowMs);
    }
  }
  if ((m_state == State::kPolling || m_state == State::kClockWanted) && nowMs >= m_nextRepeatAt) {
    m_nextRepeatAt = nowMs + kRepeatMs;
    Emit({static_cast<uint8_t>(m_state == State::kPolling ? 0x5A : 0xA5)});
  }
}

void Cm11aModel::FromHost(std::span<const uint8_t> bytes, uint64_t nowMs) {
  for (uint8_t byte : bytes) OnByte(byte, nowMs);
}

void Cm11aModel::OnByte(uint8_t byte, uint64_t nowMs) {
  switch (m_state) {
    case State::kIdle:
      if (byte == 0x9B) {
        m_clockBytes.clear();
        m_state = State::kClockBytes;
      } else if ((byte & 0x04) != 0 && (byte & 0x01) == 0) {
        m_header = byte;
        m_state = State::kCode;
      } else if (byte != 0xC3) {  // a second 0xC3 that crossed a repeated poll is harmless
        ++m_protocolErrors;
      }
      return;
    case State::kCode: {
      m_code = byte;
      const int exchange = ++m_exchange;
      const uint8_t sum = static_cast<uint8_t>(m_header + m_code);
      m_sentWrongChecksum = false;
      if (m_script.silentAt.count(exchange)) {
        m_state = State::kIdle;
      } else if (m_script.pollInsteadOfChecksumAt.count(exchange)) {
        StartPolling(nowMs);
      } else if (m_script.clockRequestInsteadOfChecksumAt.count(exchange)) {
        WantClock(nowMs);
      } else {
        m_sentWrongChecksum = m_script.wrongChecksumAt.count(exchange) > 0;
        m_state = State::kAwaitOk;
        Emit({static_cast<uint8_t>(m_sentWrongChecksum ? sum + 1 : sum)});
      }
      return;
    }
    case State::kAwaitOk:
      if (byte != 0x00) {
        // The host sends the command again (after a wrong checksum).
        m_state = State::kIdle;
        OnByte(byte, nowMs);
        return;
      }
      if (m_sentWrongChecksum) {
        ++m_protocolErrors;  // the host confirmed a checksum that was wrong
        m_state = State::kIdle;
        return;
      }
      if (m_script.pollInsteadOfReadyAt.count(m_exchange)) {
        StartPolling(nowMs);
      } else if (m_script.clockRequestInsteadOfReadyAt.count(m_exchange)) {
        WantClock(nowMs);
      } else {
        Transmit(nowMs);
      }
      return;
    case State::kTransmitting:
      ++m_protocolErrors;  // the host must wait for 0x55
      return;
    case State::kPolling:
      if (byte == 0xC3) {
        std::vector<uint8_t> upload = m_uploads.front();
        m_uploads.pop_front();
        std::vector<uint8_t> out;
        out.push_back(static_cast<uint8_t>(upload.size()));
        out.insert(out.end(), upload.begin(), upload.end());
        ++m_uploadsSent;
        m_state = State::kIdle;
        Emit(out);
        if (m_wantsClock) {
          WantClock(nowMs);
        } else if (!m_uploads.empty()) {
          StartPolling(nowMs);
        }
      }
      return;  // commands are not taken while an upload waits
    case State::kClockWanted:
      if (byte == 0x9B) {
        m_clockBytes.clear();
        m_state = State::kClockBytes;
      }
      return;
    case State::kClockBytes:
      m_clockBytes.push_back(byte);
      if (m_clockBytes.size() == 6) {
        const int exchange = ++m_exchange;
        uint8_t sum = 0;
        for (uint8_t b : m_clockBytes) sum = static_cast<uint8_t>(sum + b);
        m_sentWrongChecksum = m_script.wrongChecksumAt.count(exchange) > 0;
        m_state = State::kAwaitOkClock;
        Emit({static_cast<uint8_t>(m_sentWrongChecksum ? sum + 1 : sum)});
      }
      return;
    case State::kAwaitOkClock:
      if (byte == 0x00 && !m_sentWrongChecksum) {
        std::array<uint8_t, 7> message{0x9B};
        std::copy(m_clockBytes.begin(), m_clockBytes.end(), message.begin() + 1);
        m_clockSets.push_back(message);
        m_wantsClock = false;
        m_state = State::kIdle;
        Emit({0x55});
        if (!m_uploads.empty()) StartPolling(nowMs);
      } else if (byte == 0x9B) {
        m_clockBytes.clear();
        m_state = State::kClockBytes;
      } else {
        ++m_protocolErrors;
        m_state = m_wantsClock ? State::kClockWanted : State::kIdle;
      }
      return;
  }
}

void Cm11aModel::Transmit(uint64_t nowMs) {
  ModelTransmission t;
  t.isFunction = (m_header & 0x02) != 0;
  t.house = kHouseOfNibble[m_code >> 4];
  if (t.isFunction) {
    t.functionCode = m_code & 0x0F;
    if (t.functionCode == 4 || t.functionCode == 5) t.dimSteps = m_header >> 3;
  } else {
    t.unit = kUnitOfNibble[m_code & 0x0F];
  }
  m_transmissions.push_back(t);
  Apply(t);
  m_state = State::kTransmitting;
  if (m_timing.instant) {
    m_doneAt = nowMs;
    Advance(nowMs);
    return;
  }
  // One X10 frame: 11 cycles twice and a 3-cycle gap; each further dim step
  // one more 11-cycle frame. Then the 0x00 and 0x55 bytes on the serial line.
  double cycles = 25.0 + (t.dimSteps > 1 ? (t.dimSteps - 1) * 11.0 : 0.0);
  m_doneAt =
      nowMs + static_cast<uint64_t>(std::ceil(cycles * 1000.0 / m_timing.lineHz + 2 * kByteMs));
}

void Cm11aModel::Apply(const ModelTransmission& t) {
  const size_t house = static_cast<size_t>(HouseIndex(t.house));
  if (!t.isFunction) {
    if (m_functionSeen[house]) {
      m_addressed[house].clear();
      m_functionSeen[house] = false;
    }
    auto& units = m_addressed[house];
    if (std::find(units.begin(), units.end(), t.unit) == units.end()) units.push_back(t.unit);
    return;
  }
  m_functionSeen[house] = true;
  for (int unit : m_addressed[house]) {
    int& lamp = m_lamps[house][static_cast<size_t>(unit)];
    switch (t.functionCode) {
      case 2:
        lamp = 22;
        break;
      case 3:
        lamp = 0;
        break;
      case 4:
        lamp = std::max(0, (lamp == 0 ? 22 : lamp) - t.dimSteps);
        break;
      case 5:
        lamp = std::min(22, (lamp == 0 ? 22 : lamp) + t.dimSteps);
        break;
      default:
        break;
    }
  }
}

}  // namespace tav
