#include "schedule/WeekTimeInput.h"

#include <cctype>
#include <cstdio>

namespace tav {
namespace {

constexpr const char* kDayNames[] = {"sunday",   "monday", "tuesday", "wednesday",
                                     "thursday", "friday", "saturday"};
constexpr const char* kShortNames[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};

std::string Lower(std::string_view text) {
  std::string lower(text);
  for (char& c : lower) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return lower;
}

std::optional<int> DayOf(std::string_view word) {
  std::string lower = Lower(word);
  if (lower.size() < 3) return std::nullopt;
  for (int day = 0; day < 7; ++day) {
    std::string_view name = kDayNames[day];
    if (name.substr(0, lower.size()) == lower) return day;
  }
  return std::nullopt;
}

// Up to two digits; nothing when there is none.
std::optional<int> TwoDigits(std::string_view text, size_t& pos) {
  size_t start = pos;
  int value = 0;
  while (pos < text.size() && pos - start < 2 &&
         std::isdigit(static_cast<unsigned char>(text[pos]))) {
    value = value * 10 + (text[pos] - '0');
    ++pos;
  }
  if (pos == start) return std::nullopt;
  return value;
}

}  // namespace

std::optional<std::shared_ptr<WeekTime>> WeekTimeFromInput(std::string_view text) {
  size_t pos = 0;
  auto skipBlanks = [&] {
    while (pos < text.size() && std::isspace(static_cast<unsigned char>(text[pos]))) ++pos;
  };
  skipBlanks();
  size_t wordStart = pos;
  while (pos < text.size() && std::isalpha(static_cast<unsigned char>(text[pos]))) ++pos;
  std::optional<int> day = DayOf(text.substr(wordStart, pos - wordStart));
  if (!day) return std::nullopt;
  skipBlanks();

  std::optional<int> hour = TwoDigits(text, pos);
  if (!hour) return std::nullopt;
  int minute = 0, second = 0;
  if (pos < text.size() && text[pos] == ':') {
    ++pos;
    size_t before = pos;
    std::optional<int> m = TwoDigits(text, pos);
    if (!m || pos - before != 2) return std::nullopt;
    minute = *m;
    if (pos < text.size() && text[pos] == ':') {
      ++pos;
      before = pos;
      std::optional<int> s = TwoDigits(text, pos);
      if (!s || pos - before != 2) return std::nullopt;
      second = *s;
    }
  }
  skipBlanks();
  std::string marker = Lower(text.substr(pos));
  while (!marker.empty() && std::isspace(static_cast<unsigned char>(marker.back())))
    marker.pop_back();
  if (marker == "am" || marker == "pm") {
    if (*hour < 1 || *hour > 12) return std::nullopt;
    *hour = *hour % 12 + (marker == "pm" ? 12 : 0);
  } else if (!marker.empty()) {
    return std::nullopt;
  }
  if (*hour > 23 || minute > 59 || second > 59) return std::nullopt;
  return NewWeekTime(*day, *hour, minute, second);
}

std::string WeekTimeToDisplay(const WeekTime& time) {
  char buffer[48];
  int day = ((time.Day() % 7) + 7) % 7;
  std::snprintf(buffer, sizeof buffer, "%s %02d:%02d:%02d", kShortNames[day], time.Hour(),
                time.Minute(), time.Second());
  return buffer;
}

}  // namespace tav
