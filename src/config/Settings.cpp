#include "config/Settings.h"

#include "config/LibRegistry.h"
#include "support/Numbers.h"

namespace tav {

namespace {

SettingDescription Describe(const BooleanSetting& s) {
  return {s.section, s.name, "boolean", s.defaultValue ? "true" : "false"};
}
SettingDescription Describe(const LongSetting& s) {
  return {s.section, s.name, "long", std::to_string(s.defaultValue)};
}
SettingDescription Describe(const StringSetting& s) {
  return {s.section, s.name, "string", std::string(s.defaultValue)};
}

}  // namespace

const std::vector<SettingDescription>& KnownSettings() {
  using namespace settings;
  static const std::vector<SettingDescription> all = {
      Describe(kAudioOnly),
      Describe(kDisplayVideos),
      Describe(kDisplayVisualizations),
      Describe(kFullScreenVideo),
      Describe(kMonitorX),
      Describe(kMonitorY),
      Describe(kMonitorDecache),
      Describe(kMonitorDecacheHigh),
      Describe(kMonitorDecacheLow),
      Describe(kMonitorRestart),
      Describe(kMonitorRestartBytesThreshold),
      Describe(kMonitorRestartSecondsThreshold),
      Describe(kMonitorRestartSuppressSeconds),
      Describe(kRemotePort),
      Describe(kRemoteHost),
      Describe(kMaxCommandsPerMessage),
      Describe(kMaxBytesPerMessage),
      Describe(kMaxDatagramSize),
      Describe(kMaxDatagramsPerCycle),
      Describe(kThrottleDatagrams),
      Describe(kAppPath),
      Describe(kUserDataPath),
      Describe(kUseCompressedSequences),
      Describe(kAudioOutput),
      Describe(kAudioDevice),
      Describe(kVideoOutput),
  };
  return all;
}

Settings::Settings(RegistryStore& store, PathDefaults pathDefaults)
    : m_store(store), m_pathDefaults(std::move(pathDefaults)) {}

bool Settings::Get(const BooleanSetting& s) const {
  return GetBooleanSetting(m_store, std::string(s.name), std::string(s.section), s.defaultValue);
}

int32_t Settings::Get(const LongSetting& s) const {
  return GetLongSetting(m_store, std::string(s.name), std::string(s.section), s.defaultValue);
}

std::string Settings::Get(const StringSetting& s) const {
  return GetStringSetting(m_store, std::string(s.name), std::string(s.section),
                          std::string(s.defaultValue));
}

void Settings::Set(const BooleanSetting& s, bool value) {
  SetBooleanSetting(m_store, std::string(s.name), std::string(s.section), value);
}

void Settings::Set(const LongSetting& s, int32_t value) {
  SetLongSetting(m_store, std::string(s.name), std::string(s.section), value);
}

void Settings::Set(const StringSetting& s, const std::string& value) {
  SetStringSetting(m_store, std::string(s.name), std::string(s.section), value);
}

int16_t Settings::MaxCommandsPerMessage() const {
  return ToInt16(Get(settings::kMaxCommandsPerMessage));
}

std::string Settings::NormalisedPath(const StringSetting& setting,
                                     const std::string& fallback) const {
  std::string path = Get(setting);
  if (path.empty()) path = fallback;
  if (path.empty() || path.back() != m_pathDefaults.separator) path += m_pathDefaults.separator;
  return path;
}

const std::string& Settings::AppPath() const {
  if (!m_appPath) m_appPath = NormalisedPath(settings::kAppPath, m_pathDefaults.appFolder);
  return *m_appPath;
}

const std::string& Settings::UserDataPath() const {
  if (!m_userDataPath) {
    m_userDataPath = NormalisedPath(settings::kUserDataPath, m_pathDefaults.userDataFolder);
  }
  return *m_userDataPath;
}

std::string Settings::WeekSchedulePath() const {
  return UserDataPath() + "weeksched." + "tsc";
}

std::string Settings::YearSchedulePath() const {
  return UserDataPath() + "yearsched." + "tsc";
}

}  // namespace tav
