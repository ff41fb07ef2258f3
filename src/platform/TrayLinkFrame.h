#pragma once
// The byte form of a tray frame on a stream socket: a fixed 20-byte header
// of little-endian fields, then the cbData bytes.
//
//   offset  size  field
//   0       4     magic "TAVL"
//   4       2     version, 1
//   6       2     reserved, 0
//   8       4     sender window handle
//   12      4     dwData
//   16      4     cbData
//   20      cbData  the data (text and its zero byte)
//
// TrayFrameReader splits a byte stream into frames without touching a
// socket: feed it what arrived, then take frames until it needs more. It
// refuses a header that is not one (wrong magic, version or reserved bits)
// and a cbData above its limit as soon as the header is complete, before the
// data is buffered. docs/tray-link.md describes the protocol as a whole.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "host/TrayLink.h"

namespace tav {

constexpr size_t kTrayFrameHeaderSize = 20;
constexpr uint16_t kTrayFrameVersion = 1;

enum class TrayFrameStatus { kFrame, kIncomplete, kBadHeader, kTooLarge };

// "bad header", "oversized frame", ...: the reason a link gives when it drops
// a client.
const char* TrayFrameStatusText(TrayFrameStatus status);

struct TrayFrameHeader {
  uint32_t senderHwnd = 0;
  uint32_t dwData = 0;
  uint32_t cbData = 0;
};

// Reads a header from the first kTrayFrameHeaderSize bytes of `bytes`.
TrayFrameStatus ParseTrayFrameHeader(std::string_view bytes, uint32_t maxDataBytes,
                                     TrayFrameHeader& header);

// Header and data of `frame`.
std::string EncodeTrayFrame(const TrayFrame& frame);
void AppendTrayFrame(std::string& out, const TrayFrame& frame);

class TrayFrameReader {
 public:
  explicit TrayFrameReader(uint32_t maxDataBytes) : m_maxDataBytes(maxDataBytes) {}

  void Append(std::string_view bytes);
  // The next whole frame into `frame`, kIncomplete until one has arrived, or
  // the error, which then sticks: a stream with a bad frame has no reliable
  // frame boundary left.
  TrayFrameStatus Next(TrayFrame& frame);
  size_t Buffered() const { return m_buffer.size() - m_offset; }

 private:
  uint32_t m_maxDataBytes;
  std::string m_buffer;
  size_t m_offset = 0;
  TrayFrameStatus m_error = TrayFrameStatus::kIncomplete;
};

}  // namespace tav
