#pragma once
// The program's settings: every value it reads from the registry, each with
// its section, name, type and default, listed once below, and one typed
// accessor for each. Values are read through the store at each use, so a
// change made by another program counts at the next read; only the two
// folder paths are read once and kept for the life of the object.
//
// A value that is there but cannot be read as its setting's type (text
// where a number belongs, "yes" for a boolean, a binary value, a number too
// large) gives the setting's default, so one hand-edited mistake does not
// stop every show; the log hears of it once per setting (a warning, level 2)
// until the value reads again. Failures of the registry itself still raise.
//
// `UseCompressedSequences` lives in the section "Sequences", beside the
// sequence folder settings of the sequence library. The section "Media"
// chooses the media player's outputs: `AudioOutput` and `VideoOutput` name
// mpv outputs ("pulse", "alsa", "null"; "gpu", "drm", "null"), `AudioDevice`
// one of the audio output's devices; empty means mpv's own choice.
//
// Owned by the host; the store and the log must outlive it. The platform
// supplies the folder defaults and separator (PathDefaults), so this stays
// free of the OS.

#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "config/RegistryStore.h"
#include "ports/MessageLog.h"

namespace tav {

struct BooleanSetting {
  std::string_view section;
  std::string_view name;
  bool defaultValue;
};
struct LongSetting {
  std::string_view section;
  std::string_view name;
  int32_t defaultValue;
};
struct StringSetting {
  std::string_view section;
  std::string_view name;
  std::string_view defaultValue;
};

namespace settings {
// clang-format off
inline constexpr BooleanSetting kAudioOnly{"VideoPreferences", "AudioOnly", false};
inline constexpr BooleanSetting kDisplayVideos{"VideoPreferences", "DisplayVideos", true};
inline constexpr BooleanSetting kDisplayVisualizations{"VideoPreferences", "DisplayVisualizations", false};
inline constexpr BooleanSetting kFullScreenVideo{"VideoPreferences", "FullScreenVideo", false};
inline constexpr LongSetting kMonitorX{"VideoPreferences", "MonitorX", 0};
inline constexpr LongSetting kMonitorY{"VideoPreferences", "MonitorY", 0};
inline constexpr BooleanSetting kMonitorDecache{"MonitorMemory", "MonitorDecache", true};
inline constexpr LongSetting kMonitorDecacheHigh{"MonitorMemory", "MonitorDecacheHigh", 1073741824};
inline constexpr LongSetting kMonitorDecacheLow{"MonitorMemory", "MonitorDecacheLow", 943718400};
inline constexpr BooleanSetting kMonitorRestart{"MonitorMemory", "MonitorRestart", true};
inline constexpr LongSetting kMonitorRestartBytesThreshold{"MonitorMemory", "MonitorRestartBytesThreshold", 104857600};
inline constexpr LongSetting kMonitorRestartSecondsThreshold{"MonitorMemory", "MonitorRestartSecondsThreshold", 60};
inline constexpr LongSetting kMonitorRestartSuppressSeconds{"MonitorMemory", "MonitorRestartSuppressSeconds", 300};
inline constexpr LongSetting kRemotePort{"Visualizer", "RemotePort", 30303};
inline constexpr StringSetting kRemoteHost{"Visualizer", "RemoteHost", "127.0.0.1"};
inline constexpr LongSetting kMaxCommandsPerMessage{"Visualizer", "MaxCommandsPerMessage", 999};
inline constexpr LongSetting kMaxBytesPerMessage{"Visualizer", "MaxBytesPerMessage", 9999};
inline constexpr LongSetting kMaxDatagramSize{"Visualizer", "MaxDatagramSize", 65535};
inline constexpr LongSetting kMaxDatagramsPerCycle{"Visualizer", "MaxDatagramsPerCycle", 1};
inline constexpr BooleanSetting kThrottleDatagrams{"Visualizer", "ThrottleDatagrams", false};
inline constexpr StringSetting kAppPath{"", "AppPath", ""};
inline constexpr StringSetting kUserDataPath{"", "UserDataPath", ""};
inline constexpr BooleanSetting kUseCompressedSequences{"Sequences", "UseCompressedSequences", true};
inline constexpr StringSetting kAudioOutput{"Media", "AudioOutput", ""};
inline constexpr StringSetting kAudioDevice{"Media", "AudioDevice", ""};
inline constexpr StringSetting kVideoOutput{"Media", "VideoOutput", ""};
// clang-format on
}  // namespace settings

// One known setting as text, for listings.
struct SettingDescription {
  std::string_view section;
  std::string_view name;
  std::string_view type;  // "boolean", "long" or "string"
  std::string defaultText;
};
// Every setting above, in the order listed.
const std::vector<SettingDescription>& KnownSettings();

// What the platform says about folders: the user data folder to use when
// UserDataPath is empty, the program's own folder for an empty AppPath, and
// the separator that paths end with.
struct PathDefaults {
  std::string userDataFolder;
  std::string appFolder;
  char separator = '/';
};

class Settings {
 public:
  // Warnings about unreadable values go to `log`; none are given without one.
  Settings(RegistryStore& store, PathDefaults pathDefaults, MessageLog* log = nullptr);

  void Set(const BooleanSetting& setting, bool value);
  void Set(const LongSetting& setting, int32_t value);
  void Set(const StringSetting& setting, const std::string& value);

  bool AudioOnly() const { return Get(settings::kAudioOnly); }
  bool DisplayVideos() const { return Get(settings::kDisplayVideos); }
  bool DisplayVisualizations() const { return Get(settings::kDisplayVisualizations); }
  bool FullScreenVideo() const { return Get(settings::kFullScreenVideo); }
  int32_t MonitorX() const { return Get(settings::kMonitorX); }
  int32_t MonitorY() const { return Get(settings::kMonitorY); }
  bool MonitorDecache() const { return Get(settings::kMonitorDecache); }
  int32_t MonitorDecacheHigh() const { return Get(settings::kMonitorDecacheHigh); }
  int32_t MonitorDecacheLow() const { return Get(settings::kMonitorDecacheLow); }
  bool MonitorRestart() const { return Get(settings::kMonitorRestart); }
  int32_t MonitorRestartBytesThreshold() const {
    return Get(settings::kMonitorRestartBytesThreshold);
  }
  int32_t MonitorRestartSecondsThreshold() const {
    return Get(settings::kMonitorRestartSecondsThreshold);
  }
  int32_t MonitorRestartSuppressSeconds() const {
    return Get(settings::kMonitorRestartSuppressSeconds);
  }
  int32_t RemotePort() const { return Get(settings::kRemotePort); }
  std::string RemoteHost() const { return Get(settings::kRemoteHost); }
  // Kept as a 16-bit number: a value outside it cannot be read.
  int16_t MaxCommandsPerMessage() const;
  int32_t MaxBytesPerMessage() const { return Get(settings::kMaxBytesPerMessage); }
  int32_t MaxDatagramSize() const { return Get(settings::kMaxDatagramSize); }
  int32_t MaxDatagramsPerCycle() const { return Get(settings::kMaxDatagramsPerCycle); }
  bool ThrottleDatagrams() const { return Get(settings::kThrottleDatagrams); }
  bool UseCompressedSequences() const { return Get(settings::kUseCompressedSequences); }
  std::string AudioOutput() const { return Get(settings::kAudioOutput); }
  std::string AudioDevice() const { return Get(settings::kAudioDevice); }
  std::string VideoOutput() const { return Get(settings::kVideoOutput); }

  // Read at the first call, ending with the separator. An empty AppPath is
  // the program's folder; an empty UserDataPath the platform's user data
  // folder.
  const std::string& AppPath() const;
  const std::string& UserDataPath() const;
  // UserDataPath + "weeksched." + "tsc" and UserDataPath + "yearsched." + "tsc".
  std::string WeekSchedulePath() const;
  std::string YearSchedulePath() const;

 private:
  bool Get(const BooleanSetting& setting) const;
  int32_t Get(const LongSetting& setting) const;
  std::string Get(const StringSetting& setting) const;
  // The stored value read by `convert`; the default when there is none or
  // when it cannot be read (warned about once).
  template <typename T>
  T Read(std::string_view section, std::string_view name, T defaultValue,
         T (*convert)(const RegistryValue&), const std::string& defaultText) const;
  std::string NormalisedPath(const StringSetting& setting, const std::string& fallback) const;

  RegistryStore& m_store;
  PathDefaults m_pathDefaults;
  MessageLog* m_log;
  // "section\name" of the settings warned about while unreadable.
  mutable std::set<std::string> m_warned;
  mutable std::optional<std::string> m_appPath;
  mutable std::optional<std::string> m_userDataPath;
};

}  // namespace tav
