#include "platform/media/MediaProtocol.h"

#include <charconv>
#include <cmath>
#include <tuple>
#include <type_traits>

#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kSource = "MediaProtocol";

// Each message's word and fields, in line order. One description serves
// both directions: Fields hands out references (const ones when encoding).
template <typename T>
struct Spec;

#define TAV_MEDIA_SPEC(Type, word, ...)                                            \
  template <>                                                                      \
  struct Spec<media::Type> {                                                       \
    static constexpr const char* kWord = word;                                     \
    static auto Fields([[maybe_unused]] auto& m) { return std::tie(__VA_ARGS__); } \
  }

TAV_MEDIA_SPEC(Outputs, "outputs", m.audioOutput, m.audioDevice, m.videoOutput);
TAV_MEDIA_SPEC(Open, "open", m.generation, m.path);
TAV_MEDIA_SPEC(Stop, "stop", m.generation);
TAV_MEDIA_SPEC(FullScreen, "fullscreen", m.on);
TAV_MEDIA_SPEC(ShowVideo, "show", m.x, m.y);
TAV_MEDIA_SPEC(HideVideo, "hide");
TAV_MEDIA_SPEC(Ping, "ping", m.serial);
TAV_MEDIA_SPEC(Quit, "quit");
TAV_MEDIA_SPEC(Hello, "hello", m.version, m.processId);
TAV_MEDIA_SPEC(Pong, "pong", m.serial);
TAV_MEDIA_SPEC(State, "state", m.generation, m.state);
TAV_MEDIA_SPEC(MediaType, "media", m.generation, m.type);
TAV_MEDIA_SPEC(Clock, "clock", m.generation, m.position, m.atNs, m.end, m.running);
TAV_MEDIA_SPEC(QueuedError, "error", m.description);
TAV_MEDIA_SPEC(MediaError, "mediaerror", m.generation, m.state);
TAV_MEDIA_SPEC(Log, "log", m.level, m.text);
TAV_MEDIA_SPEC(Failed, "failed", m.description);

#undef TAV_MEDIA_SPEC

Error Malformed(const std::string& reason) {
  return Error(errors::kInvalidProcedureCall, kSource, reason);
}

bool MustEscape(unsigned char c) {
  return c <= 0x20 || c == 0x7f || c == '%';
}

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  return -1;
}

void AppendEscaped(std::string& out, std::string_view text) {
  static constexpr char kDigits[] = "0123456789ABCDEF";
  for (char ch : text) {
    auto c = static_cast<unsigned char>(ch);
    if (MustEscape(c)) {
      out += '%';
      out += kDigits[c >> 4];
      out += kDigits[c & 15];
    } else {
      out += ch;
    }
  }
}

// A word or field as a log line may show it: short, and escaped.
std::string Shown(std::string_view text) {
  std::string out;
  AppendEscaped(out, text.substr(0, 24));
  if (text.size() > 24) out += "...";
  return out;
}

class LineWriter {
 public:
  explicit LineWriter(const char* word) : m_line(word) {}

  void operator()(const std::string& text) {
    m_line += ' ';
    AppendEscaped(m_line, text);
  }
  void operator()(bool flag) { m_line += flag ? " 1" : " 0"; }
  template <typename Number>
  requires std::is_arithmetic_v<Number>
  void operator()(Number value) {
    if constexpr (std::is_floating_point_v<Number>) {
      if (!std::isfinite(value)) throw Malformed("a number that is not finite cannot be sent");
    }
    char digits[32];
    auto result = std::to_chars(digits, digits + sizeof digits, value);
    m_line += ' ';
    m_line.append(digits, result.ptr);
  }

  std::string Finish() {
    m_line += '\n';
    return std::move(m_line);
  }

 private:
  std::string m_line;
};

class LineReader {
 public:
  // `hasFields`: the word was followed by a space (so "hide " has one
  // field, an empty one, and "hide" none).
  LineReader(std::string_view word, std::string_view fields, bool hasFields)
      : m_word(word), m_rest(fields), m_more(hasFields) {}

  void operator()(std::string& text) {
    std::string_view field = Take();
    text.clear();
    for (size_t i = 0; i < field.size(); ++i) {
      auto c = static_cast<unsigned char>(field[i]);
      if (c < 0x20 || c == 0x7f) Fail("an unescaped control byte");
      if (c != '%') {
        text += field[i];
        continue;
      }
      if (i + 2 >= field.size()) Fail("a bad escape");
      int high = HexValue(field[i + 1]);
      int low = HexValue(field[i + 2]);
      if (high < 0 || low < 0) Fail("a bad escape");
      text += static_cast<char>(high * 16 + low);
      i += 2;
    }
  }
  void operator()(bool& flag) {
    std::string_view field = Take();
    if (field != "0" && field != "1") Fail("a flag that is not 0 or 1: \"" + Shown(field) + "\"");
    flag = field == "1";
  }
  template <typename Number>
  requires std::is_arithmetic_v<Number>
  void operator()(Number& value) {
    std::string_view field = Take();
    auto result = std::from_chars(field.data(), field.data() + field.size(), value);
    bool bad = result.ec != std::errc() || result.ptr != field.data() + field.size();
    if constexpr (std::is_floating_point_v<Number>) bad = bad || !std::isfinite(value);
    if (bad) Fail("a bad number \"" + Shown(field) + "\"");
  }

  void Finish() {
    if (m_more) Fail("too many fields");
  }

 private:
  std::string_view Take() {
    if (!m_more) Fail("too few fields");
    size_t space = m_rest.find(' ');
    std::string_view field = m_rest.substr(0, space);
    if (space == std::string_view::npos) {
      m_more = false;
      m_rest = {};
    } else {
      m_rest.remove_prefix(space + 1);
    }
    return field;
  }
  [[noreturn]] void Fail(const std::string& what) const {
    throw Malformed("\"" + std::string(m_word) + "\" with " + what);
  }

  std::string_view m_word;
  std::string_view m_rest;
  bool m_more;
};

template <size_t I = 0>
MediaMessage DecodeAs(std::string_view word, std::string_view fields, bool hasFields) {
  if constexpr (I == std::variant_size_v<MediaMessage>) {
    throw Malformed("unknown message \"" + Shown(word) + "\"");
  } else {
    using Type = std::variant_alternative_t<I, MediaMessage>;
    if (word != Spec<Type>::kWord) return DecodeAs<I + 1>(word, fields, hasFields);
    Type message;
    LineReader reader(word, fields, hasFields);
    std::apply([&reader](auto&... field) { (reader(field), ...); }, Spec<Type>::Fields(message));
    reader.Finish();
    return message;
  }
}

}  // namespace

std::string EncodeMediaMessage(const MediaMessage& message) {
  return std::visit(
      [](const auto& m) {
        LineWriter writer(Spec<std::decay_t<decltype(m)>>::kWord);
        std::apply([&writer](const auto&... field) { (writer(field), ...); },
                   Spec<std::decay_t<decltype(m)>>::Fields(m));
        return writer.Finish();
      },
      message);
}

MediaMessage DecodeMediaLine(std::string_view line) {
  size_t space = line.find(' ');
  if (space == std::string_view::npos) return DecodeAs(line, {}, false);
  return DecodeAs(line.substr(0, space), line.substr(space + 1), true);
}

const char* MediaMessageName(const MediaMessage& message) {
  return std::visit([](const auto& m) { return Spec<std::decay_t<decltype(m)>>::kWord; }, message);
}

void MediaLineReader::Append(std::string_view bytes) {
  if (m_tooLong) return;
  if (m_offset > 0 && m_offset >= m_buffer.size() / 2) {
    m_buffer.erase(0, m_offset);
    m_offset = 0;
  }
  m_buffer.append(bytes);
}

MediaLineStatus MediaLineReader::Next(std::string& line) {
  if (m_tooLong) return MediaLineStatus::kTooLong;
  size_t newline = m_buffer.find('\n', m_offset + m_scanned);
  size_t length = (newline == std::string::npos ? m_buffer.size() : newline) - m_offset;
  if (length > kMaxMediaLine) {
    m_tooLong = true;
    m_buffer.clear();
    m_offset = m_scanned = 0;
    return MediaLineStatus::kTooLong;
  }
  if (newline == std::string::npos) {
    m_scanned = length;
    return MediaLineStatus::kIncomplete;
  }
  line.assign(m_buffer, m_offset, length);
  m_offset = newline + 1;
  m_scanned = 0;
  return MediaLineStatus::kLine;
}

}  // namespace tav
