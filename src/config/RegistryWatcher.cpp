#include "config/RegistryWatcher.h"

#include "config/LibRegistry.h"
#include "support/Error.h"

namespace tav {

RegistryWatcher::RegistryWatcher(TimerService& timers, RegistryStore& store)
    : m_store(store),
      m_tmrCheckRegistry(timers.CreateTimer("tmrCheckRegistry", kDefaultCheckInterval, true,
                                            [this] { tmrCheckRegistry_Timer(); })) {}

void RegistryWatcher::SetCheckInterval(int32_t milliseconds) {
  if (milliseconds < 0) return;
  if (milliseconds == 0) {
    m_tmrCheckRegistry->SetEnabled(false);
    return;
  }
  m_tmrCheckRegistry->SetInterval(static_cast<uint32_t>(milliseconds));
}

void RegistryWatcher::SetEnabled(bool enabled) {
  m_tmrCheckRegistry->SetEnabled(enabled);
}

std::string RegistryWatcher::ReadWatchedValue(const std::string& key,
                                              const std::string& value) const {
  std::optional<RegistryValue> stored =
      RegistryGetStoredValue(m_store, SharedSettingsKey(key), value);
  if (!stored) return "";
  try {
    return StringSettingOf(*stored);
  } catch (const Error&) {
    return "";  // a value of another type has no text to watch
  }
}

bool RegistryWatcher::EnableTheWatch() {
  if (m_subroutine.empty() || !m_object) return false;
  if (Armed()) return false;
  m_armedValue = m_value;
  m_armedKey = m_key;
  m_armedSubroutine = m_subroutine;
  m_armedObject = m_object;
  m_lastValue = ReadWatchedValue(m_armedKey, m_armedValue);
  if (!m_lastValue.empty()) return true;
  // A value that does not exist yet cannot be watched.
  m_armedKey.clear();
  return false;
}

void RegistryWatcher::DeleteWatch() {
  m_armedObject.reset();
  m_armedSubroutine.clear();
  m_armedKey.clear();
  m_armedValue.clear();
  m_lastValue.clear();
}

void RegistryWatcher::tmrCheckRegistry_Timer() {
  if (!Armed()) return;
  std::string current = ReadWatchedValue(m_armedKey, m_armedValue);
  if (current.empty() || current == m_lastValue) return;
  // Keep the object alive through the call even if the callback deletes
  // the watch.
  std::shared_ptr<CallableByName> object = m_armedObject;
  object->CallByName(m_armedSubroutine);
  if (Armed()) m_lastValue = current;
}

}  // namespace tav
