#include "SimulatedMediaPlayer.h"

#include <algorithm>
#include <array>
#include <cctype>

namespace tav::simulation {
namespace {

std::string BaseName(const std::string& path) {
  auto slash = path.find_last_of("/\\");
  return slash == std::string::npos ? path : path.substr(slash + 1);
}

// The media type the real player would report, by the usual extensions of
// video files; anything else plays as audio.
std::string MediaTypeOf(const std::string& path) {
  static constexpr std::array<const char*, 9> kVideo = {"mp4", "m4v",  "mkv", "mov", "avi",
                                                        "wmv", "webm", "mpg", "mpeg"};
  auto dot = path.find_last_of('.');
  if (dot == std::string::npos) return "audio";
  std::string ext = path.substr(dot + 1);
  for (char& c : ext) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  bool video = std::any_of(kVideo.begin(), kVideo.end(), [&](const char* v) { return ext == v; });
  return video ? "video" : "audio";
}

}  // namespace

SimulatedMediaPlayer::SimulatedMediaPlayer(const Clock& clock, TimerService& timers,
                                           std::shared_ptr<const FileSystem> files,
                                           OnOpened onOpened)
    : ScriptedMediaPlayer(clock, timers),
      m_files(std::move(files)),
      m_onOpened(std::move(onOpened)) {}

void SimulatedMediaPlayer::OpenMedia(const std::string& path) {
  MediaLength length = ProbeMediaLength(*m_files, path);
  MediaScript script;
  script.mediaType = MediaTypeOf(path);
  switch (length.found) {
    case MediaLength::Found::kSeconds:
      script.durationSeconds = length.seconds;
      break;
    case MediaLength::Found::kUnknown:
      script.durationSeconds = kOpenEndedSeconds;
      break;
    case MediaLength::Found::kMissing:
    case MediaLength::Found::kUnreadable:
      script.loadErrors = {"Cannot play \"" + path + "\": " + length.source};
      break;
  }
  // Scripts go by base name; this one is set for this opening only.
  Script(BaseName(path), std::move(script));
  if (m_onOpened) m_onOpened(path, length);
  ScriptedMediaPlayer::OpenMedia(path);
}

}  // namespace tav::simulation
