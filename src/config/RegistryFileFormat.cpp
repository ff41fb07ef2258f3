#include "config/RegistryFileFormat.h"

#include <fmt/format.h>

#include <optional>

#include "config/TextEncoding.h"

namespace tav {

namespace {

using Kind = RegistryFileLine::Kind;

std::string DecodeFileBytes(std::string_view bytes) {
  if (bytes.size() >= 2 && bytes[0] == '\xFF' && bytes[1] == '\xFE') {
    return Utf16LeToUtf8(bytes.substr(2));
  }
  if (bytes.size() >= 3 && bytes.substr(0, 3) == "\xEF\xBB\xBF") bytes.remove_prefix(3);
  if (IsValidUtf8(bytes)) return std::string(bytes);
  return Cp1252ToUtf8(bytes);
}

std::vector<std::string_view> SplitLines(std::string_view text) {
  std::vector<std::string_view> lines;
  size_t pos = 0;
  while (pos <= text.size()) {
    size_t end = text.find('\n', pos);
    if (end == std::string_view::npos) end = text.size();
    std::string_view line = text.substr(pos, end - pos);
    while (!line.empty() && (line.back() == '\r' || line.back() == ' ' || line.back() == '\t')) {
      line.remove_suffix(1);
    }
    lines.push_back(line);
    if (end == text.size()) break;
    pos = end + 1;
  }
  return lines;
}

std::string_view TrimLeft(std::string_view text) {
  while (!text.empty() && (text.front() == ' ' || text.front() == '\t')) text.remove_prefix(1);
  return text;
}

// Reads a quoted text with \\ and \" escapes starting at text[pos] == '"';
// leaves pos after the closing quote.
std::optional<std::string> ReadQuoted(std::string_view text, size_t& pos) {
  if (pos >= text.size() || text[pos] != '"') return std::nullopt;
  std::string out;
  for (++pos; pos < text.size(); ++pos) {
    char c = text[pos];
    if (c == '"') {
      ++pos;
      return out;
    }
    if (c == '\\' && pos + 1 < text.size() && (text[pos + 1] == '\\' || text[pos + 1] == '"')) {
      ++pos;
      c = text[pos];
    }
    out += c;
  }
  return std::nullopt;
}

int HexDigit(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

std::optional<uint32_t> ReadHexNumber(std::string_view text, size_t maxDigits) {
  if (text.empty() || text.size() > maxDigits) return std::nullopt;
  uint32_t number = 0;
  for (char c : text) {
    int digit = HexDigit(c);
    if (digit < 0) return std::nullopt;
    number = number * 16 + static_cast<uint32_t>(digit);
  }
  return number;
}

std::optional<std::string> ReadHexBytes(std::string_view text) {
  std::string bytes;
  size_t pos = 0;
  while (true) {
    while (pos < text.size() && (text[pos] == ' ' || text[pos] == '\t')) ++pos;
    if (pos == text.size()) return bytes;  // "hex:" alone, or a trailing comma
    size_t end = text.find(',', pos);
    if (end == std::string_view::npos) end = text.size();
    std::string_view token = text.substr(pos, end - pos);
    while (!token.empty() && (token.back() == ' ' || token.back() == '\t')) token.remove_suffix(1);
    auto byte = ReadHexNumber(token, 2);
    if (!byte) return std::nullopt;
    bytes += static_cast<char>(*byte);
    if (end == text.size()) return bytes;
    pos = end + 1;
  }
}

bool IsTextType(uint32_t type) {
  return type == kRegSz || type == kRegExpandSz || type == kRegMultiSz;
}

// Typed hex data of a text type, as stored in a file of the given version,
// to the program's UTF-8 without terminators.
std::string TextFromFileBytes(const std::string& bytes, RegistryFile::Version version) {
  std::string text = version == RegistryFile::Version::V4
                         ? (IsValidUtf8(bytes) ? bytes : Cp1252ToUtf8(bytes))
                         : Utf16LeToUtf8(bytes);
  while (!text.empty() && text.back() == '\0') text.pop_back();
  return text;
}

std::string TextToFileBytes(const RegistryValue& value) {
  std::string text = value.data;
  text += '\0';
  if (value.type == kRegMultiSz && !value.data.empty()) text += '\0';
  return Utf8ToUtf16Le(text);
}

// Parses the data after "=" of a value line; the reason when it cannot.
std::optional<RegistryValue> ReadValueData(std::string_view data, RegistryFile::Version version,
                                           std::string& reason) {
  if (!data.empty() && data.front() == '"') {
    size_t pos = 0;
    auto text = ReadQuoted(data, pos);
    if (!text || !TrimLeft(data.substr(pos)).empty()) {
      reason = "unreadable string";
      return std::nullopt;
    }
    return RegistryValue::String(std::move(*text));
  }
  if (data.starts_with("dword:")) {
    auto number = ReadHexNumber(data.substr(6), 8);
    if (!number) {
      reason = "unreadable dword";
      return std::nullopt;
    }
    return RegistryValue::Dword(*number);
  }
  if (data.starts_with("hex")) {
    uint32_t type = kRegBinary;
    size_t colon = data.find(':');
    std::string_view typeText = data.substr(3, colon == std::string_view::npos ? 0 : colon - 3);
    if (colon == std::string_view::npos) {
      reason = "unreadable hex data";
      return std::nullopt;
    }
    if (!typeText.empty()) {
      auto number = typeText.size() > 2 && typeText.front() == '(' && typeText.back() == ')'
                        ? ReadHexNumber(typeText.substr(1, typeText.size() - 2), 8)
                        : std::nullopt;
      if (!number) {
        reason = "unreadable hex type";
        return std::nullopt;
      }
      type = *number;
    }
    auto bytes = ReadHexBytes(data.substr(colon + 1));
    if (!bytes) {
      reason = "unreadable hex data";
      return std::nullopt;
    }
    if (IsTextType(type)) return RegistryValue{type, TextFromFileBytes(*bytes, version)};
    return RegistryValue{type, std::move(*bytes)};
  }
  reason = "unknown value data";
  return std::nullopt;
}

std::string EscapeQuoted(std::string_view text) {
  std::string out = "\"";
  for (char c : text) {
    if (c == '\\' || c == '"') out += '\\';
    out += c;
  }
  out += '"';
  return out;
}

std::string FormatHex(std::string prefix, std::string_view bytes) {
  // Wrapped as the platform's editor wraps it, so files diff cleanly.
  std::string out = std::move(prefix);
  size_t lineStart = 0;
  for (size_t i = 0; i < bytes.size(); ++i) {
    std::string token = fmt::format("{:02x}", static_cast<unsigned char>(bytes[i]));
    bool last = i + 1 == bytes.size();
    if (!last) token += ',';
    // At most 80 characters a line, counting the continuation backslash.
    if (out.size() - lineStart + token.size() + (last ? 0 : 1) > 80) {
      out += "\\\n  ";
      lineStart = out.size() - 2;
    }
    out += token;
  }
  return out;
}

}  // namespace

RegistryFile ParseRegistryFile(std::string_view bytes) {
  RegistryFile file;
  std::string text = DecodeFileBytes(bytes);
  std::vector<std::string_view> lines = SplitLines(text);
  std::string key;
  bool headerSeen = false;

  for (size_t i = 0; i < lines.size(); ++i) {
    std::string_view line = lines[i];
    const int lineNumber = static_cast<int>(i) + 1;
    if (TrimLeft(line).empty()) continue;
    if (!headerSeen) {
      headerSeen = true;
      if (line == kRegistryHeader5) {
        file.version = RegistryFile::Version::V5;
        continue;
      }
      if (line == kRegistryHeader4) {
        file.version = RegistryFile::Version::V4;
        continue;
      }
      file.problems.push_back(
          fmt::format("line {}: no registry editor header: {}", lineNumber, line));
    }

    RegistryFileLine entry;
    entry.lineNumber = lineNumber;
    entry.key = key;
    entry.text = std::string(line);
    auto unreadable = [&](std::string_view reason) {
      entry.kind = Kind::Unreadable;
      file.problems.push_back(fmt::format("line {}: {}: {}", lineNumber, reason, entry.text));
      file.lines.push_back(entry);
    };

    std::string_view trimmed = TrimLeft(line);
    if (trimmed.front() == ';') {
      entry.kind = Kind::Comment;
      file.lines.push_back(entry);
      continue;
    }
    if (trimmed.front() == '[') {
      if (trimmed.back() != ']' || trimmed.size() < 3) {
        unreadable("unreadable key line");
        continue;
      }
      std::string_view path = trimmed.substr(1, trimmed.size() - 2);
      bool deletion = path.front() == '-';
      if (deletion) path.remove_prefix(1);
      if (path.empty() || path.front() == '\\' || path.back() == '\\') {
        unreadable("unreadable key line");
        continue;
      }
      entry.kind = deletion ? Kind::DeleteKey : Kind::Key;
      entry.key = std::string(path);
      // Values after a deleted key belong nowhere until the next key.
      key = deletion ? std::string() : entry.key;
      file.lines.push_back(entry);
      continue;
    }
    if (trimmed.front() != '"' && trimmed.front() != '@') {
      unreadable("not a key or value line");
      continue;
    }

    size_t pos = 0;
    std::string name;
    if (trimmed.front() == '@') {
      pos = 1;
    } else {
      auto quoted = ReadQuoted(trimmed, pos);
      if (!quoted) {
        unreadable("unreadable value name");
        continue;
      }
      name = std::move(*quoted);
    }
    std::string_view rest = TrimLeft(trimmed.substr(pos));
    if (rest.empty() || rest.front() != '=') {
      unreadable("missing \"=\"");
      continue;
    }
    std::string data(TrimLeft(rest.substr(1)));
    // Hex data continues on the next line after a trailing backslash.
    while (data.starts_with("hex") && !data.empty() && data.back() == '\\' &&
           i + 1 < lines.size()) {
      data.pop_back();
      ++i;
      data += TrimLeft(lines[i]);
      entry.text += '\n';
      entry.text += lines[i];
    }
    if (key.empty()) {
      unreadable("value outside any key");
      continue;
    }
    entry.name = std::move(name);
    if (data == "-") {
      entry.kind = Kind::DeleteValue;
      file.lines.push_back(entry);
      continue;
    }
    std::string reason;
    auto value = ReadValueData(data, file.version, reason);
    if (!value) {
      unreadable(reason);
      continue;
    }
    entry.kind = Kind::Value;
    entry.value = std::move(*value);
    file.lines.push_back(std::move(entry));
  }
  if (!headerSeen) file.problems.push_back("line 1: no registry editor header: (empty file)");
  return file;
}

void ApplyRegistryFile(const RegistryFile& file, RegistryDocument& document, bool keepVerbatim) {
  for (const auto& line : file.lines) {
    switch (line.kind) {
      case Kind::Key:
        document.EnsureSection(line.key, /*inFileOrder=*/true);
        break;
      case Kind::DeleteKey:
        document.RemoveKeyTree(line.key);
        break;
      case Kind::Value:
        document.SetValueAt(line.key, line.name, line.value);
        break;
      case Kind::DeleteValue:
        document.RemoveValueAt(line.key, line.name);
        break;
      case Kind::Comment:
      case Kind::Unreadable:
        if (!keepVerbatim) break;
        if (line.key.empty()) {
          document.Preamble().push_back(line.text);
        } else {
          document.AddVerbatimAt(line.key, line.text);
        }
        break;
    }
  }
}

std::string FormatRegistryValueLine(std::string_view name, const RegistryValue& value) {
  std::string out = name.empty() ? "@=" : EscapeQuoted(name) + "=";
  if (value.type == kRegSz &&
      value.data.find_first_of(std::string_view("\r\n\0", 3)) == std::string::npos) {
    return out + EscapeQuoted(value.data);
  }
  if (value.IsDword()) return out + fmt::format("dword:{:08x}", value.DwordValue());
  if (value.type == kRegBinary) return FormatHex(out + "hex:", value.data);
  std::string bytes = IsTextType(value.type) ? TextToFileBytes(value) : value.data;
  return FormatHex(out + fmt::format("hex({:x}):", value.type), bytes);
}

std::string FormatRegistryFile(const RegistryDocument& document, RegistryFileEncoding encoding) {
  std::string text(kRegistryHeader5);
  text += '\n';
  for (const auto& line : document.Preamble()) text += line + '\n';
  for (const auto& section : document.Sections()) {
    text += "\n[" + section.path + "]\n";
    for (const auto& entry : section.entries) {
      text += entry.verbatim.empty() ? FormatRegistryValueLine(entry.name, entry.value)
                                     : entry.verbatim;
      text += '\n';
    }
  }
  text += '\n';
  if (encoding == RegistryFileEncoding::Utf8) return text;
  std::string crlf;
  crlf.reserve(text.size() + text.size() / 16);
  for (char c : text) {
    if (c == '\n') crlf += '\r';
    crlf += c;
  }
  return "\xFF\xFE" + Utf8ToUtf16Le(crlf);
}

}  // namespace tav
