#pragma once
// Polls one registry string value and, when its text changes, calls a named
// operation on a given object. The show engine arms it on the network
// settings' "Ver" value so that changes made by the tray's configuration
// tools are applied without a restart.
//
// The watched key is resolved as the string setting getter resolves a
// section: below HKEY_CURRENT_USER\Software\Tessavar\Shared. A value that is
// missing, empty or of a type that holds no text (binary, say) never
// triggers the call and does not replace the last text seen; a number reads
// as its decimal text. A failure inside the callback propagates out of the tick, and
// the last text is then left alone, so the call is repeated on the next tick.
//
// Setters only store; EnableTheWatch copies them into the armed watch that
// the timer works with. The watcher keeps its call object alive while armed;
// DeleteWatch releases it (the owner should do so before it goes, as the
// object is usually the owner's own owner). The store and the timer service
// must outlive the watcher.

#include <cstdint>
#include <memory>
#include <string>

#include "config/CallableByName.h"
#include "config/RegistryStore.h"
#include "ports/TimerService.h"

namespace tav {

class RegistryWatcher {
 public:
  static constexpr uint32_t kDefaultCheckInterval = 1000;

  RegistryWatcher(TimerService& timers, RegistryStore& store);

  // Negative: ignored. 0: stops the timer. Otherwise the timer's interval.
  void SetCheckInterval(int32_t milliseconds);
  void SetEnabled(bool enabled);
  void SetWatchRegistryKey(const std::string& key) { m_key = key; }
  void SetWatchRegistryValue(const std::string& value) { m_value = value; }
  void SetCallObject(std::shared_ptr<CallableByName> object) { m_object = std::move(object); }
  void SetCallSubroutine(const std::string& name) { m_subroutine = name; }

  // True when the watch is armed. False, changing nothing, without a
  // subroutine or object, or when already armed (DeleteWatch first); false,
  // leaving it unarmed, when the value has no text yet.
  bool EnableTheWatch();
  void DeleteWatch();

  // Armed while the armed key is not empty: a watch on a value directly
  // under the Shared key (empty key) reports success but never polls.
  bool Armed() const { return !m_armedKey.empty(); }
  const std::string& LastValue() const { return m_lastValue; }
  const Timer& CheckTimer() const { return *m_tmrCheckRegistry; }

 private:
  void tmrCheckRegistry_Timer();
  std::string ReadWatchedValue(const std::string& key, const std::string& value) const;

  RegistryStore& m_store;
  std::string m_key;
  std::string m_value;
  std::shared_ptr<CallableByName> m_object;
  std::string m_subroutine;
  std::string m_armedKey;
  std::string m_armedValue;
  std::shared_ptr<CallableByName> m_armedObject;
  std::string m_armedSubroutine;
  std::string m_lastValue;
  std::unique_ptr<Timer> m_tmrCheckRegistry;
};

}  // namespace tav
