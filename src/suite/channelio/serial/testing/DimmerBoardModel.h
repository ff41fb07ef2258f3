#pragma once
// A model of a chain of serial dimmer boards, written from the protocol's
// description and not from the encoder, to check what the encoder sends.
//
// Each board parses its input byte by byte: 0x7E resets it; behind 0x7E 0x80
// it takes its channels (undoing escapes), and everything after them it
// passes on behind a fresh "7E 80"; behind 0x7E and an address above 0x80 it
// passes on the frame with the address one lower. Pads are dropped. The
// chain feeds each board's output to the next; whatever the last board
// passes on is left over (nothing, when the chain is as long as the frame
// says).
//
// Each board counts the frames it completed and anything it could not make
// sense of (data with no header, a bad escape, a header cut short).

#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>
#include <vector>

namespace tav {

class DimmerBoardModel {
 public:
  explicit DimmerBoardModel(size_t channels) : m_channels(channels, 0), m_taking(channels, 0) {}

  // Called with the board's channels each time it completes a frame.
  void SetOnFrame(std::function<void(const std::vector<uint8_t>&)> handler) {
    m_onFrame = std::move(handler);
  }
  // Parses `input`; appends what the board passes on to `output`.
  void Feed(std::span<const uint8_t> input, std::vector<uint8_t>& output);

  // The channels of the last complete frame.
  const std::vector<uint8_t>& Channels() const { return m_channels; }
  size_t FramesTaken() const { return m_frames; }
  size_t Errors() const { return m_errors; }
  size_t PadsSeen() const { return m_pads; }
  // The longest run of bytes seen between two pads.
  size_t LongestRunWithoutPad() const { return m_longestRun; }

 private:
  enum class State { kIdle, kAddress, kTaking, kPassRest, kPassOn };

  void Data(uint8_t value, std::vector<uint8_t>& output, bool escaped);

  std::vector<uint8_t> m_channels;
  std::vector<uint8_t> m_taking;
  size_t m_taken = 0;
  State m_state = State::kIdle;
  bool m_escape = false;
  bool m_headerSent = false;
  size_t m_frames = 0;
  size_t m_errors = 0;
  size_t m_pads = 0;
  size_t m_run = 0;
  size_t m_longestRun = 0;
  std::function<void(const std::vector<uint8_t>&)> m_onFrame;
};

class DimmerChainModel {
 public:
  DimmerChainModel(size_t boards, size_t channelsPerBoard);

  void Feed(std::span<const uint8_t> bytes);
  const DimmerBoardModel& Board(size_t index) const { return m_boards[index]; }
  DimmerBoardModel& Board(size_t index) { return m_boards[index]; }
  size_t Boards() const { return m_boards.size(); }
  // Every board's channels, board 1 first.
  std::vector<uint8_t> AllChannels() const;
  size_t Errors() const;
  // Bytes the last board passed on.
  const std::vector<uint8_t>& LeftOver() const { return m_leftOver; }

 private:
  std::vector<DimmerBoardModel> m_boards;
  std::vector<uint8_t> m_leftOver;
};

}  // namespace tav
