#pragma once
// Which mpv outputs play the media, from the settings' "Media" section, and
// the error of a media player that cannot start. Both the media player on
// libmpv and the player's side of the media process (which hands the outputs
// on) use them; neither needs libmpv.

#include <cstdint>
#include <string>

namespace tav {

// The error number when the media player cannot be started at all.
constexpr int32_t kMediaPlayerUnavailable = 429;

class Settings;

struct MpvOutputs {
  std::string audioOutput;  // mpv's "ao": "pulse", "alsa", "null"; empty: mpv's default
  std::string audioDevice;  // mpv's "audio-device"; empty: the output's default
  std::string videoOutput;  // mpv's "vo": "gpu", "drm", "null" (none); empty: mpv's default

  static MpvOutputs FromSettings(const Settings& settings);

  bool operator==(const MpvOutputs&) const = default;
};

}  // namespace tav
