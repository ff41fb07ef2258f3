// The time and speed arguments of showctl's commands, read without running
// the binary.

#include <gmock/gmock.h>

#include <optional>
#include <string>
#include <vector>

#include "CommandRegistry.h"
#include "TimeArguments.h"

namespace tav::showctl {
namespace {

using ::testing::HasSubstr;

// Tuesday 24 December 2024, 18:00:00.
const DateTime kFrom = DateTime::FromParts(2024, 12, 24, 18, 0, 0);

TEST(MomentArgument, ReadsEachFormRelativeToTheStart) {
  struct Case {
    std::string text;
    bool strictlyAfter;
    DateTime expected;
  };
  const std::vector<Case> cases = {
      {"2024-12-31 23:30", false, DateTime::FromParts(2024, 12, 31, 23, 30, 0)},
      // A date before the start is taken as given: the caller decides.
      {"2024-12-01 08:00", false, DateTime::FromParts(2024, 12, 1, 8, 0, 0)},
      {"19:00", false, DateTime::FromParts(2024, 12, 24, 19, 0, 0)},
      {"17:00", false, DateTime::FromParts(2024, 12, 25, 17, 0, 0)},
      {"18:00", false, kFrom},
      {"18:00", true, DateTime::FromParts(2024, 12, 25, 18, 0, 0)},
      {"Tue 18:00", false, kFrom},
      {"Tue 18:00", true, DateTime::FromParts(2024, 12, 31, 18, 0, 0)},
      {"Mon 09:00", false, DateTime::FromParts(2024, 12, 30, 9, 0, 0)},
      {"Wed 12:00 AM", false, DateTime::FromParts(2024, 12, 25, 0, 0, 0)},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(MomentArgument(c.text, "to", kFrom, c.strictlyAfter).ToText(), c.expected.ToText())
        << c.text << (c.strictlyAfter ? " (strictly after)" : "");
  }
}

TEST(MomentArgument, NamesTheOptionAndTheFormsInItsRefusal) {
  for (const std::string text : {"yesterday", "", "2024-13-01 10:00", "Tue", "25:61"}) {
    try {
      MomentArgument(text, "from", kFrom);
      ADD_FAILURE() << "accepted \"" << text << "\"";
    } catch (const CommandFailed& e) {
      EXPECT_THAT(e.what(), HasSubstr("the from time \"" + text + "\""));
      EXPECT_THAT(e.what(), HasSubstr("\"Mon 19:00\""));
    }
  }
}

TEST(DateTimeArgument, ATimeAloneNeedsADayToHangOn) {
  EXPECT_THROW(DateTimeArgument("19:00", "until"), CommandFailed);
  EXPECT_EQ(DateTimeArgument("19:00", "until", kFrom).ToText(), "2024-12-24 19:00:00");
}

TEST(SpeedArgument, MaxOrAFactorOfAtLeastOne) {
  const std::vector<std::pair<std::string, std::optional<double>>> cases = {
      {"max", 0},
      {"1", 1},
      {"60", 60},
      {"60x", 60},
      {"2.5X", 2.5},
      {"0.5", std::nullopt},
      {"0", std::nullopt},
      {"-60", std::nullopt},
      {"", std::nullopt},
      {"x", std::nullopt},
      {"fast", std::nullopt},
      {"60 x", std::nullopt},
      {"inf", std::nullopt},
      {"nan", std::nullopt},
      {"MAX", std::nullopt},
  };
  for (const auto& [text, expected] : cases) {
    if (expected) {
      EXPECT_EQ(SpeedArgument(text), *expected) << text;
    } else {
      EXPECT_THROW(SpeedArgument(text), CommandFailed) << text;
    }
  }
}

}  // namespace
}  // namespace tav::showctl
