#include "support/Numbers.h"

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <limits>

#include "support/Error.h"

namespace tav {
namespace {

bool IsBlank(char c) {
  return c == ' ' || c == '\t';
}
bool IsDigit(char c) {
  return c >= '0' && c <= '9';
}

// Length of the decimal number at the start of text (sign, digits, fraction,
// exponent), or 0 when there is none.
size_t NumberPrefixLength(std::string_view text) {
  size_t i = 0;
  if (i < text.size() && (text[i] == '+' || text[i] == '-')) ++i;
  size_t digits = 0;
  while (i < text.size() && IsDigit(text[i])) ++i, ++digits;
  if (i < text.size() && text[i] == '.') {
    ++i;
    while (i < text.size() && IsDigit(text[i])) ++i, ++digits;
  }
  if (digits == 0) return 0;
  if (i < text.size() && (text[i] == 'e' || text[i] == 'E' || text[i] == 'd' || text[i] == 'D')) {
    size_t j = i + 1;
    if (j < text.size() && (text[j] == '+' || text[j] == '-')) ++j;
    size_t expDigits = 0;
    while (j < text.size() && IsDigit(text[j])) ++j, ++expDigits;
    if (expDigits > 0) i = j;
  }
  return i;
}

double ConvertPrefix(std::string_view number) {
  std::string copy(number);
  for (char& c : copy) {
    if (c == 'd' || c == 'D') c = 'e';
  }
  return std::strtod(copy.c_str(), nullptr);
}

}  // namespace

double RoundHalfEven(double value) {
  if (!std::isfinite(value)) return value;
  double floor = std::floor(value);
  double diff = value - floor;
  if (diff < 0.5) return floor;
  if (diff > 0.5) return floor + 1.0;
  return std::fmod(floor, 2.0) == 0.0 ? floor : floor + 1.0;
}

double LeadingNumber(std::string_view text) {
  size_t start = 0;
  while (start < text.size() && IsBlank(text[start])) ++start;
  std::string_view rest = text.substr(start);
  size_t length = NumberPrefixLength(rest);
  if (length == 0) return 0.0;
  return ConvertPrefix(rest.substr(0, length));
}

std::optional<double> ParseNumber(std::string_view text) {
  size_t start = 0;
  while (start < text.size() && IsBlank(text[start])) ++start;
  size_t end = text.size();
  while (end > start && IsBlank(text[end - 1])) --end;
  std::string_view body = text.substr(start, end - start);
  if (body.empty()) return std::nullopt;
  size_t length = NumberPrefixLength(body);
  if (length != body.size()) return std::nullopt;
  double value = ConvertPrefix(body);
  if (!std::isfinite(value)) return std::nullopt;
  return value;
}

int32_t ToInt32(double value) {
  double rounded = RoundHalfEven(value);
  if (!(rounded >= std::numeric_limits<int32_t>::min() &&
        rounded <= std::numeric_limits<int32_t>::max())) {
    throw errors::Overflow();
  }
  return static_cast<int32_t>(rounded);
}

int16_t ToInt16(double value) {
  double rounded = RoundHalfEven(value);
  if (!(rounded >= std::numeric_limits<int16_t>::min() &&
        rounded <= std::numeric_limits<int16_t>::max())) {
    throw errors::Overflow();
  }
  return static_cast<int16_t>(rounded);
}

int32_t NumberOf(std::string_view text) {
  return ToInt32(LeadingNumber(text));
}

std::string SignedNumberText(int64_t value) {
  // Formatted in one go: GCC 12 at -O3 wrongly warns about `" " + text`.
  char buffer[24];
  int length = std::snprintf(buffer, sizeof buffer, value < 0 ? "%lld" : " %lld",
                             static_cast<long long>(value));
  return std::string(buffer, static_cast<size_t>(length));
}

}  // namespace tav
