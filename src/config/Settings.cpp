#include "config/Settings.h"

#include "config/LibRegistry.h"
#include "support/Error.h"
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

Settings::Settings(RegistryStore& store, PathDefaults pathDefaults, MessageLog* log)
    : m_store(store), m_pathDefaults(std::move(pathDefaults)), m_log(log) {}

template <typename T>
T Settings::Read(std::string_view section, std::string_view name, T defaultValue,
                 T (*convert)(const RegistryValue&), const std::string& defaultText) const {
  std::string where =
      section.empty() ? std::string(name) : std::string(section) + "\\" + std::string(name);
  std::optional<RegistryValue> value =
      RegistryGetStoredValue(m_store, SharedSettingsKey(section), std::string(name));
  if (!value) {
    m_warned.erase(where);
    return defaultValue;
  }
  try {
    T result = convert(*value);
    m_warned.erase(where);
    return result;
  } catch (const Error& e) {
    if (m_warned.insert(where).second && m_log) {
      m_log->LogMessage(2, "Setting " + where + " cannot be read (" + e.Description() +
                               "); using its default " + defaultText);
    }
    return defaultValue;
  }
}

bool Settings::Get(const BooleanSetting& s) const {
  return Read<bool>(s.section, s.name, s.defaultValue, BooleanSettingOf, Describe(s).defaultText);
}

int32_t Settings::Get(const LongSetting& s) const {
  return Read<int32_t>(s.section, s.name, s.defaultValue, LongSettingOf, Describe(s).defaultText);
}

std::string Settings::Get(const StringSetting& s) const {
  return Read<std::string>(s.section, s.name, std::string(s.defaultValue), StringSettingOf,
                           "\"" + std::string(s.defaultValue) + "\"");
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
  const LongSetting& s = settings::kMaxCommandsPerMessage;
  return Read<int16_t>(
      s.section, s.name, static_cast<int16_t>(s.defaultValue),
      [](const RegistryValue& value) { return ToInt16(LongSettingOf(value)); },
      Describe(s).defaultText);
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
