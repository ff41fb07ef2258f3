#pragma once
// Conversions between the text encodings that registry export files come
// in and the UTF-8 the program works in: UTF-16LE (Windows' version 5.00
// exports) and the 8-bit Windows code page 1252 (version 4 exports). Pure
// functions; malformed input is replaced, never refused, so a damaged
// character cannot make a whole file unreadable.

#include <string>
#include <string_view>

namespace tav {

bool IsValidUtf8(std::string_view text);
// Code page 1252 to UTF-8 (the five unassigned bytes map to U+FFFD).
std::string Cp1252ToUtf8(std::string_view text);
// UTF-16LE bytes to UTF-8; unpaired surrogates and an odd last byte become
// U+FFFD.
std::string Utf16LeToUtf8(std::string_view bytes);
// UTF-8 to UTF-16LE bytes; invalid sequences become U+FFFD.
std::string Utf8ToUtf16Le(std::string_view text);

}  // namespace tav
