#include "suite/channelio/serial/X10Transmitter.h"

namespace tav {
namespace {

int32_t MonitoredHouse(const std::string& houseCodes) {
  for (char letter : houseCodes) {
    if (int32_t house = X10HouseFromLetter(letter)) return house;
  }
  return 1;
}

}  // namespace

SerialSettings X10Transmitter::PortSettings(const X10NetworkSettings& settings) {
  SerialSettings serial;
  serial.path = settings.path;
  serial.baud = kCm11aBaud;
  serial.stopBits = 1;
  return serial;
}

X10Transmitter::X10Transmitter(X10NetworkSettings settings, std::unique_ptr<SerialLink> link,
                               TimerService& timers, const Clock& clock, MessageLog& log)
    : m_settings(std::move(settings)),
      m_link(std::move(link)),
      m_clock(clock),
      m_log(log),
      m_protocol(m_settings.timing, MonitoredHouse(m_settings.houseCodes)),
      m_timer(timers, "X10 interface",
              [this] {
                m_protocol.OnTimer(m_clock.TickCount());
                AfterProtocol();
              }),
      m_warnAt(m_settings.warnDepth) {
  m_protocol.SetWriter([this](std::span<const uint8_t> bytes) { m_link->Write(bytes); });
  m_protocol.SetCommandSource([this] { return m_queue.TakeNext(); });
  m_protocol.SetTimeSource([this] { return m_clock.Now(); });
  m_protocol.SetOnNotice([this](int32_t level, const std::string& text) {
    m_log.LogMessage(level, std::string(kName) + ": " + text);
  });
  m_protocol.SetOnReceived([this](const X10Received& received) {
    if (m_onReceived) m_onReceived(received);
  });
  m_link->SetOnReceive([this](std::span<const uint8_t> bytes) {
    m_protocol.OnBytes(bytes, m_clock.TickCount());
    AfterProtocol();
  });
  m_link->SetOnConnectionChange(
      [this](bool connected, const std::string& reason) { OnConnectionChange(connected, reason); });
  m_protocol.SetOnline(m_link->Connected(), m_clock.TickCount());
}

X10Transmitter::~X10Transmitter() {
  // The link may outlive nothing of ours: drop its callbacks first.
  m_link->SetOnReceive(nullptr);
  m_link->SetOnConnectionChange(nullptr);
}

void X10Transmitter::SetOnReceived(std::function<void(const X10Received&)> handler) {
  m_onReceived = std::move(handler);
}

size_t X10Transmitter::QueueDepth() const {
  return m_queue.Depth() + (m_protocol.Busy() ? 1 : 0);
}

void X10Transmitter::SetLevel(int32_t house, int32_t unit, uint8_t level) {
  if (house < 1 || house > 16 || unit < 1 || unit > 16) return;
  m_levels[static_cast<size_t>((house - 1) * 16 + (unit - 1))] = level;
  m_queue.SetTarget(house, unit, X10StepsForLevel(level));
  m_protocol.Pump(m_clock.TickCount());
  AfterProtocol();
}

void X10Transmitter::SetLevels(std::span<const uint8_t> levels) {
  const size_t count = std::min<size_t>(levels.size(), m_levels.size());
  for (size_t i = 0; i < count; ++i) {
    if (levels[i] == m_levels[i]) continue;
    m_levels[i] = levels[i];
    m_queue.SetTarget(static_cast<int32_t>(i / 16) + 1, static_cast<int32_t>(i % 16) + 1,
                      X10StepsForLevel(levels[i]));
  }
  m_protocol.Pump(m_clock.TickCount());
  AfterProtocol();
}

void X10Transmitter::AfterProtocol() {
  if (auto deadline = m_protocol.Deadline()) {
    m_timer.Arm(m_clock.TickCount(), *deadline);
  } else {
    m_timer.Cancel();
  }
  CheckDepth();
}

void X10Transmitter::CheckDepth() {
  const size_t depth = QueueDepth();
  if (m_settings.warnDepth == 0) return;
  if (depth >= m_warnAt) {
    m_log.LogMessage(2, std::string(kName) + ": " + std::to_string(depth) +
                            " commands are waiting for the power line");
    m_warnAt *= 2;
  } else if (m_warnAt > m_settings.warnDepth && depth <= m_settings.warnDepth / 2) {
    m_log.LogMessage(1, std::string(kName) + ": the command queue has caught up (" +
                            std::to_string(depth) + " waiting)");
    m_warnAt = m_settings.warnDepth;
  }
}

void X10Transmitter::OnConnectionChange(bool connected, const std::string& reason) {
  const uint32_t now = m_clock.TickCount();
  if (!connected) {
    m_log.LogMessage(2, std::string(kName) + ": lost " + m_settings.path + " (" + reason +
                            "); it is reopened when it comes back");
    m_protocol.SetOnline(false, now);
  } else {
    m_log.LogMessage(1, std::string(kName) + ": " + m_settings.path + " is back");
    m_protocol.SetOnline(true, now);
  }
  AfterProtocol();
}

}  // namespace tav
