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
  plays->BeginPlay();
  plays->SetState(kMediaTransitioning);
  plays->SetState(kMediaPlaying);  // false by the time it would be raised
  EXPECT_EQ(plays->BeginPlay(), 2u);
  plays->SetState(kMediaTransitioning);
  EXPECT_EQ(Raise(), (Raised{"state 9"}));

  plays->SetState(kMediaPlaying);
  plays->BeginPlay();
  plays->SetState(kMediaStopped);
  plays->BeginPlay();
  plays->SetState(kMediaTransitioning);
  EXPECT_EQ(Raise(), (Raised{"state 9"}));
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
  plays->SetOnPlayStateChange([this](int32_t) { plays.reset(); });
  plays->Fail("x");
  plays->SetState(kMediaPlaying);
  EXPECT_EQ(Raise(), Raised{});
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
