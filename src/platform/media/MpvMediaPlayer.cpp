#include "platform/media/MpvMediaPlayer.h"

#include <mpv/client.h>

#include <asio.hpp>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <initializer_list>
#include <optional>
#include <string_view>
#include <vector>

#include "platform/media/MediaClock.h"
#include "platform/media/MediaPlayState.h"
#include "support/Error.h"

// Playlist entry ids in the loadfile reply and the start/end events.
static_assert(MPV_CLIENT_API_VERSION >= MPV_MAKE_VERSION(1, 108), "libmpv 0.33 or later needed");

namespace tav {
namespace {

constexpr const char* kSource = "MpvMediaPlayer";
using SteadyClock = std::chrono::steady_clock;

// Observed properties, by the id mpv hands back with each change.
enum Observed : uint64_t { kTimePos = 1, kCurrentAudioOutput = 2 };

// mpv holds a file between opening it and playing it until we let go, so
// that what it holds is known before a short file can have ended.
constexpr const char* kOpenedHook = "on_preloaded";

const mpv_node* MapValue(const mpv_node& map, std::string_view key) {
  if (map.format != MPV_FORMAT_NODE_MAP) return nullptr;
  for (int i = 0; i < map.u.list->num; ++i) {
    if (key == map.u.list->keys[i]) return &map.u.list->values[i];
  }
  return nullptr;
}

// "video" when one of the tracks is a video that is not a picture attached
// to the music (cover art); "audio" otherwise.
std::string MediaTypeOfTracks(const mpv_node& tracks) {
  if (tracks.format != MPV_FORMAT_NODE_ARRAY) return "audio";
  for (int i = 0; i < tracks.u.list->num; ++i) {
    const mpv_node& track = tracks.u.list->values[i];
    const mpv_node* type = MapValue(track, "type");
    const mpv_node* albumArt = MapValue(track, "albumart");
    bool isVideo =
        type && type->format == MPV_FORMAT_STRING && std::string_view(type->u.string) == "video";
    bool isArt = albumArt && albumArt->format == MPV_FORMAT_FLAG && albumArt->u.flag;
    if (isVideo && !isArt) return "video";
  }
  return "audio";
}

bool HasDisplay() {
  for (const char* name : {"DISPLAY", "WAYLAND_DISPLAY"}) {
    const char* value = std::getenv(name);
    if (value && *value) return true;
  }
  return false;
}

// mpv says "loading failed" for a file that is not there; say it plainly.
std::string FailureReason(const std::string& path, int mpvError) {
  if (mpvError == MPV_ERROR_LOADING_FAILED && path.find("://") == std::string::npos) {
    std::error_code ignored;
    if (!std::filesystem::exists(std::filesystem::u8path(path), ignored)) return "file not found";
  }
  return mpv_error_string(mpvError);
}

std::string DescribeAudioOutput(const MpvOutputs& outputs) {
  std::string text =
      outputs.audioOutput.empty() ? "mpv's default output" : "output " + outputs.audioOutput;
  if (!outputs.audioDevice.empty()) text += ", device " + outputs.audioDevice;
  return text;
}

}  // namespace

struct MpvMediaPlayer::Impl : std::enable_shared_from_this<Impl> {
  Impl(EventLoop& loop, MessageLog& log)
      : loop(loop), log(log), plays(loop, log, kSource), tailTimer(loop.Context()) {}

  // What mpv's threads see of us: the wakeup callback posts a drain to the
  // loop, with a weak reference so that a drain arriving after we are gone
  // does nothing. Both fields are set before the callback is installed.
  struct Wakeup {
    EventLoop* loop = nullptr;
    std::weak_ptr<Impl> impl;
  };
  static void OnWakeup(void* data) noexcept;

  void Start(const MpvOutputs& outputs);
  void Close();
  void SetOption(const char* name, const std::string& value, const char* settingName);

  void Drain();
  void Handle(const mpv_event& event);
  void OnLoadReply(const mpv_event& event);
  void OnFileOpened(uint64_t hookId);
  void OnStartFile(int64_t entry);
  void OnEndFile(const mpv_event_end_file& end);
  void OnProperty(uint64_t id, const mpv_event_property& property);
  void FinishWhenSilent();
  void Finish();
  void Fail(const std::string& reason);
  void BeginNewPlay();

  void NotifyClock();

  void SetPropertyAsync(const char* name, const std::string& value);
  int CommandAsync(std::initializer_list<const char*> words, uint64_t tag = 0);

  EventLoop& loop;
  MessageLog& log;
  mpv_handle* handle = nullptr;
  bool coreGone = false;
  std::unique_ptr<Wakeup> wakeup;
  MpvOutputs outputs;

  // The play the engine asked for last: its state, its generation (bumped
  // by every OpenMedia and Stop; the loadfile command carries it, so that the
  // answer to a superseded load is known), mpv's playlist entry for it (-1
  // until mpv answers), and whether that entry is being played.
  MediaPlayState plays;
  int64_t entryId = -1;
  bool entryLive = false;
  int64_t startedId = -1;  // the entry of mpv's latest start-file
  std::optional<mpv_event_end_file> lastEnd;

  std::string path;
  std::string mediaType;
  MediaClock clock;
  asio::steady_timer tailTimer;

  std::string shownVideoOutput;  // mpv's "vo" while the form is shown
  bool hasVideoOutput = true;
  bool videoShown = false;
  std::string geometry;
  bool fellBackToNull = false;
  bool switchedToNull = false;

  std::function<void(const MediaClock&)> onClockChange;
};

void MpvMediaPlayer::Impl::OnWakeup(void* data) noexcept {
  auto* target = static_cast<Wakeup*>(data);
  try {
    target->loop->Post([impl = target->impl] {
      if (auto self = impl.lock()) self->Drain();
    });
  } catch (...) {
    // Out of memory: nothing more can be done on mpv's thread, and nothing
    // may be thrown into it.
  }
}

void MpvMediaPlayer::Impl::SetOption(const char* name, const std::string& value,
                                     const char* settingName) {
  int result = mpv_set_option_string(handle, name, value.c_str());
  if (result < 0) {
    log.LogMessage(2, std::string("Media: ignoring ") + settingName + " \"" + value +
                          "\": " + mpv_error_string(result));
  }
}

void MpvMediaPlayer::Impl::Start(const MpvOutputs& wanted) {
  outputs = wanted;
  handle = mpv_create();
  if (!handle) throw Error(kMediaPlayerUnavailable, kSource, "Cannot start the media player (mpv)");

  // A player, not a desktop application: no scripts, no key bindings, no
  // configuration files, no on-screen display, no cover art as video. The
  // video form is hidden until shown: hidden, the video plays to the null
  // output (its clock runs; a video without sound would not play at all if
  // its track were switched off instead).
  static constexpr std::pair<const char*, const char*> kFixed[] = {
      {"config", "no"},
      {"terminal", "no"},
      {"load-scripts", "no"},
      {"ytdl", "no"},
      {"osc", "no"},
      {"load-stats-overlay", "no"},  // each built-in script is a thread with a Lua state
      {"load-osd-console", "no"},
      {"load-auto-profiles", "no"},
      {"input-default-bindings", "no"},
      {"input-vo-keyboard", "no"},
      {"osd-level", "0"},
      {"audio-display", "no"},
      {"sub-auto", "no"},
      {"idle", "yes"},
      {"keep-open", "no"},
      {"force-window", "no"},
      {"vo", "null"},
      {"audio-fallback-to-null", "yes"},
      {"audio-client-name", "showplayer"},
      {"title", "Show player"},
      {"cursor-autohide", "always"},
  };
  for (const auto& [name, value] : kFixed) mpv_set_option_string(handle, name, value);

  if (!outputs.audioOutput.empty()) SetOption("ao", outputs.audioOutput, "AudioOutput");
  if (!outputs.audioDevice.empty()) SetOption("audio-device", outputs.audioDevice, "AudioDevice");
  shownVideoOutput = outputs.videoOutput;
  if (shownVideoOutput.empty() && !HasDisplay()) {
    // mpv would probe every output it knows (and find a useless one).
    shownVideoOutput = "null";
    log.LogMessage(1, "Media: no display, so videos are not shown");
  }
  hasVideoOutput = shownVideoOutput != "null";

  int result = mpv_initialize(handle);
  if (result < 0) {
    mpv_terminate_destroy(handle);
    handle = nullptr;
    throw Error(kMediaPlayerUnavailable, kSource,
                std::string("Cannot start the media player: ") + mpv_error_string(result));
  }
  mpv_observe_property(handle, kTimePos, "time-pos", MPV_FORMAT_DOUBLE);
  mpv_observe_property(handle, kCurrentAudioOutput, "current-ao", MPV_FORMAT_STRING);
  mpv_hook_add(handle, 0, kOpenedHook, 0);

  wakeup = std::make_unique<Wakeup>();
  wakeup->loop = &loop;
  wakeup->impl = weak_from_this();
  mpv_set_wakeup_callback(handle, &Impl::OnWakeup, wakeup.get());
}

void MpvMediaPlayer::Impl::Close() {
  tailTimer.cancel();
  plays.Silence();
  onClockChange = nullptr;
  if (!handle) return;
  // Returns only when no callback runs any more, so mpv never sees the
  // wakeup target after this.
  mpv_set_wakeup_callback(handle, nullptr, nullptr);
  mpv_terminate_destroy(handle);
  handle = nullptr;
}

void MpvMediaPlayer::Impl::SetPropertyAsync(const char* name, const std::string& value) {
  const char* text = value.c_str();
  mpv_set_property_async(handle, 0, name, MPV_FORMAT_STRING, &text);
}

int MpvMediaPlayer::Impl::CommandAsync(std::initializer_list<const char*> words, uint64_t tag) {
  std::vector<const char*> args(words);
  args.push_back(nullptr);
  return mpv_command_async(handle, tag, args.data());
}

void MpvMediaPlayer::Impl::Drain() {
  while (handle && !coreGone) {
    mpv_event* event = mpv_wait_event(handle, 0);
    if (event->event_id == MPV_EVENT_NONE) break;
    Handle(*event);
  }
}

void MpvMediaPlayer::Impl::Handle(const mpv_event& event) {
  switch (event.event_id) {
    case MPV_EVENT_COMMAND_REPLY:
      if (event.reply_userdata == plays.Generation()) OnLoadReply(event);
      break;
    case MPV_EVENT_START_FILE:
      OnStartFile(static_cast<const mpv_event_start_file*>(event.data)->playlist_entry_id);
      break;
    case MPV_EVENT_HOOK:
      OnFileOpened(static_cast<const mpv_event_hook*>(event.data)->id);
      break;
    case MPV_EVENT_PLAYBACK_RESTART:
      if (entryLive && plays.State() == kTransitioning) {
        if (mediaType.empty()) mediaType = "audio";  // the hook was missed: mpv too old?
        clock.Run(SteadyClock::now());
        NotifyClock();
        plays.SetState(kMediaPlaying);
      }
      break;
    case MPV_EVENT_END_FILE:
      OnEndFile(*static_cast<const mpv_event_end_file*>(event.data));
      break;
    case MPV_EVENT_PROPERTY_CHANGE:
      OnProperty(event.reply_userdata, *static_cast<const mpv_event_property*>(event.data));
      break;
    case MPV_EVENT_SHUTDOWN:
      // Only a quit command ends mpv's core, and nothing here sends one.
      // mpv repeats this event at every read: read no more. From now on
      // every file fails with mpv's reason.
      coreGone = true;
      log.LogMessage(3, "Media: mpv has shut down; media cannot be played until restart");
      if (plays.State() != kMediaStopped) Fail("mpv has shut down");
      break;
    default:
      break;
  }
}

void MpvMediaPlayer::Impl::OnLoadReply(const mpv_event& event) {
  if (event.error < 0) {
    Fail(mpv_error_string(event.error));
    return;
  }
  const auto& reply = *static_cast<const mpv_event_command*>(event.data);
  const mpv_node* entry = MapValue(reply.result, "playlist_entry_id");
  if (!entry || entry->format != MPV_FORMAT_INT64) {
    Fail("mpv did not say which playlist entry it loaded");
    return;
  }
  entryId = entry->u.int64;
  if (startedId == entryId) entryLive = true;
  // mpv answers before it starts the entry; should the start or even the
  // end have come first, they are not lost.
  if (lastEnd && lastEnd->playlist_entry_id == entryId) OnEndFile(*lastEnd);
}

// mpv's core waits in the hook, serving requests, until it is continued:
// these reads are answered at once, and the file cannot go on (or end)
// before its media type and length are known.
void MpvMediaPlayer::Impl::OnFileOpened(uint64_t hookId) {
  if (entryLive) {
    mpv_node tracks{};
    if (mpv_get_property(handle, "track-list", MPV_FORMAT_NODE, &tracks) >= 0) {
      mediaType = MediaTypeOfTracks(tracks);
      mpv_free_node_contents(&tracks);
    } else {
      mediaType = "audio";
    }
    double duration = 0;
    if (mpv_get_property(handle, "duration", MPV_FORMAT_DOUBLE, &duration) >= 0) {
      clock.SetEnd(duration);
      NotifyClock();
    }
  }
  mpv_hook_continue(handle, hookId);
}

void MpvMediaPlayer::Impl::OnStartFile(int64_t entry) {
  startedId = entry;
  if (entry == entryId) entryLive = true;
}

void MpvMediaPlayer::Impl::OnEndFile(const mpv_event_end_file& end) {
  lastEnd = end;
  if (entryId < 0 || end.playlist_entry_id != entryId) return;
  entryLive = false;
  entryId = -1;
  switch (end.reason) {
    case MPV_END_FILE_REASON_EOF:
      FinishWhenSilent();
      break;
    case MPV_END_FILE_REASON_ERROR:
      Fail(FailureReason(path, end.error));
      break;
    case MPV_END_FILE_REASON_REDIRECT:
      // A playlist: mpv would go on to its entries on its own.
      CommandAsync({"stop"});
      Fail("a playlist, not a media file");
      break;
    default:
      Finish();
      break;
  }
}

// mpv ends a file when the last sound has been handed to the audio output,
// a fraction of a second before it is heard; the lights follow what is
// heard, so the play state turns to stopped when the position reaches the
// end.
void MpvMediaPlayer::Impl::FinishWhenSilent() {
  double remaining = plays.State() == kMediaPlaying ? clock.Remaining(SteadyClock::now()) : 0;
  if (remaining <= 0) {
    Finish();
    return;
  }
  tailTimer.expires_after(
      std::chrono::duration_cast<SteadyClock::duration>(std::chrono::duration<double>(remaining)));
  tailTimer.async_wait(
      [weak = weak_from_this(), forGeneration = plays.Generation()](const asio::error_code& error) {
        auto self = weak.lock();
        if (error || !self || self->plays.Generation() != forGeneration) return;
        self->Finish();
      });
}

void MpvMediaPlayer::Impl::Finish() {
  clock.Reset();
  plays.SetState(kMediaStopped);
}

void MpvMediaPlayer::Impl::Fail(const std::string& reason) {
  entryLive = false;
  entryId = -1;
  tailTimer.cancel();
  clock.Reset();
  plays.Fail("Cannot play \"" + path + "\": " + reason);
}

void MpvMediaPlayer::Impl::OnProperty(uint64_t id, const mpv_event_property& property) {
  auto now = SteadyClock::now();
  if (id == kTimePos && entryLive && property.format == MPV_FORMAT_DOUBLE) {
    clock.Report(*static_cast<const double*>(property.data), now);
    NotifyClock();
  } else if (id == kCurrentAudioOutput && property.format == MPV_FORMAT_STRING) {
    std::string_view current = *static_cast<const char* const*>(property.data);
    if (current == "null" && outputs.audioOutput != "null" && !fellBackToNull) {
      fellBackToNull = true;
      log.LogMessage(2, "Media: the sound device could not be opened (" +
                            DescribeAudioOutput(outputs) + "); playing without sound");
    }
  }
}

void MpvMediaPlayer::Impl::BeginNewPlay() {
  plays.BeginPlay();
  entryId = -1;
  entryLive = false;
  tailTimer.cancel();
  clock.Reset();
}

void MpvMediaPlayer::Impl::NotifyClock() {
  if (onClockChange) onClockChange(clock);
}

MpvMediaPlayer::MpvMediaPlayer(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs)
    : m_impl(std::make_shared<Impl>(loop, log)) {
  m_impl->Start(outputs);
}

MpvMediaPlayer::~MpvMediaPlayer() {
  m_impl->Close();
}

void MpvMediaPlayer::OpenMedia(const std::string& path) {
  Impl& p = *m_impl;
  p.BeginNewPlay();
  p.path = path;
  p.mediaType.clear();
  if (p.fellBackToNull && !p.switchedToNull) {
    // Stop probing a device that is not there (each try costs time and
    // noise on standard error); the switch waits for a new file so that
    // what plays is not interrupted.
    p.SetPropertyAsync("ao", "null");
    p.switchedToNull = true;
  }
  p.plays.SetState(kTransitioning);
  int result = p.CommandAsync({"loadfile", path.c_str(), "replace"}, p.plays.Generation());
  if (result < 0) p.Fail(mpv_error_string(result));
}

void MpvMediaPlayer::Stop() {
  Impl& p = *m_impl;
  p.BeginNewPlay();
  p.CommandAsync({"stop"});
  p.plays.SetState(kMediaStopped);
}

std::string MpvMediaPlayer::CurrentMediaItemInfo(const std::string& attribute) const {
  if (attribute == "MediaType") return m_impl->mediaType;
  if (attribute == "SourceURL") return m_impl->path;
  return "";
}

double MpvMediaPlayer::CurrentPosition() const {
  return m_impl->clock.Position(SteadyClock::now());
}

int32_t MpvMediaPlayer::PlayState() const {
  return m_impl->plays.State();
}

void MpvMediaPlayer::SetFullScreen(bool value) {
  m_impl->SetPropertyAsync("fullscreen", value ? "yes" : "no");
}

int32_t MpvMediaPlayer::ErrorCount() const {
  return m_impl->plays.ErrorCount();
}

std::string MpvMediaPlayer::ErrorDescription(int32_t index) const {
  return m_impl->plays.ErrorDescription(index);
}

void MpvMediaPlayer::ClearErrorQueue() {
  m_impl->plays.ClearErrorQueue();
}

void MpvMediaPlayer::ShowVideoForm(int32_t x, int32_t y) {
  Impl& p = *m_impl;
  if (!p.hasVideoOutput) return;
  std::string geometry = "+" + std::to_string(x) + "+" + std::to_string(y);
  bool moved = geometry != p.geometry;
  if (moved) {
    p.geometry = geometry;
    p.SetPropertyAsync("geometry", geometry);
  }
  // A window is placed when it is made: moving a shown one makes it anew.
  if (p.videoShown && moved) p.SetPropertyAsync("vo", "null");
  if (!p.videoShown || moved) p.SetPropertyAsync("vo", p.shownVideoOutput);
  p.videoShown = true;
}

void MpvMediaPlayer::HideVideoForm() {
  Impl& p = *m_impl;
  if (!p.hasVideoOutput || !p.videoShown) return;
  p.SetPropertyAsync("vo", "null");
  p.videoShown = false;
}

void MpvMediaPlayer::SetOnPlayStateChange(std::function<void(int32_t)> handler) {
  m_impl->plays.SetOnPlayStateChange(std::move(handler));
}

void MpvMediaPlayer::SetOnMediaError(std::function<void()> handler) {
  m_impl->plays.SetOnMediaError(std::move(handler));
}

void MpvMediaPlayer::SetOnClockChange(std::function<void(const MediaClock&)> handler) {
  m_impl->onClockChange = std::move(handler);
}

bool MpvMediaPlayer::HasVideoOutput() const {
  return m_impl->hasVideoOutput;
}

bool MpvMediaPlayer::FellBackToNullAudio() const {
  return m_impl->fellBackToNull;
}

}  // namespace tav
