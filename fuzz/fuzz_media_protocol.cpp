// What a media process can send the player (and the player it), on
// arbitrary bytes: the stream is split into lines by the line reader, fed in
// two pieces, and every line is decoded. Decoding may refuse (tav::Error)
// but never crash, and what it accepts must be written back as a line that
// reads as the same message.

#include <cstdlib>

#include "FuzzCommon.h"
#include "platform/media/MediaProtocol.h"

namespace {

void CheckLine(const std::string& line) {
  if (line.size() > tav::kMaxMediaLine || line.find('\n') != std::string::npos) std::abort();
  tav::MediaMessage message;
  try {
    message = tav::DecodeMediaLine(line);
  } catch (const tav::Error&) {
    return;
  }
  std::string written = tav::EncodeMediaMessage(message);
  if (written.empty() || written.back() != '\n') std::abort();
  std::string_view again(written);
  again.remove_suffix(1);
  if (again.find('\n') != std::string_view::npos) std::abort();
  if (!(tav::DecodeMediaLine(again) == message)) std::abort();
}

}  // namespace

TAV_FUZZ_TARGET({
  tav::MediaLineReader reader;
  size_t half = input.size() / 2;
  reader.Append(input.substr(0, half));
  bool appendedRest = false;
  std::string line;
  for (;;) {
    tav::MediaLineStatus status = reader.Next(line);
    if (status == tav::MediaLineStatus::kLine) {
      CheckLine(line);
      continue;
    }
    if (status != tav::MediaLineStatus::kIncomplete || appendedRest) break;
    reader.Append(input.substr(half));
    appendedRest = true;
  }
})
