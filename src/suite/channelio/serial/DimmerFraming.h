#pragma once
// The frame of the hobby serial dimmer protocol that Fennick boards (and the
// suite's own serial controllers) speak: sync 0x7E, an address byte from
// 0x80, the channel bytes, and 0x7D pads now and then. A chain of boards
// shares one line; each board takes its channels behind "7E 80" and passes
// the rest on with the next address decremented, so every board sees its
// own data behind "7E 80" again.
//
// Two ways to address the chain: one header for the whole frame (each board
// strips its channels and forwards "7E 80" and the remainder), or a header
// before every board's channels ("7E 80+b"; on the classic eight-channel
// boards that is a header every eight channels). Channel values that collide
// with the special bytes are escaped (0x7F then 0x2F/0x30/0x31) or clamped to
// a neighbour (0x7C, 0x7C, 0x80) so the frame length never varies.
//
// Pads: boards re-transmit on a clock that may run a little slow, so the
// encoder puts a pad in once 100 bytes have gone since the last one (or the
// frame's start), always between two whole items: never inside a header or
// an escape pair. Receivers drop pads.
//
// Pure: no I/O. An encoder is a value; Encode may be called from anywhere.

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace tav {

inline constexpr uint8_t kDimmerSync = 0x7E;
inline constexpr uint8_t kDimmerFirstAddress = 0x80;
inline constexpr uint8_t kDimmerPad = 0x7D;
inline constexpr uint8_t kDimmerEscape = 0x7F;
// Escaped value = kDimmerEscapeBase + (value - kDimmerPad).
inline constexpr uint8_t kDimmerEscapeBase = 0x2F;
// Address bytes run 0x80-0xFF, so a frame with a header per board reaches
// 128 boards.
inline constexpr int32_t kDimmerMaxBoardsPerHeader = 128;
inline constexpr int32_t kDimmerMaxChannels = 4096;
inline constexpr int32_t kDimmerDefaultPadInterval = 100;

enum class DimmerAddressing {
  kOneHeader,       // "7E 80" then every channel of the chain
  kHeaderPerBoard,  // "7E 80+b" before board b's channels
};

enum class DimmerSpecialValues {
  kEscape,  // 0x7D-0x7F sent as 0x7F + 0x2F-0x31
  kClamp,   // 0x7D, 0x7E to 0x7C; 0x7F to 0x80
};

struct DimmerFrameLayout {
  int32_t boards = 1;
  int32_t channelsPerBoard = 8;
  DimmerAddressing addressing = DimmerAddressing::kOneHeader;
  DimmerSpecialValues specials = DimmerSpecialValues::kEscape;
  // Bytes between pads; 0 sends none.
  int32_t padInterval = kDimmerDefaultPadInterval;

  friend bool operator==(const DimmerFrameLayout&, const DimmerFrameLayout&) = default;
};

// The value a clamping encoder sends for `level`.
uint8_t DimmerClamp(uint8_t level);

class DimmerFrameEncoder {
 public:
  // Fails with the invalid-argument error (5) for fewer than one board or
  // channel, more than kDimmerMaxChannels in all, more boards than one
  // header per board can address, or a negative pad interval.
  explicit DimmerFrameEncoder(DimmerFrameLayout layout);

  const DimmerFrameLayout& Layout() const { return m_layout; }
  int32_t ChannelCount() const { return m_layout.boards * m_layout.channelsPerBoard; }

  // Replaces `out` with the frame for `levels`: board 1's channels first.
  // Levels beyond ChannelCount() are ignored; missing ones are sent as 0.
  void Encode(std::span<const uint8_t> levels, std::vector<uint8_t>& out) const;

  // Frame length when no value needs escaping, and when every value does.
  size_t ShortestFrameBytes() const { return FrameBytes(false); }
  size_t LongestFrameBytes() const { return FrameBytes(true); }

 private:
  size_t FrameBytes(bool allEscaped) const;

  DimmerFrameLayout m_layout;
};

}  // namespace tav
