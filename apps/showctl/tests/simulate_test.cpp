// showctl simulate end to end: the real binary over a small user data
// folder (schedules, shows, sequences, a WAV file) in the test's folder.

#include <gmock/gmock.h>

#include <filesystem>
#include <string>
#include <vector>

#include "ShowctlRunner.h"

namespace tav::showctl::testing {
namespace {

using ::testing::AllOf;
using ::testing::ContainsRegex;
using ::testing::HasSubstr;
using ::testing::Not;

// Tuesday 24 December 2024: week times are seconds since Sunday 00:00.
constexpr int kTue1800 = 2 * 86400 + 18 * 3600;

std::string Sequence(int lengthMs, const std::string& media = "") {
  return R"({"tessavar_sequence": 1, "length_ms": )" + std::to_string(lengthMs) +
         (media.empty() ? "" : R"(, "media": ")" + media + "\"") +
         R"(, "channels": [{"dmx": {"universe": 1, "slot": 1},)"
         R"( "effects": [{"at": 0, "type": "set", "level": 100}]}]})";
}

// A show with a Main and a Musical section, by sequence name.
std::string Show(const std::string& main, const std::string& musical) {
  auto list = [](const std::string& names) { return names.empty() ? "" : "(" + names + ")"; };
  return "((0,1,2,0,,,T,F,F),(0,1,2,0,,,T,F,F),(1,0,1,0,," + list(main) + ",T,F,F),(0,1,2,0,," +
         list(musical) + ",T,F,F),,(2,0,1,0,,,F,F,F),, 0,,F)";
}

// A weekly show record, from and to in seconds after Tuesday 18:00.
std::string Weekly(const std::string& show, int from, int to) {
  return "(" + std::to_string(kTue1800 + to) + ",2,(, 0," + show + ")," +
         std::to_string(kTue1800 + from) + ")";
}

// An 8 kHz, 8-bit mono PCM WAV file of `seconds`.
std::string Wav(int seconds) {
  auto le32 = [](uint32_t v) {
    return std::string{static_cast<char>(v), static_cast<char>(v >> 8), static_cast<char>(v >> 16),
                       static_cast<char>(v >> 24)};
  };
  const uint32_t data = 8000u * seconds;
  return "RIFF" + le32(36 + data) + "WAVEfmt " + le32(16) + std::string("\x01\x00\x01\x00", 4) +
         le32(8000) + le32(8000) + std::string("\x01\x00\x08\x00", 4) + "data" + le32(data) +
         std::string(data, '\x80');
}

class SimulateCommand : public ShowctlTest {
 protected:
  void SetUp() override {
    ShowctlTest::SetUp();
    std::filesystem::create_directories(Path("tessavar/Sequences"));
    std::filesystem::create_directories(Path("tessavar/Media"));
    Write("tessavar/Sequences/lights.tseq", Sequence(20'000));
    Write("tessavar/Sequences/song.tseq", Sequence(30'000, "song.wav"));
    Write("tessavar/Media/song.wav", Wav(5));
    Write("tessavar/good.show", Show("lights.tseq", "song.tseq"));
  }
  void WeekSchedule(const std::vector<std::string>& records) const {
    std::string text;
    for (const auto& r : records) text += (text.empty() ? "(" : ",") + r;
    Write("tessavar/weeksched.tsc", text + ")\r\n");
  }
  Result Simulate(std::vector<std::string> more = {}) const {
    std::vector<std::string> args = {"simulate", "--from", "2024-12-24 17:59:50", "--to",
                                     "2024-12-24 18:10"};
    args.insert(args.end(), more.begin(), more.end());
    return Run(args);
  }
};

TEST_F(SimulateCommand, AGoodEveningListsShowsSequencesAndMediaAndSucceeds) {
  WeekSchedule({Weekly("good.show", 0, 120)});
  Result r = Simulate();
  EXPECT_EQ(r.exitCode, 0) << r.out << r.err;
  EXPECT_THAT(r.out,
              HasSubstr("Simulated from Tue 2024-12-24 17:59:50 to Tue 2024-12-24 18:10:00"));
  EXPECT_THAT(r.out, ContainsRegex("2024-12-24 18:00:0[0-9]  show-start +good.show  \\[week\\] "
                                   "[^\n]*the week schedule has \"good.show\""));
  EXPECT_THAT(r.out, ContainsRegex("sequence-start +Animation: Sequences/lights.tseq"));
  EXPECT_THAT(r.out, ContainsRegex("sequence-start +Musical: Sequences/song.tseq"));
  EXPECT_THAT(r.out, HasSubstr("media Media/song.wav plays 0:05.0 (from its WAV header)"));
  EXPECT_THAT(r.out, ContainsRegex("2024-12-24 18:0[12]:[0-9]{2}  show-end +good.show"));
  EXPECT_THAT(r.out, HasSubstr("0 errors"));
  EXPECT_THAT(r.out, HasSubstr("Outputs: 1 DMX universe (1)"));
  EXPECT_THAT(r.out, HasSubstr("Result: OK"));
  // Nothing is written beside the user's files, not even the exports the
  // player would make.
  for (const auto& entry : std::filesystem::recursive_directory_iterator(Path("tessavar"))) {
    EXPECT_NE(entry.path().extension(), ".tcs") << entry.path();
  }
}

TEST_F(SimulateCommand, MissingFilesAreErrorsAndFailTheRun) {
  Write("tessavar/Sequences/quiet.tseq", Sequence(10'000, "gone.mp3"));
  Write("tessavar/broken.show", Show("nowhere.tseq", "quiet.tseq"));
  // A dated show of the year schedule takes 18:03 to 18:05 over the week.
  Write("tessavar/yearsched.tsc", "((2024-12-24,((" + std::to_string(kTue1800 + 300) +
                                      ",2,(, 0,broken.show)," + std::to_string(kTue1800 + 180) +
                                      "))))\r\n");
  WeekSchedule({Weekly("good.show", 0, 120), Weekly("nosuch.show", 400, 500)});
  Result r = Simulate();
  EXPECT_EQ(r.exitCode, 1) << r.out << r.err;
  EXPECT_THAT(r.out, ContainsRegex("show-start +broken.show  \\[year\\] [^\n]*year schedule"));
  EXPECT_THAT(r.out, ContainsRegex("error +[^\n]*nowhere.tseq"));
  EXPECT_THAT(r.out, ContainsRegex("error +[^\n]*gone.mp3"));
  // The host tries an unreadable show every second: one line, counted.
  EXPECT_THAT(r.out, ContainsRegex("error +Cannot read show file: [^\n]*nosuch.show[^\n]*"
                                   "\\(and [0-9]+ more times until 2024-12-24 18:0[78]"));
  EXPECT_THAT(r.out, Not(ContainsRegex("show-start +nosuch.show")));
  // The musical sequence whose media cannot play fails and restarts: folded.
  EXPECT_THAT(r.out, ContainsRegex("sequence-start +Musical: Sequences/quiet.tseq  \\(and [0-9]+"));
  EXPECT_THAT(r.out, ContainsRegex("[0-9]+ errors \\([0-9]+ times in all\\)"));
  EXPECT_THAT(r.out, HasSubstr("Result: FAILED"));
  EXPECT_THAT(r.err, ContainsRegex("the simulation found [0-9]+ errors \\([0-9]+ times in all\\)"));
}

TEST_F(SimulateCommand, AShowOnDemandWinsAndSaysSo) {
  WeekSchedule({Weekly("good.show", 0, 120)});
  Write("tessavar/other.show", Show("lights.tseq", ""));
  Result r = Simulate({"--on-demand", "other.show"});
  EXPECT_EQ(r.exitCode, 0) << r.out << r.err;
  EXPECT_THAT(r.out, ContainsRegex("show-start +other.show  \\[on demand\\]"));
  EXPECT_THAT(r.out, Not(HasSubstr("show-start         good.show")));
}

TEST_F(SimulateCommand, BadArgumentsAreRefusedBeforeAnythingRuns) {
  struct Case {
    std::vector<std::string> args;
    std::string message;
  };
  const std::vector<Case> cases = {
      {{"--from", "yesterday"}, "the from time \"yesterday\" is neither"},
      {{"--from", "2024-12-24 18:00", "--to", "2024-12-24 17:00"},
       "the to time 2024-12-24 17:00:00 is not after the from time"},
      {{"--to", "soon"}, "the to time \"soon\""},
      {{"--speed", "0.5"}, "the speed \"0.5\" is neither \"max\" nor a factor"},
      {{"--speed", "fast"}, "the speed \"fast\""},
  };
  for (const Case& c : cases) {
    std::vector<std::string> args = {"simulate"};
    args.insert(args.end(), c.args.begin(), c.args.end());
    Result r = Run(args);
    EXPECT_EQ(r.exitCode, 2) << c.message;
    EXPECT_THAT(r.err, HasSubstr(c.message));
    EXPECT_EQ(r.out, "") << c.message;
  }
}

TEST_F(SimulateCommand, HelpNamesEveryOption) {
  Result r = Run({"simulate", "--help"});
  EXPECT_EQ(r.exitCode, 0);
  EXPECT_THAT(r.out, AllOf(HasSubstr("--from"), HasSubstr("--to"), HasSubstr("--speed"),
                           HasSubstr("--on-demand"), HasSubstr("Exit status")));
}

}  // namespace
}  // namespace tav::showctl::testing
