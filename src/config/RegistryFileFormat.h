#pragma once
// The registry export text format, read and written without touching a file:
//
//   Windows Registry Editor Version 5.00
//
//   [HKEY_CURRENT_USER\Software\Tessavar\Shared\VideoPreferences]
//   "MonitorX"=dword:00000000
//   "Folder"="C:\\Shows\\"
//   "Blob"=hex:01,02,ff
//
// Reading accepts what the platform's editor writes: version 5.00 files in
// UTF-16LE with a byte-order mark, version 4 ("REGEDIT4") files in 8-bit
// text, UTF-8 with or without a mark, hex data continued over several lines,
// "hex(n):" data of any type, and the deletion forms [-key] and "Name"=-.
// Typed hex data of the text types is UTF-16LE in version 5.00 files and
// 8-bit in version 4 files, as Windows writes them. A line that cannot be
// read is reported (with its line number) and the rest is read as usual.
//
// The player's own settings file is UTF-8 with the version 5.00 header; an
// export for a Windows machine is UTF-16LE with a mark and CRLF line ends.

#include <string>
#include <string_view>
#include <vector>

#include "config/RegistryDocument.h"

namespace tav {

inline constexpr std::string_view kRegistryHeader5 = "Windows Registry Editor Version 5.00";
inline constexpr std::string_view kRegistryHeader4 = "REGEDIT4";

struct RegistryFileLine {
  enum class Kind { Key, DeleteKey, Value, DeleteValue, Comment, Unreadable };
  Kind kind = Kind::Unreadable;
  int lineNumber = 0;  // first physical line, from 1
  std::string key;     // full path, hive first; empty before the first key
  std::string name;    // value name ("" for the default value "@")
  RegistryValue value;
  std::string text;  // the line as written (continuations joined by "\n")
};

struct RegistryFile {
  enum class Version { None, V4, V5 };
  Version version = Version::None;
  std::vector<RegistryFileLine> lines;
  // "line N: reason: text", one per line that could not be read, and one for
  // a missing header.
  std::vector<std::string> problems;
};

RegistryFile ParseRegistryFile(std::string_view bytes);

// Applies the file to a document in order, as an import does. With
// `keepVerbatim`, comments and unreadable lines are kept in place (the
// program's own file); without, they are left out (importing another file).
void ApplyRegistryFile(const RegistryFile& file, RegistryDocument& document, bool keepVerbatim);

enum class RegistryFileEncoding { Utf8, Utf16WithMark };
std::string FormatRegistryFile(const RegistryDocument& document,
                               RegistryFileEncoding encoding = RegistryFileEncoding::Utf8);

// One value as a line (without line end), e.g. "Name"=dword:0000000a.
std::string FormatRegistryValueLine(std::string_view name, const RegistryValue& value);

}  // namespace tav
