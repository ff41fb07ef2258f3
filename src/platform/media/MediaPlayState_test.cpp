#include "platform/media/MediaPlayState.h"

#include <gtest/gtest.h>

#include <asio.hpp>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "ports/testing/RecordingMessageLog.h"
#include "show/MediaPlayer.h"
#include "support/Error.h"

namespace tav {
namespace {

class MediaPlayStateTest : public ::testing::Test {
 protected:
  void SetUp() override {
    plays->SetOnPlayStateChange(
        [this](int32_t state) { raised.push_back("state " + std::to_string(state)); });
    plays->SetOnMediaError(
        [this] { raised.push_back("error with state " + std::to_string(plays->State())); });
  }

  // Raises what is due, without waiting.
  std::vector<std::string> Raise() {
    loop.Context().restart();
    loop.Context().poll();
    return std::exchange(raised, {});
  }

  EventLoop loop;
  RecordingMessageLog log;
  std::unique_ptr<MediaPlayState> plays = std::make_unique<MediaPlayState>(loop, log, "Player");
  std::vector<std::string> raised;
};

using Raised = std::vector<std::string>;

TEST_F(MediaPlayStateTest, EventsComeFromTheLoopInOrderAndAFailureStopsBeforeItsError) {
  plays->BeginPlay();
  plays->SetState(kMediaTransitioning);
  plays->SetState(kMediaTransitioning);
  plays->Fail("Cannot play \"a.mp3\": file not found");
  EXPECT_TRUE(raised.empty()) << "raised inside a call";
  EXPECT_EQ(plays->State(), kMediaStopped);
  EXPECT_EQ(Raise(), (Raised{"state 9", "error with state 1", "state 1"}));

  plays->RaiseError(plays->State());  // an error that changes nothing else
  EXPECT_EQ(Raise(), (Raised{"error with state 1"}));
  EXPECT_EQ(plays->ErrorCount(), 1);
}

TEST_F(MediaPlayStateTest, AChangeANewerPlayOvertookIsRaisedOnlyIfStillTrue) {
  constexpr int32_t kNewPlay = 0;  // OpenMedia or Stop begins the next play
  struct Case {
    const char* what;
    std::vector<int32_t> steps;  // states set, and kNewPlay
    Raised expected;
  };
  const Case cases[] = {
      {"the current play's changes all come",
       {kNewPlay, 9, 3, 1},
       {"state 9", "state 3", "state 1"}},
      {"stopped before it was heard to start", {kNewPlay, 9, 3, kNewPlay, 1}, {"state 1"}},
      {"opened again while opening", {kNewPlay, 9, kNewPlay, 9}, {"state 9"}},
      {"a play that failed, then the next",
       {kNewPlay, 9, 1, kNewPlay, 9, 3},
       {"state 9", "state 3"}},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    uint64_t generation = plays->Generation();
    for (int32_t step : c.steps) {
      if (step == kNewPlay) {
        EXPECT_EQ(plays->BeginPlay(), ++generation);
      } else {
        plays->SetState(step);
      }
    }
    EXPECT_EQ(Raise(), c.expected);
    plays->SetState(kMediaStopped);
    Raise();
  }

  // A change that is still true is said even though a newer play overtook it.
  plays->BeginPlay();
  plays->SetState(kMediaPlaying);
  Raise();
  plays->SetState(kMediaStopped);
  plays->BeginPlay();
  plays->SetState(kMediaStopped);
  EXPECT_EQ(Raise(), (Raised{"state 1"}));
}

TEST_F(MediaPlayStateTest, TheErrorQueueKeepsTheLatestAndRefusesWhatIsOutside) {
  for (int i = 0; i <= 100; ++i) plays->QueueError(std::to_string(i));
  EXPECT_EQ(plays->ErrorCount(), 100);
  EXPECT_EQ(plays->ErrorDescription(0), "1");
  EXPECT_EQ(plays->ErrorDescription(99), "100");
  for (int32_t outside : {-1, 100}) {
    try {
      plays->ErrorDescription(outside);
      ADD_FAILURE() << outside;
    } catch (const Error& e) {
      EXPECT_EQ(e.Number(), errors::kSubscriptOutOfRange);
      EXPECT_EQ(e.Source(), "Player.ErrorDescription");
    }
  }
  plays->ClearErrorQueue();
  EXPECT_EQ(plays->ErrorCount(), 0);
}

TEST_F(MediaPlayStateTest, AHandlerMayEndTheOwnerAndWhatFailsInOneIsLogged) {
  plays->SetOnMediaError([] { throw std::runtime_error("boom"); });
  plays->SetOnPlayStateChange([this](int32_t state) {
    raised.push_back("state " + std::to_string(state));
    plays.reset();
  });
  plays->Fail("x");
  plays->SetState(kMediaPlaying);
  plays->SetState(kMediaStopped);  // on its way when the owner goes: dropped
  EXPECT_EQ(Raise(), Raised{"state 3"});
  EXPECT_FALSE(plays);
  EXPECT_EQ(log.lines, Raised{"3 Player event handler Error: boom"});
}

TEST_F(MediaPlayStateTest, NothingIsRaisedOnceSilencedOrGone) {
  plays->SetState(kMediaPlaying);
  plays->Silence();
  plays->Fail("x");
  EXPECT_EQ(Raise(), Raised{});
  SetUp();
  plays->SetState(kMediaTransitioning);
  plays.reset();
  EXPECT_EQ(Raise(), Raised{});
}

}  // namespace
}  // namespace tav
