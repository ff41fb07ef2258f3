// Interactive groups at run time: which presses start what, what they
// interrupt, and how round robins move.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "show/ShowPlayer.h"
#include "show/TriggerFunctions.h"
#include "show/testing/ShowRig.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

SequenceData Lights(int32_t slot, int64_t lengthMs) {
  SequenceData data;
  data.lengthMs = lengthMs;
  data.channels.push_back({"lamp", {kFamilyDMX, 1, 0, slot}, {{0, 0, kEffectSet, 100, 100, 0}}});
  return data;
}

class TriggerBench {
 public:
  TriggerBench() {
    int32_t slot = 0;
    for (const char* name : {"a.tseq", "b.tseq", "c.tseq", "intro.tseq"}) {
      rig.WriteSequence(name, Lights(++slot, 1000));
    }
    rig.WriteSequence("main.tseq", Lights(9, 600'000));
  }
  // A show with Main running and these groups; triggers are registered on
  // the first tick.
  void Play(std::vector<std::shared_ptr<InteractiveGroup>> groups) {
    ShowParts parts;
    parts.main = {"main.tseq"};
    parts.groups = std::move(groups);
    Play(parts);
  }
  void Play(const ShowParts& parts) {
    rig.Start();
    rig.player->SetNextShow(rig.MakeShow("xmas.tsh", parts));
    rig.Advance(10);
    rig.timeline.Clear();
  }
  // Presses input (1, 1, input) at `ms` from now, from the loop.
  void PressAt(uint64_t ms, int32_t input = 1) {
    rig.At(ms, [this, input] { rig.Press(1, 1, input, "button"); });
  }
  // "<ms> <file>" of each start and end since Play.
  std::vector<std::string> Lines(const std::string& prefix) const {
    std::vector<std::string> out;
    for (const auto& e : rig.timeline.Entries()) {
      if (e.text.compare(0, prefix.size(), prefix) != 0) continue;
      out.push_back(std::to_string(e.atMs) + " " + e.text.substr(prefix.size()));
    }
    return out;
  }
  std::vector<std::string> Starts() const { return Lines("log 1 Starting "); }
  std::vector<std::string> Ends() const { return Lines("log 1 Ending "); }

  std::shared_ptr<InteractiveGroup> Group(bool independent, bool interruptible,
                                          std::vector<std::string> sequences, int32_t input = 1) {
    return rig.Group(independent, interruptible, NewTrigger(1, 1, input, "button"), sequences);
  }

  ShowRig rig;
};

class TriggerTest : public ::testing::Test, public TriggerBench {};

TEST_F(TriggerTest, AJukeboxIgnoresPressesWhileItPlaysAndKeepsItsRoundRobin) {
  auto jukebox = Group(false, false, {"a.tseq", "b.tseq"});
  Play({jukebox});
  PressAt(100);
  PressAt(500);  // ignored: a plays
  PressAt(1500);
  rig.Advance(3000);
  EXPECT_THAT(Starts(), ElementsAre("110 <a.tseq>", "1510 <b.tseq>"));
  EXPECT_EQ(jukebox->GetTriggeredSequences(0)->RoundRobinIndex(), 0);
  EXPECT_THAT(rig.timeline.Texts("log 1 Trigger detected"),
              ElementsAre("log 1 Trigger detected: button", "log 1 Trigger detected: button",
                          "log 1 Trigger detected: button"));
}

TEST_F(TriggerTest, ARoundRobinOfThreeWraps) {
  auto jukebox = Group(false, false, {"a.tseq", "b.tseq", "c.tseq"});
  Play({jukebox});
  for (uint64_t t : {100u, 1200u, 2300u}) PressAt(t);
  // The tray's simulated input counts as a press.
  rig.At(3400, [this] { rig.player->SimulateInput(1, 1, 1); });
  rig.Advance(5000);
  EXPECT_THAT(Starts(),
              ElementsAre("110 <a.tseq>", "1210 <b.tseq>", "2310 <c.tseq>", "3410 <a.tseq>"));
}

TEST_F(TriggerTest, ASoundboardReplacesWhatPlays) {
  auto soundboard = Group(false, true, {"a.tseq", "b.tseq"});
  Play({soundboard});
  PressAt(100);
  PressAt(400);
  PressAt(700);
  rig.Advance(2000);
  // Each press stops the playing one (its lights put out at once) and starts
  // the next in the round robin.
  EXPECT_THAT(Starts(), ElementsAre("110 <a.tseq>", "410 <b.tseq>", "710 <a.tseq>"));
  EXPECT_THAT(Ends(), ElementsAre("410 <a.tseq>", "710 <b.tseq>", "1710 <a.tseq>"));
}

TEST_F(TriggerTest, AMagicToyStartsAllItsSequencesTogetherAndAPressRestartsThem) {
  // Independent and interruptible: a Magic Toy.
  Play({Group(true, true, {"a.tseq", "b.tseq", "c.tseq"})});
  PressAt(100);
  PressAt(300);
  rig.Advance(2000);
  EXPECT_THAT(Starts(), ElementsAre("110 <a.tseq>", "110 <b.tseq>", "110 <c.tseq>", "310 <a.tseq>",
                                    "310 <b.tseq>", "310 <c.tseq>"));
  EXPECT_THAT(Ends(), ElementsAre("310 <a.tseq>", "310 <b.tseq>", "310 <c.tseq>", "1310 <a.tseq>",
                                  "1310 <b.tseq>", "1310 <c.tseq>"));
}

TEST_F(TriggerTest, EveryBindingOfAnInputReacts) {
  Play({Group(false, false, {"a.tseq"}), Group(false, false, {"b.tseq"}),
        Group(false, false, {"c.tseq"}, 2)});
  EXPECT_THAT(rig.cio->RegisteredInputs(), ElementsAre("1/1/1", "1/1/1", "1/1/2"));
  PressAt(100);
  rig.Advance(500);
  EXPECT_THAT(Starts(), ElementsAre("110 <a.tseq>", "110 <b.tseq>"));
}

TEST_F(TriggerTest, TheStartupTriggerOnAnInteractiveInputFiresBoth) {
  ShowParts parts;
  parts.startup = {"intro.tseq"};
  parts.main = {"main.tseq"};
  parts.startupType = 1;
  parts.startupTrigger = NewTrigger(1, 1, 1, "go");
  parts.groups = {Group(false, false, {"a.tseq"})};
  Play(parts);
  PressAt(100);
  rig.Advance(3000);
  EXPECT_THAT(rig.timeline.Texts("log 1"),
              ElementsAre("log 1 Startup trigger detected", "log 1 Clearing triggers",
                          "log 1 Loading sequence: a.tseq", "log 1 Starting <a.tseq>",
                          "log 1 Loading sequence: intro.tseq", "log 1 Starting <intro.tseq>",
                          "log 1 Ending <a.tseq>", "log 1 Ending <intro.tseq>",
                          "log 1 Registering interactive triggers",
                          "log 1 Loading sequence: main.tseq", "log 1 Starting <main.tseq>"));
}

TEST_F(TriggerTest, PressesAreIgnoredSilentlyWhileTheShowWindsDownOrNoneRuns) {
  rig.WriteSequence("bye.tseq", Lights(8, 2000));
  ShowParts parts;
  parts.main = {"main.tseq"};
  parts.shutdown = {"bye.tseq"};
  parts.groups = {Group(false, false, {"a.tseq"})};
  Play(parts);
  rig.At(100, [&] { rig.player->SetNextShow(nullptr); });
  PressAt(500);
  PressAt(5000);  // no show any more
  rig.Advance(6000);
  EXPECT_THAT(rig.timeline.Texts("log 1 Trigger"), IsEmpty());
  EXPECT_THAT(Starts(), ElementsAre("111 <bye.tseq>"));
  EXPECT_THAT(rig.cio->RegisteredInputs(), IsEmpty());
}

TEST_F(TriggerTest, AnInputOfAnUnknownNetworkIsLoggedAndChangesNothing) {
  Play({Group(false, false, {"a.tseq"})});
  rig.At(100, [&] { rig.Press(99, 7, 3, "stray"); });
  rig.Advance(500);
  EXPECT_THAT(rig.timeline.Texts(), ElementsAre("log 1 Trigger detected: stray"));
}

}  // namespace
}  // namespace tav
