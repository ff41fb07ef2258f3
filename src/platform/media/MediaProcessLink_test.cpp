#include "platform/media/MediaProcessLink.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <chrono>
#include <functional>
#include <string>
#include <vector>

#include "ports/testing/RecordingMessageLog.h"
#include "support/testing/TempFolder.h"

// The link on its own, with fake media processes (shell scripts writing to
// descriptor 3, then reading until the link closes): what a media process
// may say first, what reaches the owner, and one that stops reading. The
// player's tests cover the rest.

namespace tav {
namespace {

using namespace std::chrono_literals;
using SteadyClock = std::chrono::steady_clock;

const MpvOutputs kNullOutputs{"null", "", "null"};
constexpr const char* kUnexpected = "the media process ended unexpectedly";
constexpr const char* kTail = "; the next media file starts a new one";

class MediaProcessLinkTest : public ::testing::Test {
 protected:
  void Make(const std::string& name, const std::string& body) {
    std::string path = folder.Write(name, "#!/bin/sh\nsay() { printf '%s\\n' \"$*\" >&3; }\n" +
                                              body + "\nexec cat <&3 >/dev/null\n");
    ::chmod(path.c_str(), 0755);
    link = std::make_unique<MediaProcessLink>(loop, log, kNullOutputs, path,
                                              MediaProcessLink::Timing{});
    link->SetOnMessage([this](const MediaMessage& message) { messages.push_back(message); });
    link->SetOnEnded([this](const std::string& reason, auto) { endedFor.push_back(reason); });
  }

  bool RunUntil(const std::function<bool()>& done) {
    auto deadline = SteadyClock::now() + 10s;
    while (!done()) {
      if (SteadyClock::now() > deadline) return false;
      loop.RunFor(2ms);
    }
    return true;
  }

  TempFolder folder{"tav-medialink"};
  EventLoop loop;
  RecordingMessageLog log;
  std::unique_ptr<MediaProcessLink> link;
  std::vector<MediaMessage> messages;
  std::vector<std::string> endedFor;
};

TEST_F(MediaProcessLinkTest, AMediaProcessThatDoesNotGreetAsItShouldIsEndedAtOnce) {
  struct Case {
    std::string says;
    std::string logged;
  };
  const Case cases[] = {
      {"say state 1 3", "sent \"state\" before its greeting and was ended"},
      {"say hello 2 $$", "speaks version 2 of the protocol, not 1"},
      {"head -c 40000 /dev/zero | tr '\\0' a >&3",
       "sent a line longer than 32768 bytes and was ended"},
  };
  int n = 0;
  for (const Case& c : cases) {
    SCOPED_TRACE(c.says);
    Make("rude" + std::to_string(++n), c.says);
    log.lines.clear();
    endedFor.clear();
    link->Start();
    ASSERT_TRUE(RunUntil([&] { return !endedFor.empty(); }));
    EXPECT_FALSE(link->Running());
    EXPECT_EQ(link->ProcessId(), 0);
    EXPECT_EQ(endedFor, std::vector<std::string>{kUnexpected});
    EXPECT_EQ(log.lines,
              std::vector<std::string>{"3 Media: the media process " + c.logged + kTail});
    EXPECT_TRUE(messages.empty());
  }
}

// Several lines in one read, one line over two: each play message reaches
// the owner once and in order; answers and log lines do not.
TEST_F(MediaProcessLinkTest, OnlyWhatConcernsThePlayReachesTheOwner) {
  Make("chatty",
       "printf 'hello 1 %s\\nlog 2 warming%%20up\\nstate 7 9\\npong 99\\nsta' $$ >&3; sleep 0.1\n"
       "printf 'te 7 3\\nmedia 7 audio\\n' >&3");
  link->Start();
  ASSERT_TRUE(RunUntil([&] { return messages.size() >= 3; }));
  loop.RunFor(20ms);
  const std::vector<MediaMessage> expected{media::State{7, 9}, media::State{7, 3},
                                           media::MediaType{7, "audio"}};
  EXPECT_EQ(messages, expected);
  EXPECT_EQ(log.lines, std::vector<std::string>{"2 warming up"});
  EXPECT_TRUE(link->Running());
  EXPECT_TRUE(endedFor.empty());
}

// A media process that stops reading must not make the player hold an
// ever-growing queue: past a bound it is ended, from within Send.
TEST_F(MediaProcessLinkTest, AMediaProcessThatStopsReadingIsEndedOnceTooMuchWaits) {
  Make("deaf", "say hello 1 $$; exec sleep 30");
  link->Start();
  const std::string padding(1000, 'x');
  int sent = 0;
  while (link->Running() && sent < 10000) {
    link->Send(media::Open{static_cast<uint64_t>(++sent), padding});
    if (sent % 50 == 0) loop.RunFor(1ms);
  }
  EXPECT_FALSE(link->Running());
  EXPECT_GT(sent, 256) << "ended before the bound";
  EXPECT_EQ(endedFor, std::vector<std::string>{kUnexpected});
  EXPECT_EQ(log.lines,
            std::vector<std::string>{"3 Media: the media process stopped reading and was ended" +
                                     std::string(kTail)});
}

}  // namespace
}  // namespace tav
