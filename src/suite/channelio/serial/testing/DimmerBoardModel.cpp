#include "suite/channelio/serial/testing/DimmerBoardModel.h"

#include <algorithm>

namespace tav {

void DimmerBoardModel::Feed(std::span<const uint8_t> input, std::vector<uint8_t>& output) {
  for (uint8_t byte : input) {
    if (byte == 0x7E) {  // sync: resets the parser whatever came before
      if (m_state == State::kTaking || m_state == State::kAddress || m_escape) ++m_errors;
      m_state = State::kAddress;
      m_escape = false;
      m_longestRun = std::max(m_longestRun, ++m_run);
      continue;
    }
    if (m_escape) {
      // The byte after an escape is its value, whatever it is: a pad here
      // would be read as a bad value.
      m_escape = false;
      m_longestRun = std::max(m_longestRun, ++m_run);
      if (byte < 0x2F || byte > 0x31) {
        ++m_errors;
        continue;
      }
      Data(static_cast<uint8_t>(0x7D + (byte - 0x2F)), output, true);
      continue;
    }
    if (byte == 0x7D) {  // pad: dropped
      ++m_pads;
      m_run = 0;
      continue;
    }
    m_longestRun = std::max(m_longestRun, ++m_run);
    switch (m_state) {
      case State::kIdle:
        ++m_errors;  // data with no header before it
        break;
      case State::kAddress:
        if (byte == 0x80) {
          m_state = State::kTaking;
          m_taken = 0;
        } else if (byte > 0x80) {
          output.push_back(0x7E);
          output.push_back(static_cast<uint8_t>(byte - 1));
          m_state = State::kPassOn;
        } else {
          ++m_errors;
          m_state = State::kIdle;
        }
        break;
      default:
        if (byte == 0x7F) {
          m_escape = true;
        } else {
          Data(byte, output, false);
        }
        break;
    }
  }
}

void DimmerBoardModel::Data(uint8_t value, std::vector<uint8_t>& output, bool escaped) {
  auto passOn = [&] {
    if (escaped) {
      output.push_back(0x7F);
      output.push_back(static_cast<uint8_t>(0x2F + (value - 0x7D)));
    } else {
      output.push_back(value);
    }
  };
  switch (m_state) {
    case State::kTaking:
      m_taking[m_taken++] = value;
      if (m_taken == m_taking.size()) {
        m_channels = m_taking;
        ++m_frames;
        if (m_onFrame) m_onFrame(m_channels);
        m_state = State::kPassRest;
        m_headerSent = false;
      }
      break;
    case State::kPassRest:
      if (!m_headerSent) {
        output.push_back(0x7E);
        output.push_back(0x80);
        m_headerSent = true;
      }
      passOn();
      break;
    case State::kPassOn:
      passOn();
      break;
    default:
      ++m_errors;
      break;
  }
}

DimmerChainModel::DimmerChainModel(size_t boards, size_t channelsPerBoard)
    : m_boards(boards, DimmerBoardModel(channelsPerBoard)) {}

void DimmerChainModel::Feed(std::span<const uint8_t> bytes) {
  std::vector<uint8_t> input(bytes.begin(), bytes.end());
  for (auto& board : m_boards) {
    std::vector<uint8_t> output;
    board.Feed(input, output);
    input.swap(output);
  }
  m_leftOver.insert(m_leftOver.end(), input.begin(), input.end());
}

std::vector<uint8_t> DimmerChainModel::AllChannels() const {
  std::vector<uint8_t> all;
  for (const auto& board : m_boards)
    all.insert(all.end(), board.Channels().begin(), board.Channels().end());
  return all;
}

size_t DimmerChainModel::Errors() const {
  size_t errors = 0;
  for (const auto& board : m_boards) errors += board.Errors();
  return errors;
}

}  // namespace tav
