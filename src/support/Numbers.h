#pragma once
// Number conventions that stored records and settings rely on: the lenient
// leading-number read, the strict number conversion, rounding halves to even,
// the sign blank of positive numbers and 16/32-bit overflow checks.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tav {

// Rounds to the nearest whole number; exact halves go to the even neighbour
// (2.5 -> 2, 3.5 -> 4, -2.5 -> -2).
double RoundHalfEven(double value);

// The leading decimal number of a text: leading blanks and tabs skipped, an
// optional sign, digits with an optional fraction and exponent. Anything after
// the number is ignored; a text without a number gives 0. Never fails.
double LeadingNumber(std::string_view text);

// Strict conversion: the whole text, apart from surrounding blanks, must be a
// decimal number. Returns nothing for anything else (the empty text included).
std::optional<double> ParseNumber(std::string_view text);

// Whole-number conversions that fail with the overflow error (6) outside the
// target range. Rounding is halves to even.
int32_t ToInt32(double value);
int16_t ToInt16(double value);

// The lenient "number-of" read: LeadingNumber, rounded halves to even, then
// checked to 32 bits.
int32_t NumberOf(std::string_view text);

// Decimal text with a leading blank reserved for the sign: " 5", " 0", "-12".
std::string SignedNumberText(int64_t value);

}  // namespace tav
