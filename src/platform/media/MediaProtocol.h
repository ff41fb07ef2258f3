#pragma once
// The messages between the player and its media process, one line of text
// each (docs/media-process.md): a word, then a fixed number of fields
// separated by single spaces, then a newline. Text fields are
// percent-encoded (spaces, control bytes and '%'), so no field holds a space
// or a line break; numbers are decimal.
//
// Pure: encoding fills a string, MediaLineReader splits received bytes into
// lines, DecodeMediaLine reads one line. Nothing here touches a socket. The
// player reads what another process writes, so decoding accepts only what
// the encoder can write and fails with an Error on anything else.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <variant>

namespace tav {

constexpr int32_t kMediaProtocolVersion = 1;
// The longest line either side accepts, newline excluded: room for a long
// path or error text, percent-encoded.
constexpr size_t kMaxMediaLine = 32 * 1024;

namespace media {

// The player to the media process. `generation` numbers the plays: each
// OpenMedia and Stop gets the next one, and what the media process reports
// carries the generation it concerns.
struct Outputs {
  std::string audioOutput, audioDevice, videoOutput;
  bool operator==(const Outputs&) const = default;
};
struct Open {
  uint64_t generation = 0;
  std::string path;
  bool operator==(const Open&) const = default;
};
struct Stop {
  uint64_t generation = 0;
  bool operator==(const Stop&) const = default;
};
struct FullScreen {
  bool on = false;
  bool operator==(const FullScreen&) const = default;
};
struct ShowVideo {
  int32_t x = 0, y = 0;
  bool operator==(const ShowVideo&) const = default;
};
struct HideVideo {
  bool operator==(const HideVideo&) const = default;
};
struct Ping {
  uint64_t serial = 0;
  bool operator==(const Ping&) const = default;
};
struct Quit {
  bool operator==(const Quit&) const = default;
};

// The media process to the player.
struct Hello {
  int32_t version = 0;
  int64_t processId = 0;
  bool operator==(const Hello&) const = default;
};
struct Pong {
  uint64_t serial = 0;
  bool operator==(const Pong&) const = default;
};
struct State {
  uint64_t generation = 0;
  int32_t state = 0;
  bool operator==(const State&) const = default;
};
struct MediaType {
  uint64_t generation = 0;
  std::string type;
  bool operator==(const MediaType&) const = default;
};
// The position clock (MediaClock::Snapshot); `atNs` is CLOCK_MONOTONIC in
// nanoseconds.
struct Clock {
  uint64_t generation = 0;
  double position = 0;
  int64_t atNs = 0;
  double end = 0;
  bool running = false;
  bool operator==(const Clock&) const = default;
};
struct QueuedError {
  std::string description;
  bool operator==(const QueuedError&) const = default;
};
// The media error event; `state` is the play state when it was raised.
struct MediaError {
  uint64_t generation = 0;
  int32_t state = 0;
  bool operator==(const MediaError&) const = default;
};
struct Log {
  int32_t level = 0;
  std::string text;
  bool operator==(const Log&) const = default;
};
// The media process cannot play anything and ends.
struct Failed {
  std::string description;
  bool operator==(const Failed&) const = default;
};

}  // namespace media

using MediaMessage =
    std::variant<media::Outputs, media::Open, media::Stop, media::FullScreen, media::ShowVideo,
                 media::HideVideo, media::Ping, media::Quit, media::Hello, media::Pong,
                 media::State, media::MediaType, media::Clock, media::QueuedError,
                 media::MediaError, media::Log, media::Failed>;

// The line of `message`, newline included. Doubles are written so that they
// read back exactly; they must be finite.
std::string EncodeMediaMessage(const MediaMessage& message);
// Reads one line (without its newline). Fails with Error 5 and the reason
// when it is not a message this protocol writes.
MediaMessage DecodeMediaLine(std::string_view line);
// The message's word ("open", "clock", ...), for log lines.
const char* MediaMessageName(const MediaMessage& message);

enum class MediaLineStatus { kLine, kIncomplete, kTooLong };

// Splits a byte stream into lines. A line longer than kMaxMediaLine is
// refused as soon as it is known to be one, before it is buffered whole, and
// the refusal sticks.
class MediaLineReader {
 public:
  void Append(std::string_view bytes);
  MediaLineStatus Next(std::string& line);

 private:
  std::string m_buffer;
  size_t m_offset = 0;
  size_t m_scanned = 0;  // bytes after m_offset known to hold no newline
  bool m_tooLong = false;
};

}  // namespace tav
