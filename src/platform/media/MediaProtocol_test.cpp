#include "platform/media/MediaProtocol.h"

#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "support/Error.h"

namespace tav {
namespace {

using namespace std::string_literals;

struct Golden {
  MediaMessage message;
  std::string line;
};

// Every message, as docs/media-process.md writes it.
const std::vector<Golden>& Goldens() {
  static const std::vector<Golden> goldens = {
      {media::Outputs{"pulse", "my card%", ""}, "outputs pulse my%20card%25 \n"},
      {media::Outputs{"", "", "null"}, "outputs   null\n"},
      {media::Open{7, "/music/Jingle Bells\n.mp3"}, "open 7 /music/Jingle%20Bells%0A.mp3\n"},
      {media::Open{18446744073709551615u, "/m/caf\xc3\xa9\t\x7f.ogg"},
       "open 18446744073709551615 /m/caf\xc3\xa9%09%7F.ogg\n"},
      {media::Stop{8}, "stop 8\n"},
      {media::FullScreen{true}, "fullscreen 1\n"},
      {media::FullScreen{false}, "fullscreen 0\n"},
      {media::ShowVideo{-1920, 2147483647}, "show -1920 2147483647\n"},
      {media::HideVideo{}, "hide\n"},
      {media::Ping{42}, "ping 42\n"},
      {media::Quit{}, "quit\n"},
      {media::Hello{1, 4242}, "hello 1 4242\n"},
      {media::Pong{42}, "pong 42\n"},
      {media::State{7, 9}, "state 7 9\n"},
      {media::MediaType{7, "audio"}, "media 7 audio\n"},
      {media::MediaType{7, ""}, "media 7 \n"},
      {media::Clock{7, 12.5, 123456789012345, 180.25, true},
       "clock 7 12.5 123456789012345 180.25 1\n"},
      {media::Clock{7, 0.1, 0, 0, false}, "clock 7 0.1 0 0 0\n"},
      {media::Clock{7, 1.0 / 3, -5, 1e-300, true}, "clock 7 0.3333333333333333 -5 1e-300 1\n"},
      {media::QueuedError{"Cannot play \"a b.wav\": file not found"},
       "error Cannot%20play%20\"a%20b.wav\":%20file%20not%20found\n"},
      {media::MediaError{7, 1}, "mediaerror 7 1\n"},
      {media::Log{2, "Media: no display"}, "log 2 Media:%20no%20display\n"},
      {media::Log{-1, "\r\n"}, "log -1 %0D%0A\n"},
      {media::Failed{"mpv: unsupported"}, "failed mpv:%20unsupported\n"},
  };
  return goldens;
}

TEST(MediaProtocol, EveryMessageIsWrittenAsTheDocumentShowsAndReadsBack) {
  for (const auto& golden : Goldens()) {
    SCOPED_TRACE(golden.line);
    EXPECT_EQ(EncodeMediaMessage(golden.message), golden.line);
    std::string_view line(golden.line);
    line.remove_suffix(1);
    EXPECT_EQ(DecodeMediaLine(line), golden.message);
  }
}

TEST(MediaProtocol, ReadingAcceptsOtherwiseWrittenNumbersAndEscapes) {
  EXPECT_EQ(DecodeMediaLine("clock 07 1.50 12 2e1 0"),
            (MediaMessage{media::Clock{7, 1.5, 12, 20, false}}));
  EXPECT_EQ(DecodeMediaLine("media 3 %61udio"), (MediaMessage{media::MediaType{3, "audio"}}));
  EXPECT_EQ(DecodeMediaLine("log 1 %e2%82%ac"), (MediaMessage{media::Log{1, "\xe2\x82\xac"}}));
}

TEST(MediaProtocol, ALineThatIsNotAMessageIsRefusedWithTheReason) {
  struct Case {
    std::string line;
    std::string reason;
  };
  const Case cases[] = {
      {"", "unknown message \"\""},
      {"play 1 /a", "unknown message \"play\""},
      {"Open 1 /a", "unknown message \"Open\""},
      {"\x01\xff" + std::string(40, 'x'), "unknown message \"%01\xffxxxxxxxxxxxxxxxxxxxxxx...\""},
      {"open", "\"open\" with too few fields"},
      {"open 1", "\"open\" with too few fields"},
      {"open 1 /a b", "\"open\" with too many fields"},
      {"hide ", "\"hide\" with too many fields"},
      {"state 1  3", "\"state\" with a bad number \"\""},
      {"open x /a", "\"open\" with a bad number \"x\""},
      {"open -1 /a", "\"open\" with a bad number \"-1\""},
      {"ping +1", "\"ping\" with a bad number \"+1\""},
      {"ping 18446744073709551616", "\"ping\" with a bad number \"18446744073709551616\""},
      {"show 0 2147483648", "\"show\" with a bad number \"2147483648\""},
      {"state 1 3.0", "\"state\" with a bad number \"3.0\""},
      {"clock 1 nan 0 0 1", "\"clock\" with a bad number \"nan\""},
      {"clock 1 1 0 inf 1", "\"clock\" with a bad number \"inf\""},
      {"clock 1 1e999 0 0 1", "\"clock\" with a bad number \"1e999\""},
      {"clock 1 0x10 0 0 1", "\"clock\" with a bad number \"0x10\""},
      {"fullscreen 2", "\"fullscreen\" with a flag that is not 0 or 1: \"2\""},
      {"fullscreen", "\"fullscreen\" with too few fields"},
      {"media 1 a%2", "\"media\" with a bad escape"},
      {"media 1 a%G0", "\"media\" with a bad escape"},
      {"log 1 tab\there", "\"log\" with an unescaped control byte"},
      {"log 1 cr\r", "\"log\" with an unescaped control byte"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.line);
    try {
      DecodeMediaLine(c.line);
      ADD_FAILURE() << "accepted";
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), errors::kInvalidProcedureCall);
      EXPECT_EQ(e.Description(), c.reason);
    }
  }
}

TEST(MediaProtocol, ANumberThatIsNotFiniteIsNeverWritten) {
  EXPECT_THROW(EncodeMediaMessage(media::Clock{1, std::nan(""), 0, 0, true}), Error);
}

// Feeds `stream` in pieces of `step` bytes; the lines up to the first
// refusal, and the last status.
std::vector<std::string> ReadLines(const std::string& stream, size_t step,
                                   MediaLineStatus* last = nullptr) {
  MediaLineReader reader;
  std::vector<std::string> lines;
  MediaLineStatus status = MediaLineStatus::kIncomplete;
  for (size_t at = 0; at < stream.size() && status != MediaLineStatus::kTooLong; at += step) {
    reader.Append(std::string_view(stream).substr(at, step));
    std::string line;
    while ((status = reader.Next(line)) == MediaLineStatus::kLine) lines.push_back(line);
  }
  if (last) *last = status;
  return lines;
}

TEST(MediaLineReader, LinesComeOutWhateverPiecesTheStreamArrivesIn) {
  std::string longest(kMaxMediaLine, 'x');
  std::vector<std::string> sent = {"hello 1 7", "", "state 1 9", longest, "pong 3"};
  std::string stream;
  for (const auto& line : sent) stream += line + "\n";
  stream += "clock 1 0";  // not yet complete
  for (size_t step : {size_t{1}, size_t{7}, size_t{4096}, stream.size()}) {
    MediaLineStatus last;
    EXPECT_EQ(ReadLines(stream, step, &last), sent) << "step " << step;
    EXPECT_EQ(last, MediaLineStatus::kIncomplete);
  }
}

TEST(MediaLineReader, AnOverlongLineIsRefusedBeforeItEndsAndTheRefusalSticks) {
  std::string stream = "pong 1\n" + std::string(kMaxMediaLine + 1, 'x');
  MediaLineStatus last;
  EXPECT_EQ(ReadLines(stream, 1000, &last), std::vector<std::string>{"pong 1"});
  EXPECT_EQ(last, MediaLineStatus::kTooLong);

  MediaLineReader reader;
  reader.Append(std::string(kMaxMediaLine + 1, 'y') + "\npong 2\n");
  std::string line;
  EXPECT_EQ(reader.Next(line), MediaLineStatus::kTooLong);
  reader.Append("pong 3\n");
  EXPECT_EQ(reader.Next(line), MediaLineStatus::kTooLong);
}

}  // namespace
}  // namespace tav
