// The media glue on its own: error texts, and the video form as the video
// preferences say.

#include "show/MediaGlue.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "config/MemoryRegistryStore.h"
#include "ports/testing/ManualClock.h"
#include "ports/testing/RecordingMessageLog.h"
#include "ports/testing/VirtualTimerService.h"
#include "show/testing/ScriptedMediaPlayer.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

class MediaGlueTest : public ::testing::Test {
 protected:
  MediaGlueTest() { clock.Follow(timers); }
  MediaGlue& Make() {
    glue = std::make_unique<MediaGlue>(settings);
    glue->SetControls(&player, &log);
    return *glue;
  }
  // Opens a file and lets its events arrive; returns the form calls.
  std::vector<std::string> Play(const std::string& file, const std::string& type) {
    player.Script(file, {30.0, type, {}, {}});
    player.SetOnPlayStateChange([this](int32_t state) { glue->OnPlayStateChange(state); });
    timeline.Clear();
    player.OpenMedia("/media/" + file);
    timers.Advance(1);
    return timeline.Texts("media S");  // ShowVideoForm, SetFullScreen
  }

  VirtualTimerService timers;
  ManualClock clock;
  Timeline timeline;
  ScriptedMediaPlayer player{clock, timers, &timeline};
  MemoryRegistryStore registry;
  Settings settings{registry, PathDefaults{}};
  RecordingMessageLog log;
  std::unique_ptr<MediaGlue> glue;
};

TEST_F(MediaGlueTest, ErrorTextNamesEveryQueuedErrorOrNone) {
  MediaGlue& g = Make();
  EXPECT_EQ(g.MediaErrorText(), "Error playing media file");
  player.RaiseMediaError({"Cannot open", "Codec missing"});
  EXPECT_EQ(g.MediaErrorText(), "Error playing media file: Cannot open / Codec missing");
  EXPECT_EQ(player.ErrorCount(), 0);  // read and cleared
  player.RaiseMediaError({"Once more"});
  EXPECT_EQ(g.MediaErrorText(), "Error playing media file: Once more");
  player.FailErrorQueue(true);
  EXPECT_EQ(g.MediaErrorText(), "Unexpected error playing media file");
}

TEST_F(MediaGlueTest, AMediaErrorIsLoggedInItsExactShape) {
  Make();
  player.SetOnMediaError([this] { glue->OnMediaError(); });
  player.RaiseMediaError({});
  player.RaiseMediaError({"Cannot open"});
  EXPECT_THAT(log.lines, ElementsAre("3 WINDOWS MEDIA PLAYER ERROR (Error playing media file): ",
                                     "3 WINDOWS MEDIA PLAYER ERROR (Error playing media file: "
                                     "Cannot open): "));
}

TEST_F(MediaGlueTest, TheVideoFormFollowsTheVideoPreferences) {
  struct Case {
    bool displayVideos, displayVisualizations, audioOnly;
    std::string type;
    bool shown;
  };
  const Case cases[] = {
      {true, false, false, "video", true}, {false, true, false, "video", false},
      {false, true, false, "audio", true}, {true, false, false, "audio", false},
      {true, true, true, "video", false},  {true, true, false, "playlist", true},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.type + (c.displayVideos ? " videos" : "") +
                 (c.displayVisualizations ? " visualizations" : "") +
                 (c.audioOnly ? " audio only" : ""));
    settings.Set(settings::kDisplayVideos, c.displayVideos);
    settings.Set(settings::kDisplayVisualizations, c.displayVisualizations);
    settings.Set(settings::kAudioOnly, c.audioOnly);
    settings.Set(settings::kMonitorX, 1920);
    settings.Set(settings::kMonitorY, 40);
    settings.Set(settings::kFullScreenVideo, true);
    player.HideVideoForm();
    Make();
    std::vector<std::string> calls = Play("clip", c.type);
    EXPECT_EQ(player.FormShown(), c.shown);
    if (c.shown) {
      EXPECT_THAT(calls, ElementsAre("media ShowVideoForm(1920, 40)", "media SetFullScreen(true)"));
    } else {
      EXPECT_THAT(calls, IsEmpty());
    }
  }
}

TEST_F(MediaGlueTest, HidingAHiddenFormCostsNothing) {
  MediaGlue& g = Make();
  timeline.Clear();
  for (int i = 0; i < 3; ++i) g.HideVideoForm();
  EXPECT_THAT(timeline.Texts(), ElementsAre("media HideVideoForm()"));
}

TEST(MediaPosition, IsRoundedToWholeMillisecondsHalvesToEven) {
  EXPECT_EQ(MediaPositionMs(1.2344), 1234);
  EXPECT_EQ(MediaPositionMs(1.2346), 1235);
  EXPECT_EQ(MediaPositionMs(0.0025), 2);
  EXPECT_EQ(MediaPositionMs(0.0035), 4);
  EXPECT_EQ(MediaPositionMs(-1.0), 0);
}

}  // namespace
}  // namespace tav
