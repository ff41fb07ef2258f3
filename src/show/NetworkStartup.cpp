#include "show/NetworkStartup.h"

#include "config/LibRegistry.h"
#include "support/Error.h"

namespace tav {

namespace {
constexpr const char* kUpdateSubroutine = "DoUpdateNetworkPrefsFromRegistry";
constexpr const char* kVersionValue = "Ver";
}  // namespace

NetworkStartup::NetworkStartup(RegistryStore& store) : m_store(store) {
  try {
    m_prefs.InitFromRegistry(m_store);
    m_loadProblems = m_prefs.Problems();
  } catch (const Error& e) {
    m_prefs = NetworkPreferences();
    m_loadProblems.push_back("Cannot read the network preferences (" + e.Description() +
                             "); using the defaults");
  }
}

void NetworkStartup::SetControls(ChannelIO* cio, MessageLog* log) {
  m_CIO = cio;
  m_log = log;
}

void NetworkStartup::Log(int32_t level, const std::string& text) {
  if (m_log) m_log->LogMessage(level, text);
}

void NetworkStartup::ReportProblems() {
  for (const std::string& problem : m_loadProblems) Log(2, "Network preferences: " + problem);
  m_loadProblems.clear();
}

void NetworkStartup::HandTAVSettings() {
  // Speed, old-MCP and enhanced first: setting the port opens the network
  // with them.
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const TAVNetworkPreferences& tav = m_prefs.TAVNetwork(i);
    m_CIO->SetTAVNetworkSpeed(i, tav.Speed());
    m_CIO->SetTAVNetworkOldMCP(i, tav.OldMCP());
    m_CIO->SetTAVNetworkEnhanced(i, tav.Enhanced());
    m_CIO->SetTAVNetworkPort(i, tav.Port());
  }
}

void NetworkStartup::InitializeTAVNetworks() {
  if (!m_CIO) throw errors::ObjectNotSet("NetworkStartup.InitializeTAVNetworks");
  Log(1, "Initializing TAV networks");
  HandTAVSettings();
  // TAV networks mapped onto DMX universes, and the universes themselves,
  // live on the DMX side.
  m_CIO->ApplyNetworkPreferences(m_prefs);
  m_tavInitialized = true;
  Log(1, "TAV networks initialized");
}

void NetworkStartup::OpenFamiliesFor(bool usesTAV, bool usesX10, bool usesFennick) {
  if (!m_tavInitialized && usesTAV) InitializeTAVNetworks();
  if (!m_x10Initialized && usesX10) {
    Log(1, "Initializing X10 network");
    m_CIO->OpenX10Network(m_prefs.X10Port());
    m_x10Initialized = true;
    Log(1, "X10 network initialized");
  }
  if (!m_fennickInitialized && usesFennick) {
    Log(1, "Initializing Fennick network");
    m_CIO->OpenFennickNetwork(m_prefs.FennickPort());
    m_fennickInitialized = true;
    Log(1, "Fennick network initialized");
  }
}

void NetworkStartup::UpdateFromRegistry() {
  try {
    Log(1, "A Network Config Registry Change was detected");
    NetworkPreferences previous;
    previous.CopyFrom(m_prefs);
    m_prefs.InitFromRegistry(m_store);
    m_loadProblems = m_prefs.Problems();
    ReportProblems();
    if (!m_prefs.DiffersFrom(previous)) {
      Log(1, "No actual network changes detected");
      return;
    }
    Log(1, "Network Preferences need to be updated");
    if (!m_CIO) throw errors::ObjectNotSet("NetworkStartup.UpdateFromRegistry");
    HandTAVSettings();
    m_CIO->ApplyNetworkPreferences(m_prefs);
    // A family on a new port opens again the next time a sequence needs it.
    if (m_prefs.X10Port() != previous.X10Port()) m_x10Initialized = false;
    if (m_prefs.FennickPort() != previous.FennickPort()) m_fennickInitialized = false;
    Log(1, "Network Preferences update complete");
  } catch (...) {
    Log(3, "Could not Auto Update Network Preferences from registry");
  }
}

void NetworkStartup::AddRegistryWatch(RegistryWatcher& watcher,
                                      std::shared_ptr<CallableByName> callObject) {
  const std::string key = m_prefs.NetPrefUUIDKey();
  // The watch needs a value to compare with. On a machine where no tool has
  // announced a configuration yet, the player writes the first one itself,
  // so later announcements are not missed.
  try {
    if (GetStringSetting(m_store, kVersionValue, key, "").empty()) {
      NetworkPreferences::BumpVersion(m_store);
    }
  } catch (const Error&) {
    // EnableTheWatch below reports the failure.
  }
  watcher.SetCallObject(std::move(callObject));
  watcher.SetCallSubroutine(kUpdateSubroutine);
  watcher.SetWatchRegistryKey(key);
  watcher.SetWatchRegistryValue(kVersionValue);
  if (!watcher.EnableTheWatch()) {
    Log(3, "Error starting the Tessavar Registry Watcher: " + key + ")");
  }
}

}  // namespace tav
