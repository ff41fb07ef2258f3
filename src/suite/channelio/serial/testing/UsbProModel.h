#pragma once
// A model of a DMX USB Pro widget's receiving side, from the widget's API
// description: it parses the host's messages (0x7E, label, length LSB/MSB,
// data, 0xE7) from a byte stream that may arrive in any pieces, checks each
// one, and keeps the slots of every "send DMX" (label 6) message. A message
// with another label, a length outside 25-513, a START code other than 0 or
// a missing end byte counts as an error, and the model looks for the next
// 0x7E.

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace tav {

class UsbProModel {
 public:
  void Feed(std::span<const uint8_t> bytes);

  // Slots of each frame received, in order.
  const std::vector<std::vector<uint8_t>>& Frames() const { return m_frames; }
  size_t Errors() const { return m_errors; }

 private:
  std::vector<uint8_t> m_buffer;
  std::vector<std::vector<uint8_t>> m_frames;
  size_t m_errors = 0;
};

// A bare DMX dongle's receiver on a line with no breaks to see (a
// pseudo-terminal): frames are the START code and 512 slots back to back.
class OpenDMXModel {
 public:
  void Feed(std::span<const uint8_t> bytes);
  const std::vector<std::vector<uint8_t>>& Frames() const { return m_frames; }
  size_t Errors() const { return m_errors; }

 private:
  std::vector<uint8_t> m_buffer;
  std::vector<std::vector<uint8_t>> m_frames;
  size_t m_errors = 0;
};

}  // namespace tav
