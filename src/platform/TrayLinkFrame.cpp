#include "platform/TrayLinkFrame.h"

namespace tav {
namespace {

constexpr char kMagic[4] = {'T', 'A', 'V', 'L'};

uint32_t Read32(std::string_view bytes, size_t at) {
  return static_cast<uint32_t>(static_cast<uint8_t>(bytes[at])) |
         static_cast<uint32_t>(static_cast<uint8_t>(bytes[at + 1])) << 8 |
         static_cast<uint32_t>(static_cast<uint8_t>(bytes[at + 2])) << 16 |
         static_cast<uint32_t>(static_cast<uint8_t>(bytes[at + 3])) << 24;
}

uint16_t Read16(std::string_view bytes, size_t at) {
  return static_cast<uint16_t>(static_cast<uint8_t>(bytes[at]) | static_cast<uint8_t>(bytes[at + 1])
                                                                     << 8);
}

void Write32(std::string& out, uint32_t value) {
  for (int shift = 0; shift < 32; shift += 8) out.push_back(static_cast<char>(value >> shift));
}

void Write16(std::string& out, uint16_t value) {
  out.push_back(static_cast<char>(value));
  out.push_back(static_cast<char>(value >> 8));
}

}  // namespace

const char* TrayFrameStatusText(TrayFrameStatus status) {
  switch (status) {
    case TrayFrameStatus::kFrame:
      return "frame";
    case TrayFrameStatus::kIncomplete:
      return "incomplete frame";
    case TrayFrameStatus::kBadHeader:
      return "bad frame header";
    case TrayFrameStatus::kTooLarge:
      return "oversized frame";
  }
  return "unknown";
}

TrayFrameStatus ParseTrayFrameHeader(std::string_view bytes, uint32_t maxDataBytes,
                                     TrayFrameHeader& header) {
  if (bytes.size() < kTrayFrameHeaderSize) return TrayFrameStatus::kIncomplete;
  if (bytes.substr(0, 4) != std::string_view(kMagic, 4) || Read16(bytes, 4) != kTrayFrameVersion ||
      Read16(bytes, 6) != 0) {
    return TrayFrameStatus::kBadHeader;
  }
  header.senderHwnd = Read32(bytes, 8);
  header.dwData = Read32(bytes, 12);
  header.cbData = Read32(bytes, 16);
  if (header.cbData > maxDataBytes) return TrayFrameStatus::kTooLarge;
  return TrayFrameStatus::kFrame;
}

void AppendTrayFrame(std::string& out, const TrayFrame& frame) {
  out.append(kMagic, 4);
  Write16(out, kTrayFrameVersion);
  Write16(out, 0);
  Write32(out, frame.senderHwnd);
  Write32(out, frame.dwData);
  Write32(out, static_cast<uint32_t>(frame.data.size()));
  out.append(frame.data);
}

std::string EncodeTrayFrame(const TrayFrame& frame) {
  std::string out;
  out.reserve(kTrayFrameHeaderSize + frame.data.size());
  AppendTrayFrame(out, frame);
  return out;
}

void TrayFrameReader::Append(std::string_view bytes) {
  if (m_error != TrayFrameStatus::kIncomplete) return;
  // Compact before growing, so the buffer holds at most one frame and the
  // bytes of the last read.
  if (m_offset > 0 && m_offset >= m_buffer.size() / 2) {
    m_buffer.erase(0, m_offset);
    m_offset = 0;
  }
  m_buffer.append(bytes);
}

TrayFrameStatus TrayFrameReader::Next(TrayFrame& frame) {
  if (m_error != TrayFrameStatus::kIncomplete) return m_error;
  std::string_view rest = std::string_view(m_buffer).substr(m_offset);
  TrayFrameHeader header;
  TrayFrameStatus status = ParseTrayFrameHeader(rest, m_maxDataBytes, header);
  if (status == TrayFrameStatus::kIncomplete) return status;
  if (status != TrayFrameStatus::kFrame) {
    m_error = status;
    m_buffer.clear();
    m_offset = 0;
    return status;
  }
  if (rest.size() - kTrayFrameHeaderSize < header.cbData) return TrayFrameStatus::kIncomplete;
  frame.senderHwnd = header.senderHwnd;
  frame.dwData = header.dwData;
  frame.data.assign(rest.substr(kTrayFrameHeaderSize, header.cbData));
  m_offset += kTrayFrameHeaderSize + header.cbData;
  if (m_offset == m_buffer.size()) {
    m_buffer.clear();
    m_offset = 0;
  }
  return TrayFrameStatus::kFrame;
}

}  // namespace tav
