#include "support/Serialize.h"

#include <cmath>
#include <limits>

#include "support/Error.h"
#include "support/Numbers.h"

namespace tav {

// ---- TextArray -------------------------------------------------------------

TextArray::TextArray(int32_t lowerBound, std::vector<std::string> items)
    : m_sized(true), m_lower(lowerBound), m_items(std::move(items)) {}

int32_t TextArray::LBound() const {
  if (!m_sized) throw errors::SubscriptOutOfRange();
  return m_lower;
}

int32_t TextArray::UBound() const {
  if (!m_sized) throw errors::SubscriptOutOfRange();
  return m_lower + static_cast<int32_t>(m_items.size()) - 1;
}

const std::string& TextArray::operator[](int32_t index) const {
  if (!m_sized || index < m_lower ||
      static_cast<int64_t>(index) - m_lower >= static_cast<int64_t>(m_items.size())) {
    throw errors::SubscriptOutOfRange();
  }
  return m_items[static_cast<size_t>(static_cast<int64_t>(index) - m_lower)];
}

std::string& TextArray::operator[](int32_t index) {
  return const_cast<std::string&>(static_cast<const TextArray&>(*this)[index]);
}

int32_t ArrayCount(const TextArray& array) {
  return array.IsSized() ? static_cast<int32_t>(array.Items().size()) : 0;
}

// ---- ListFromText ----------------------------------------------------------
//
// The splitter is a state machine over the inner text: a depth counter and a
// search position, and at each step the first "(", ")" and "," at or after
// that position decide what happens. The stored record format depends on its
// exact results, odd cases included (a stray ")" before a comma joins the
// field), so the rules are kept as they are. Two things are added:
//
//  * Speed. Cutting the inner text after each field and searching it again
//    from the start is quadratic. Positions here are absolute and "cutting"
//    only moves the base, and each of the three searches remembers what it
//    last found, so a search never re-reads text it has already read unless
//    the position moves back (see the next point).
//  * Termination. A ")" at depth 0 with no "(" after it makes the machine
//    restart at depth 1 from the start of the current field. If that happens
//    twice for the same field, the machine would cycle forever (for example
//    "(a),b),c)"); that is reported as an unexpected closing paren.
namespace {

constexpr const char* kListSource = "Serialize.ListFromText";
constexpr size_t kNone = std::string_view::npos;

Error ListError(int32_t number, const char* description) {
  return Error(number, kListSource, description);
}

// Finds the first occurrence of one character at or after a position,
// remembering that [m_from, m_found) holds none, so that repeated searches
// from non-decreasing positions cost linear time in total.
class CharSearch {
 public:
  CharSearch(std::string_view text, char c) : m_text(text), m_char(c) {}

  size_t From(size_t pos) {
    if (m_valid && pos >= m_from && (m_found == kNone || pos <= m_found)) return m_found;
    if (m_valid && pos < m_from) {
      size_t hit = m_text.substr(0, m_from).find(m_char, pos);
      if (hit != kNone) {
        m_from = pos;
        m_found = hit;
        return hit;
      }
      m_from = pos;
      return m_found;
    }
    m_from = pos;
    m_found = m_text.find(m_char, pos);
    m_valid = true;
    return m_found;
  }

 private:
  std::string_view m_text;
  char m_char;
  bool m_valid = false;
  size_t m_from = 0;
  size_t m_found = kNone;
};

}  // namespace

TextArray ListFromText(std::string_view text, int32_t lowerBound) {
  size_t open = text.find('(');
  size_t close = text.rfind(')');
  if (open == kNone && close == kNone) return TextArray();
  if (open == kNone || close == kNone || close < open) {
    throw ListError(1, "Badly formatted list, enclosing parens");
  }
  std::string_view inner = text.substr(open + 1, close - open - 1);

  CharSearch opens(inner, '('), closes(inner, ')'), commas(inner, ',');
  std::vector<std::string> fields;
  size_t base = 0;  // start of the current (uncut) inner text
  size_t p = 0;     // search position
  int64_t depth = 0;
  bool restartedThisField = false;

  size_t po = opens.From(p), pc = closes.From(p), pk = commas.From(p);
  while (pk != kNone || depth >= 1) {
    if (depth >= 1) {
      if (pc == kNone) throw ListError(4, "Badly formatted list, missing closing paren");
      if (po == kNone || po >= pc) {
        p = pc + 1;
        --depth;
      } else {
        p = po + 1;
        ++depth;
      }
    } else if (po == kNone || (pc != kNone && pc > po)) {
      // Depth 0 and no "(" stands before the next ")" (both absent counts too).
      bool anyParen = po != kNone || pc != kNone;
      bool commaNotBeforeOpen = po == kNone || pk > po;
      if (anyParen && commaNotBeforeOpen) {
        if (po == kNone) {
          // A stray ")" with no "(" after it: restart at depth 1 from the
          // start of the field.
          if (restartedThisField) {
            throw ListError(3, "Badly formatted list, unexpected closing paren");
          }
          restartedThisField = true;
          p = base;
        } else {
          p = po + 1;
        }
        depth = 1;
      } else {
        fields.emplace_back(inner.substr(base, pk - base));
        base = pk + 1;
        p = base;
        restartedThisField = false;
      }
    } else {
      // Depth 0, a "(" ahead and either a ")" before it or no ")" at all.
      if (pc != kNone) throw ListError(3, "Badly formatted list, unexpected closing paren");
      throw ListError(2, "Badly formatted list, missing closing paren");
    }
    po = opens.From(p);
    pc = closes.From(p);
    pk = commas.From(p);
  }
  fields.emplace_back(inner.substr(base));
  return TextArray(lowerBound, std::move(fields));
}

// ---- ListToText ------------------------------------------------------------

std::string ListToText(const std::vector<std::string>& fields) {
  if (fields.empty()) return "()";
  size_t size = 2 + fields.size();
  for (const auto& f : fields) size += f.size();
  std::string out;
  out.reserve(size);
  out += '(';
  for (size_t i = 0; i < fields.size(); ++i) {
    if (i > 0) out += ',';
    out += fields[i];
  }
  out += ')';
  return out;
}

std::string ListToText(const TextArray& fields) {
  return ListToText(fields.Items());
}

// ---- Escapes ---------------------------------------------------------------

std::string EscapeText(std::string_view text) {
  std::string out;
  out.reserve(text.size());
  for (char c : text) {
    switch (c) {
      case '*':
        out += "*E";
        break;
      case '(':
        out += "*O";
        break;
      case ')':
        out += "*C";
        break;
      case ',':
        out += "*S";
        break;
      default:
        out += c;
    }
  }
  return out;
}

namespace {
// One replace-all pass, left to right, non-overlapping, as a text replace does.
std::string ReplaceAll(std::string_view text, std::string_view from, char to) {
  std::string out;
  out.reserve(text.size());
  size_t pos = 0;
  while (true) {
    size_t hit = text.find(from, pos);
    if (hit == kNone) break;
    out.append(text.substr(pos, hit - pos));
    out += to;
    pos = hit + from.size();
  }
  out.append(text.substr(pos));
  return out;
}
}  // namespace

std::string UnescapeText(std::string_view field) {
  if (field.find('*') == kNone) return std::string(field);
  // Reverse order of escaping: "*S", "*C", "*O", and "*E" last. Doing the
  // passes separately matters: "*ES" unescapes to "*S", not ",".
  std::string s = ReplaceAll(field, "*S", ',');
  s = ReplaceAll(s, "*C", ')');
  s = ReplaceAll(s, "*O", '(');
  return ReplaceAll(s, "*E", '*');
}

// ---- Typed fields ----------------------------------------------------------

std::string DateToText(DateTime value) {
  return EscapeText(value.ToText());
}

DateTime DateFromText(std::string_view field) {
  auto value = DateTime::FromText(UnescapeText(field));
  if (!value) throw errors::TypeMismatch();
  return *value;
}

std::string LongToText(int32_t value) {
  return EscapeText(SignedNumberText(value));
}

int32_t LongFromText(std::string_view field) {
  auto number = ParseNumber(UnescapeText(field));
  if (!number) throw errors::TypeMismatch();
  double down = std::floor(*number);
  if (!(down >= std::numeric_limits<int32_t>::min() &&
        down <= std::numeric_limits<int32_t>::max())) {
    throw errors::Overflow();
  }
  return static_cast<int32_t>(down);
}

std::string BoolToText(bool value) {
  return value ? "T" : "F";
}

bool BoolFromText(std::string_view field) {
  std::string text = UnescapeText(field);
  return text.size() == 1 && (text[0] == 'T' || text[0] == 't');
}

}  // namespace tav
