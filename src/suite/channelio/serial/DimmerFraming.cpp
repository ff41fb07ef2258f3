#include "suite/channelio/serial/DimmerFraming.h"

#include <string>

#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kSource = "DimmerFrameEncoder";

bool IsSpecial(uint8_t value) {
  return static_cast<uint8_t>(value - kDimmerPad) < 3;
}

// Writes items into a buffer sized for the longest frame, putting a pad in
// before any item that would take the run since the last pad past the
// interval. Items are never split.
class FrameWriter {
 public:
  FrameWriter(uint8_t* out, int32_t padInterval)
      : m_start(out), m_next(out), m_padInterval(static_cast<size_t>(padInterval)) {}

  void Item(uint8_t a) {
    PadBefore(1);
    *m_next++ = a;
  }
  void Item(uint8_t a, uint8_t b) {
    PadBefore(2);
    *m_next++ = a;
    *m_next++ = b;
  }
  size_t Size() const { return static_cast<size_t>(m_next - m_start); }

 private:
  void PadBefore(size_t itemBytes) {
    if (m_padInterval == 0) return;
    if (m_sincePad + itemBytes > m_padInterval) {
      *m_next++ = kDimmerPad;
      m_sincePad = 0;
    }
    m_sincePad += itemBytes;
  }

  uint8_t* m_start;
  uint8_t* m_next;
  size_t m_padInterval;
  size_t m_sincePad = 0;
};

}  // namespace

uint8_t DimmerClamp(uint8_t level) {
  switch (level) {
    case 0x7D:
    case 0x7E:
      return 0x7C;
    case 0x7F:
      return 0x80;
    default:
      return level;
  }
}

DimmerFrameEncoder::DimmerFrameEncoder(DimmerFrameLayout layout) : m_layout(layout) {
  auto refuse = [](const std::string& why) {
    return Error(errors::kInvalidProcedureCall, kSource,
                 "Invalid procedure call or argument: " + why);
  };
  if (layout.boards < 1 || layout.channelsPerBoard < 1)
    throw refuse("a dimmer network needs at least one board and one channel per board");
  if (static_cast<int64_t>(layout.boards) * layout.channelsPerBoard > kDimmerMaxChannels)
    throw refuse("more than " + std::to_string(kDimmerMaxChannels) + " channels on one network");
  if (layout.addressing == DimmerAddressing::kHeaderPerBoard &&
      layout.boards > kDimmerMaxBoardsPerHeader)
    throw refuse("a header per board addresses at most " +
                 std::to_string(kDimmerMaxBoardsPerHeader) + " boards");
  if (layout.padInterval < 0) throw refuse("negative pad interval");
  // A pad interval shorter than a header would put a pad before every item;
  // harmless, but not worth the bytes.
  if (layout.padInterval > 0 && layout.padInterval < 2) m_layout.padInterval = 2;
}

void DimmerFrameEncoder::Encode(std::span<const uint8_t> levels, std::vector<uint8_t>& out) const {
  out.resize(LongestFrameBytes());
  FrameWriter writer(out.data(), m_layout.padInterval);
  const size_t perBoard = static_cast<size_t>(m_layout.channelsPerBoard);
  const bool escape = m_layout.specials == DimmerSpecialValues::kEscape;
  size_t channel = 0;
  for (int32_t board = 0; board < m_layout.boards; ++board) {
    if (board == 0 || m_layout.addressing == DimmerAddressing::kHeaderPerBoard) {
      writer.Item(kDimmerSync, static_cast<uint8_t>(kDimmerFirstAddress + board));
    }
    for (size_t i = 0; i < perBoard; ++i, ++channel) {
      uint8_t level = channel < levels.size() ? levels[channel] : 0;
      if (!IsSpecial(level)) {
        writer.Item(level);
      } else if (escape) {
        writer.Item(kDimmerEscape, static_cast<uint8_t>(kDimmerEscapeBase + (level - kDimmerPad)));
      } else {
        writer.Item(DimmerClamp(level));
      }
    }
  }
  out.resize(writer.Size());
}

size_t DimmerFrameEncoder::FrameBytes(bool allEscaped) const {
  // Runs the writer's pad rule over item sizes alone.
  const size_t interval = static_cast<size_t>(m_layout.padInterval);
  const size_t dataItem = allEscaped && m_layout.specials == DimmerSpecialValues::kEscape ? 2 : 1;
  size_t total = 0;
  size_t sincePad = 0;
  auto item = [&](size_t bytes) {
    if (interval != 0 && sincePad + bytes > interval) {
      ++total;
      sincePad = 0;
    }
    sincePad += bytes;
    total += bytes;
  };
  for (int32_t board = 0; board < m_layout.boards; ++board) {
    if (board == 0 || m_layout.addressing == DimmerAddressing::kHeaderPerBoard) item(2);
    for (int32_t i = 0; i < m_layout.channelsPerBoard; ++i) item(dataItem);
  }
  return total;
}

}  // namespace tav
