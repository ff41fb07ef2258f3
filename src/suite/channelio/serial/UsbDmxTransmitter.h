#pragma once
// One DMX universe sent through a USB-serial widget instead of the network:
// a DMX USB Pro (framed "send DMX" messages; the widget repeats the last
// frame on its own, so the host sends on change and refreshes once a second)
// or a bare FTDI dongle (the host makes every frame: break, mark, START code
// and 512 slots at 250 000 baud 8N2, about 40 times a second whether or not
// anything changed, since receivers take a silent line for a lost signal).
//
// Owned by the I/O control, one per universe with a widget. The
// TimerService, Clock and MessageLog must outlive it.

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "suite/channelio/serial/SerialFrameSender.h"

namespace tav {

enum class UsbDmxWidget { kPro, kOpenDMX };

struct UsbDmxSettings {
  std::string name;  // "DMX universe 2"
  std::string path;
  UsbDmxWidget widget = UsbDmxWidget::kPro;
  // Slots sent to a Pro (24-512); a bare dongle always gets 512.
  int32_t slots = 512;
};

class UsbDmxTransmitter {
 public:
  // How a widget's port is opened: a bare dongle at 250 000 baud 8N2; a Pro
  // ignores the speed, so it gets the common 8N2 at 115200.
  static SerialSettings PortSettings(const UsbDmxSettings& settings);

  UsbDmxTransmitter(UsbDmxSettings settings, std::unique_ptr<SerialLink> link, TimerService& timers,
                    const Clock& clock, MessageLog& log);

  // The universe's slots, slot 1 first.
  void SendLevels(std::span<const uint8_t> slots);

  SerialFrameSender& Sender() { return m_sender; }

 private:
  UsbDmxSettings m_settings;
  SerialFrameSender m_sender;
  std::vector<uint8_t> m_frame;
};

}  // namespace tav
