#pragma once
// The text list format in which every stored record is written: a
// parenthesised, comma-separated list of fields, where a field is an escaped
// value or a nested list. These functions decide only the syntax; record
// readers and writers decide what each field means.
//
// Note the deliberate asymmetry: "()" reads back as one empty field, so record
// writers write an empty collection as an empty field, not as "()".

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "support/DateTime.h"

namespace tav {

// An array indexed from a chosen lower bound, as list readers return it. A
// default-constructed array has never been sized: it has no bounds at all,
// and asking for them fails with the subscript error (9).
class TextArray {
 public:
  TextArray() = default;
  TextArray(int32_t lowerBound, std::vector<std::string> items);

  bool IsSized() const { return m_sized; }
  int32_t LBound() const;
  int32_t UBound() const;
  // Fails with the subscript error (9) outside LBound..UBound.
  const std::string& operator[](int32_t index) const;
  std::string& operator[](int32_t index);

  const std::vector<std::string>& Items() const { return m_items; }

 private:
  bool m_sized = false;
  int32_t m_lower = 0;
  std::vector<std::string> m_items;
};

// Number of elements (upper minus lower bound plus one); 0 when never sized.
int32_t ArrayCount(const TextArray& array);

// Splits a list text into its raw fields (still escaped; nested lists with
// their parentheses), indexed from lowerBound. A text with no parenthesis at
// all is no list and gives a never-sized array. Malformed lists fail with
// errors 1 to 4 from "Serialize.ListFromText". Linear in the text's length.
TextArray ListFromText(std::string_view text, int32_t lowerBound);

// Joins already-encoded fields: "(" fields separated by "," ")"; "()" when
// there are none.
std::string ListToText(const std::vector<std::string>& fields);
std::string ListToText(const TextArray& fields);

// "*" -> "*E", "(" -> "*O", ")" -> "*C", "," -> "*S"; UnescapeText reverses
// that in the opposite order, so the pair is exact for every input.
std::string EscapeText(std::string_view text);
std::string UnescapeText(std::string_view field);

// "yyyy-mm-dd hh:mm:ss". DateFromText accepts what the platform's date
// conversion accepts and fails with the type-mismatch error (13) otherwise.
std::string DateToText(DateTime value);
DateTime DateFromText(std::string_view field);

// " 5", " 0", "-12". LongFromText rounds down and fails with 13 for a field
// that is no number and with 6 outside 32 bits.
std::string LongToText(int32_t value);
int32_t LongFromText(std::string_view field);

// "T" / "F". True exactly when the unescaped field, upper-cased, is "T".
std::string BoolToText(bool value);
bool BoolFromText(std::string_view field);

}  // namespace tav
