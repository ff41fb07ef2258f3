#include "suite/channelio/serial/UsbDmxTransmitter.h"

#include "suite/channelio/serial/UsbDmxFraming.h"

namespace tav {
namespace {

// A bare dongle's frame takes 22.6 ms on the line; asking every 25 ms keeps
// it busy without queueing.
constexpr uint32_t kOpenDMXRefreshMs = 25;
constexpr uint32_t kProRefreshMs = 1000;

FrameSenderOptions SenderOptions(const UsbDmxSettings& settings) {
  FrameSenderOptions options;
  options.name = settings.name;
  options.path = settings.path;
  if (settings.widget == UsbDmxWidget::kOpenDMX) {
    options.paceBaud = kOpenDMXBaud;
    options.stopBits = kOpenDMXStopBits;
    options.refreshMs = kOpenDMXRefreshMs;
    options.breakMicros = kOpenDMXBreakMicros;
    options.markMicros = kOpenDMXMarkMicros;
  } else {
    options.refreshMs = kProRefreshMs;
  }
  return options;
}

}  // namespace

SerialSettings UsbDmxTransmitter::PortSettings(const UsbDmxSettings& settings) {
  SerialSettings serial;
  serial.path = settings.path;
  serial.baud = settings.widget == UsbDmxWidget::kOpenDMX ? kOpenDMXBaud : 115200;
  serial.stopBits = 2;
  return serial;
}

UsbDmxTransmitter::UsbDmxTransmitter(UsbDmxSettings settings, std::unique_ptr<SerialLink> link,
                                     TimerService& timers, const Clock& clock, MessageLog& log)
    : m_settings(std::move(settings)),
      m_sender(SenderOptions(m_settings), std::move(link), timers, clock, log) {}

void UsbDmxTransmitter::SendLevels(std::span<const uint8_t> slots) {
  if (m_settings.widget == UsbDmxWidget::kOpenDMX) {
    EncodeOpenDMXFrame(slots, m_frame);
  } else {
    EncodeUsbProSendDMX(slots, static_cast<size_t>(std::max(m_settings.slots, 0)), m_frame);
  }
  m_sender.Send(m_frame);
}

}  // namespace tav
