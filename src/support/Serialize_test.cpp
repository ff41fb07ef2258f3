#include "support/Serialize.h"

#include <gtest/gtest.h>

#include <optional>
#include <random>
#include <variant>

#include "support/Error.h"

namespace tav {
namespace {

// The result of a split: the fields, or the error number it failed with.
using Split = std::variant<std::vector<std::string>, int32_t>;

Split Fast(std::string_view text) {
  try {
    TextArray a = ListFromText(text, 1);
    return a.Items();
  } catch (const Error& e) {
    EXPECT_EQ(e.Source(), "Serialize.ListFromText");
    return e.Number();
  }
}

// The splitting rules transcribed literally: 1-based positions, 0 for absent,
// the inner text cut after every field. Returns nothing when it would run
// forever (more steps than any finite run of this length can take).
std::optional<Split> Literal(const std::string& t) {
  size_t o1 = t.find('('), c1 = t.rfind(')');
  size_t o = o1 == std::string::npos ? 0 : o1 + 1, c = c1 == std::string::npos ? 0 : c1 + 1;
  if (o == 0 && c == 0) return Split(std::vector<std::string>{});
  if (!(o >= 1 && c >= 1 && o < c)) return Split(int32_t{1});
  std::string in = t.substr(o, c - o - 1);
  auto find = [&](char ch, size_t p) -> size_t {
    size_t r = in.find(ch, p - 1);
    return r == std::string::npos ? 0 : r + 1;
  };
  std::vector<std::string> fields;
  long depth = 0;
  size_t p = 1;
  size_t po = find('(', p), pc = find(')', p), pk = find(',', p);
  for (size_t steps = 0; pk >= 1 || depth >= 1; ++steps) {
    if (steps > 100 * (t.size() + 4)) return std::nullopt;
    if (depth >= 1) {
      if (pc == 0) return Split(int32_t{4});
      if (po == 0 || po >= pc) {
        p = pc + 1;
        --depth;
      } else {
        p = po + 1;
        ++depth;
      }
    } else if (pc >= po) {
      if ((po != 0 || pc != 0) && pk >= po) {
        depth = 1;
        p = po + 1;
      } else {
        fields.push_back(in.substr(0, pk - 1));
        in = in.substr(pk);
        p = 1;
      }
    } else {
      return Split(int32_t{pc != 0 ? 3 : 2});
    }
    po = find('(', p);
    pc = find(')', p);
    pk = find(',', p);
  }
  fields.push_back(in);
  return Split(fields);
}

TEST(ListFromText, ContractExamples) {
  struct Case {
    std::string text;
    std::vector<std::string> fields;
  };
  const Case cases[] = {
      {"()", {""}},
      {"(x)", {"x"}},
      {"pre(a,b)post", {"a", "b"}},
      {"(a,,b)", {"a", "", "b"}},
      {"(a,(b,c),d)", {"a", "(b,c)", "d"}},
      {"( a , b )", {" a ", " b "}},
      {"(a),b)", {"a)", "b"}},
      {"(a,(b,(c,d)),e)", {"a", "(b,(c,d))", "e"}},
      {"(,)", {"", ""}},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(Fast(c.text), Split(c.fields)) << c.text;
  }
}

TEST(ListFromText, TextWithoutParensIsNeverSized) {
  for (const char* text : {"", "abc", "a,b"}) {
    TextArray a = ListFromText(text, 0);
    EXPECT_FALSE(a.IsSized()) << text;
    EXPECT_EQ(ArrayCount(a), 0);
    EXPECT_THROW(a.UBound(), Error);
  }
}

TEST(ListFromText, ErrorsCarryNumberAndDescription) {
  struct Case {
    std::string text;
    int32_t number;
    std::string description;
  };
  const Case cases[] = {
      {"(a,b", 1, "Badly formatted list, enclosing parens"},
      {"a,b)", 1, "Badly formatted list, enclosing parens"},
      {")(", 1, "Badly formatted list, enclosing parens"},
      {"(a,(b,c)", 2, "Badly formatted list, missing closing paren"},
      {"(a),(b)", 3, "Badly formatted list, unexpected closing paren"},
      {"((a,b)", 2, "Badly formatted list, missing closing paren"},
      {"((b,(c),d)", 4, "Badly formatted list, missing closing paren"},
  };
  for (const auto& c : cases) {
    try {
      ListFromText(c.text, 1);
      ADD_FAILURE() << c.text << " did not fail";
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), c.number) << c.text;
      EXPECT_EQ(e.Description(), c.description) << c.text;
      EXPECT_EQ(e.Source(), "Serialize.ListFromText");
    }
  }
}

TEST(ListFromText, ListsThatWouldCycleForeverFailAsUnexpectedClosingParen) {
  for (const char* text : {"(a),b),c)", "(a)),b)"}) {
    EXPECT_FALSE(Literal(text).has_value()) << text;
    EXPECT_EQ(Fast(text), Split(int32_t{3})) << text;
  }
}

TEST(ListFromText, AgreesWithTheLiteralRulesOnRandomTexts) {
  std::mt19937 rng(20241224);
  const char alphabet[] = "(),,ab";
  for (int i = 0; i < 200000; ++i) {
    std::string text(rng() % 14, ' ');
    for (char& ch : text) ch = alphabet[rng() % 6];
    auto literal = Literal(text);
    if (literal) {
      ASSERT_EQ(Fast(text), *literal) << text;
    } else {
      ASSERT_EQ(Fast(text), Split(int32_t{3})) << text;
    }
  }
}

TEST(ListFromText, LowerBoundIndexesTheResult) {
  TextArray a = ListFromText("(a,b)", 5);
  EXPECT_EQ(a.LBound(), 5);
  EXPECT_EQ(a.UBound(), 6);
  EXPECT_EQ(a[6], "b");
  EXPECT_THROW(a[4], Error);
  EXPECT_THROW(a[7], Error);
}

TEST(ListToText, JoinsFieldsAsTheyAre) {
  EXPECT_EQ(ListToText(std::vector<std::string>{}), "()");
  EXPECT_EQ(ListToText({"a", ""}), "(a,)");
  EXPECT_EQ(ListToText({"(b,c)", " 1"}), "((b,c), 1)");
}

TEST(Escape, RoundTripsEveryText) {
  EXPECT_EQ(EscapeText("a*(b,c)"), "a*E*Ob*Sc*C");
  EXPECT_EQ(UnescapeText("a*E*Ob*Sc*C"), "a*(b,c)");
  EXPECT_EQ(UnescapeText("*ES"), "*S");
  std::mt19937 rng(7);
  const char alphabet[] = "*(),ESOCx";
  for (int i = 0; i < 20000; ++i) {
    std::string text(rng() % 10, ' ');
    for (char& ch : text) ch = alphabet[rng() % 9];
    std::string escaped = EscapeText(text);
    ASSERT_EQ(escaped.find_first_of("(),"), std::string::npos) << text;
    ASSERT_EQ(UnescapeText(escaped), text);
  }
}

TEST(TypedFields, Numbers) {
  EXPECT_EQ(LongToText(7), " 7");
  EXPECT_EQ(LongToText(0), " 0");
  EXPECT_EQ(LongToText(-7), "-7");
  EXPECT_EQ(LongFromText(" 7"), 7);
  EXPECT_EQ(LongFromText("-12"), -12);
  EXPECT_EQ(LongFromText("2.7"), 2);    // rounded down
  EXPECT_EQ(LongFromText("-2.5"), -3);  // down, not towards zero
  for (const char* bad : {"", " ", "x", "7x", "*S"}) {
    try {
      LongFromText(bad);
      ADD_FAILURE() << bad;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), 13) << bad;
      EXPECT_EQ(e.Description(), "Type mismatch");
    }
  }
  try {
    LongFromText("2147483648");
    ADD_FAILURE();
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 6);
  }
}

TEST(TypedFields, Booleans) {
  EXPECT_EQ(BoolToText(true), "T");
  EXPECT_EQ(BoolToText(false), "F");
  EXPECT_TRUE(BoolFromText("T"));
  EXPECT_TRUE(BoolFromText("t"));
  for (const char* no : {"True", "", "F", " T", "1"}) EXPECT_FALSE(BoolFromText(no)) << no;
}

TEST(TypedFields, Dates) {
  EXPECT_EQ(DateToText(DateTime::FromParts(2024, 12, 24, 18, 30)), "2024-12-24 18:30:00");
  EXPECT_EQ(DateFromText("2024-12-24 18:30:00"), DateTime::FromParts(2024, 12, 24, 18, 30));
  EXPECT_EQ(DateFromText("2024-12-24"), DateTime::FromParts(2024, 12, 24));
  for (const char* bad : {"", "tomorrow", "2024-13-01", "2024-02-30 10:00:00"}) {
    try {
      DateFromText(bad);
      ADD_FAILURE() << bad;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), 13) << bad;
    }
  }
}

}  // namespace
}  // namespace tav
