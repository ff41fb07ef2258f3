#include "suite/channelio/serial/testing/UsbProModel.h"

#include <algorithm>

namespace tav {

void UsbProModel::Feed(std::span<const uint8_t> bytes) {
  m_buffer.insert(m_buffer.end(), bytes.begin(), bytes.end());
  size_t at = 0;
  for (;;) {
    // Skip to a start byte; anything before it is noise.
    auto start = std::find(m_buffer.begin() + static_cast<ptrdiff_t>(at), m_buffer.end(), 0x7E);
    if (start != m_buffer.begin() + static_cast<ptrdiff_t>(at)) ++m_errors;
    at = static_cast<size_t>(start - m_buffer.begin());
    if (m_buffer.size() - at < 4) break;
    const uint8_t label = m_buffer[at + 1];
    const size_t length = m_buffer[at + 2] | (static_cast<size_t>(m_buffer[at + 3]) << 8);
    if (label != 6 || length < 25 || length > 513) {
      ++m_errors;
      ++at;
      continue;
    }
    if (m_buffer.size() - at < 4 + length + 1) break;
    if (m_buffer[at + 4 + length] != 0xE7 || m_buffer[at + 4] != 0x00) {
      ++m_errors;
      ++at;
      continue;
    }
    m_frames.emplace_back(m_buffer.begin() + static_cast<ptrdiff_t>(at + 5),
                          m_buffer.begin() + static_cast<ptrdiff_t>(at + 4 + length));
    at += 4 + length + 1;
  }
  m_buffer.erase(m_buffer.begin(), m_buffer.begin() + static_cast<ptrdiff_t>(at));
}

void OpenDMXModel::Feed(std::span<const uint8_t> bytes) {
  m_buffer.insert(m_buffer.end(), bytes.begin(), bytes.end());
  size_t at = 0;
  while (m_buffer.size() - at >= 513) {
    if (m_buffer[at] != 0x00) ++m_errors;
    m_frames.emplace_back(m_buffer.begin() + static_cast<ptrdiff_t>(at + 1),
                          m_buffer.begin() + static_cast<ptrdiff_t>(at + 513));
    at += 513;
  }
  m_buffer.erase(m_buffer.begin(), m_buffer.begin() + static_cast<ptrdiff_t>(at));
}

}  // namespace tav
