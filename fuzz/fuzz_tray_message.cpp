// What a tray can send the player, on arbitrary bytes: the stream is split
// into frames by the frame reader and every frame's data is decoded as a tray
// message; the whole input is also decoded as one copy-data block. Decoding
// may refuse (tav::Error) but never crash, and what it accepts must agree
// with how the text is written.

#include <cstdlib>

#include "FuzzCommon.h"
#include "host/Msg.h"
#include "platform/TrayLinkFrame.h"

namespace {

void DecodeBlock(const std::string& block) {
  bool hasZero = block.empty() || block.find('\0') != std::string::npos;
  try {
    tav::TAVMessage message = tav::DecodeReceivedMessage(tav::TrayFrame{7, 3, block});
    if (!hasZero || message.SenderHwnd() != 7) std::abort();
    // The body is what follows the two type characters, up to the zero.
    std::string text = block.substr(0, block.find('\0'));
    if (message.Text() != (text.size() > 2 ? text.substr(2) : std::string())) std::abort();
    if (message.MessageType() < -9 || message.MessageType() > 99) std::abort();
    if (message.MessageType() >= 10) {
      // Two digits read back as the same text.
      if (tav::TypedMessageText(message.MessageType(), "") != text.substr(0, 2)) std::abort();
    }
  } catch (const tav::Error& e) {
    if (hasZero || e.Number() != 5) std::abort();
  }
}

}  // namespace

TAV_FUZZ_TARGET({
  DecodeBlock(std::string(input));

  tav::TrayFrameReader reader(1024);
  // Feed in two pieces to exercise a frame split across reads.
  size_t half = input.size() / 2;
  reader.Append(input.substr(0, half));
  size_t consumed = 0;
  tav::TrayFrame frame;
  bool appendedRest = false;
  for (;;) {
    tav::TrayFrameStatus status = reader.Next(frame);
    if (status == tav::TrayFrameStatus::kFrame) {
      if (frame.data.size() > 1024) std::abort();
      std::string encoded = tav::EncodeTrayFrame(frame);
      if (input.substr(consumed, encoded.size()) != encoded) std::abort();
      consumed += encoded.size();
      DecodeBlock(frame.data);
      continue;
    }
    if (status != tav::TrayFrameStatus::kIncomplete || appendedRest) break;
    reader.Append(input.substr(half));
    appendedRest = true;
  }
})
