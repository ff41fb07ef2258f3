#include "suite/channelio/serial/UsbDmxFraming.h"

#include <algorithm>

namespace tav {

void EncodeUsbProSendDMX(std::span<const uint8_t> slots, size_t slotCount,
                         std::vector<uint8_t>& out) {
  const size_t count = std::clamp(slotCount, kUsbProMinSlots, kDMXMaxSlots);
  const size_t given = std::min(slots.size(), count);
  const size_t length = count + 1;  // the START code comes first
  out.assign(4 + length + 1, 0);
  out[0] = kUsbProStart;
  out[1] = kUsbProLabelSendDMX;
  out[2] = static_cast<uint8_t>(length & 0xFF);
  out[3] = static_cast<uint8_t>(length >> 8);
  out[4] = 0x00;
  std::copy_n(slots.begin(), given, out.begin() + 5);
  out.back() = kUsbProEnd;
}

void EncodeOpenDMXFrame(std::span<const uint8_t> slots, std::vector<uint8_t>& out) {
  out.assign(1 + kDMXMaxSlots, 0);
  std::copy_n(slots.begin(), std::min(slots.size(), kDMXMaxSlots), out.begin() + 1);
}

}  // namespace tav
