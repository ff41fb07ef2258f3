#pragma once
// Opening the lighting networks through the hardware-I/O control: the TAV
// networks at once (with the DMX side the preferences describe), X10 and
// Fennick only when a sequence first needs them, and the TAV settings again
// whenever another program announces a new configuration in the registry.
//
// Owns the network preferences, loaded from the registry when it is made.
// A family stays open from show to show; a changed X10 or Fennick port makes
// the family open again, with the new port, the next time a sequence needs
// it. Owned by the ShowPlayer; the store, the control and the log must
// outlive it. Single-threaded.

#include <memory>
#include <string>
#include <vector>

#include "config/CallableByName.h"
#include "config/NetworkPreferences.h"
#include "config/RegistryStore.h"
#include "config/RegistryWatcher.h"
#include "ports/MessageLog.h"
#include "suite/channelio/ChannelIO.h"

namespace tav {

class NetworkStartup {
 public:
  // Loads the preferences; a registry that cannot be read leaves the
  // defaults, and the reason is logged once the log is known.
  explicit NetworkStartup(RegistryStore& store);

  void SetControls(ChannelIO* cio, MessageLog* log);
  const NetworkPreferences& Preferences() const { return m_prefs; }

  // Logs what could not be read from the registry, one line each.
  void ReportProblems();
  // Hands every TAV network's four settings to the control, then the rest
  // of the preferences. Failures of the control are raised.
  void InitializeTAVNetworks();
  bool TAVInitialized() const { return m_tavInitialized; }
  bool X10Initialized() const { return m_x10Initialized; }
  bool FennickInitialized() const { return m_fennickInitialized; }
  // Opens each family the first time a sequence that uses it starts.
  void OpenFamiliesFor(bool usesTAV, bool usesX10, bool usesFennick);

  // The registry watcher's callback: reloads and, when something really
  // changed, hands the control the new settings. Never raises.
  void UpdateFromRegistry();
  // Arms `watcher` on the preferences' "Ver" value; its calls go to
  // `callObject` by name ("DoUpdateNetworkPrefsFromRegistry").
  void AddRegistryWatch(RegistryWatcher& watcher, std::shared_ptr<CallableByName> callObject);

 private:
  void HandTAVSettings();
  void Log(int32_t level, const std::string& text);

  RegistryStore& m_store;
  NetworkPreferences m_prefs;
  std::vector<std::string> m_loadProblems;
  ChannelIO* m_CIO = nullptr;
  MessageLog* m_log = nullptr;
  bool m_tavInitialized = false;
  bool m_x10Initialized = false;
  bool m_fennickInitialized = false;
};

}  // namespace tav
