#include "ArgumentValues.h"

#include <fmt/format.h>

#include <cctype>
#include <optional>

#include "CommandRegistry.h"
#include "support/Numbers.h"

namespace tav::showctl {
namespace {

[[noreturn]] void Refuse(std::string_view what, const std::string& text, const char* expected) {
  std::string message = fmt::format("\"{}\" is not {}", text, expected);
  throw CommandFailed(what.empty() ? message : fmt::format("{}: {}", what, message));
}

}  // namespace

bool ParseBoolean(const std::string& text, std::string_view what) {
  std::string lower;
  for (char c : text) lower += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  if (lower == "true" || lower == "yes" || lower == "on" || lower == "1") return true;
  if (lower == "false" || lower == "no" || lower == "off" || lower == "0") return false;
  Refuse(what, text, "a boolean (true or false, on or off)");
}

int32_t ParseLong(const std::string& text, std::string_view what) {
  std::optional<double> number = ParseNumber(text);
  if (!number || *number != static_cast<double>(static_cast<int64_t>(*number)) ||
      *number < -2147483648.0 || *number > 2147483647.0) {
    Refuse(what, text, "a whole number of 32 bits");
  }
  return static_cast<int32_t>(*number);
}

}  // namespace tav::showctl
