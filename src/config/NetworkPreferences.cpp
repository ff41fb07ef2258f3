#include "config/NetworkPreferences.h"

#include <algorithm>
#include <cctype>
#include <random>

#include "config/LibRegistry.h"
#include "support/Error.h"

namespace tav {

namespace {

constexpr const char* kSection = "Network";

std::string TAVSection(int32_t network) {
  return std::string(kSection) + "\\TAV" + std::to_string(network);
}
std::string DMXListSection() {
  return std::string(kSection) + "\\DMX";
}
std::string DMXSection(size_t index) {
  return DMXListSection() + "\\" + std::to_string(index + 1);
}
std::string FennickSection() {
  return std::string(kSection) + "\\Fennick";
}
std::string ListenerSection() {
  return std::string(kSection) + "\\Listener";
}

std::string Lower(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(),
                 [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
  return text;
}

// Reads one section's values, turning an unreadable value (of another type,
// or a number out of range) into its default and a line in `problems`. A
// store that cannot be read at all is raised instead: defaults standing in
// for a whole configuration would reconfigure every network.
class SectionReader {
 public:
  SectionReader(RegistryStore& store, std::string section, std::vector<std::string>& problems)
      : m_store(store), m_section(std::move(section)), m_problems(problems) {}

  void Long(const char* name, int32_t& field) const {
    try {
      field = GetLongSetting(m_store, name, m_section, field);
    } catch (const Error& error) {
      Problem(name, error, std::to_string(field));
    }
  }
  void Boolean(const char* name, bool& field) const {
    try {
      field = GetBooleanSetting(m_store, name, m_section, field);
    } catch (const Error& error) {
      Problem(name, error, field ? "true" : "false");
    }
  }
  void String(const char* name, std::string& field) const {
    try {
      field = GetStringSetting(m_store, name, m_section, field);
    } catch (const Error& error) {
      Problem(name, error, "\"" + field + "\"");
    }
  }
  void Transport(const char* name, DMXTransport& field) const {
    std::string text = DMXTransportName(field);
    String(name, text);
    if (!DMXTransportFromName(text, field)) {
      m_problems.push_back(Where(name) + ": unknown transport \"" + text + "\"; using " +
                           DMXTransportName(field));
    }
  }

 private:
  std::string Where(const char* name) const { return "Shared\\" + m_section + "\\" + name; }
  void Problem(const char* name, const Error& error, const std::string& used) const {
    bool badValue =
        error.Number() == 6 || error.Number() == 13 || error.Number() == kRegistryInvalidParameter;
    if (!badValue) throw error;
    m_problems.push_back(Where(name) + ": " + error.Description() + "; using " + used);
  }

  RegistryStore& m_store;
  std::string m_section;
  std::vector<std::string>& m_problems;
};

class SectionWriter {
 public:
  SectionWriter(RegistryStore& store, std::string section)
      : m_store(store), m_section(std::move(section)) {}
  void Long(const char* name, int32_t value) const {
    SetLongSetting(m_store, name, m_section, value);
  }
  void Boolean(const char* name, bool value) const {
    SetBooleanSetting(m_store, name, m_section, value);
  }
  void String(const char* name, const std::string& value) const {
    SetStringSetting(m_store, name, m_section, value);
  }

 private:
  RegistryStore& m_store;
  std::string m_section;
};

std::string NewVersionText() {
  std::random_device seed;
  std::mt19937_64 random(seed());
  static const char* kHex = "0123456789abcdef";
  std::string text = "{";
  for (int i = 0; i < 32; ++i) {
    if (i == 8 || i == 12 || i == 16 || i == 20) text += '-';
    text += kHex[random() & 15];
  }
  return text + "}";
}

void Range(std::vector<std::string>& out, const std::string& what, int64_t value, int64_t low,
           int64_t high) {
  if (value < low || value > high) {
    out.push_back(what + " is " + std::to_string(value) + ", outside " + std::to_string(low) + "-" +
                  std::to_string(high));
  }
}

}  // namespace

std::string DMXTransportName(DMXTransport transport) {
  switch (transport) {
    case DMXTransport::kE131:
      return "E1.31";
    case DMXTransport::kArtNet:
      return "ArtNet";
    case DMXTransport::kUSBPro:
      return "USBPro";
    case DMXTransport::kOpenDMX:
      return "OpenDMX";
  }
  return "E1.31";
}

bool DMXTransportFromName(const std::string& name, DMXTransport& transport) {
  std::string text = Lower(name);
  if (text == "e1.31" || text == "e131" || text == "sacn") {
    transport = DMXTransport::kE131;
  } else if (text == "artnet" || text == "art-net") {
    transport = DMXTransport::kArtNet;
  } else if (text == "usbpro" || text == "usb-pro") {
    transport = DMXTransport::kUSBPro;
  } else if (text == "opendmx" || text == "open-dmx") {
    transport = DMXTransport::kOpenDMX;
  } else {
    return false;
  }
  return true;
}

NetworkPreferences::NetworkPreferences() : m_tav(kTAVNetworkCount) {}

TAVNetworkPreferences& NetworkPreferences::TAVNetwork(int32_t network) {
  if (network < 0 || network >= kTAVNetworkCount)
    throw errors::SubscriptOutOfRange("NetworkPreferences.TAVNetwork");
  return m_tav[network];
}

const TAVNetworkPreferences& NetworkPreferences::TAVNetwork(int32_t network) const {
  return const_cast<NetworkPreferences*>(this)->TAVNetwork(network);
}

DMXUniversePrefs& NetworkPreferences::DMXUniverse(int32_t index) {
  if (index < 0 || index >= DMXUniverseCount())
    throw errors::SubscriptOutOfRange("NetworkPreferences.DMXUniverse");
  return m_universes[index];
}

const DMXUniversePrefs& NetworkPreferences::DMXUniverse(int32_t index) const {
  return const_cast<NetworkPreferences*>(this)->DMXUniverse(index);
}

void NetworkPreferences::RemoveDMXUniverse(int32_t index) {
  DMXUniverse(index);  // checks the index
  m_universes.erase(m_universes.begin() + index);
}

const DMXUniversePrefs* NetworkPreferences::FindDMXUniverse(int32_t universe) const {
  for (const auto& prefs : m_universes) {
    if (prefs.Universe() == universe) return &prefs;
  }
  return nullptr;
}

void NetworkPreferences::InitFromRegistry(RegistryStore& store) {
  NetworkPreferences fresh;
  std::vector<std::string>& problems = fresh.m_problems;

  SectionReader top(store, kSection, problems);
  top.String("X10Port", fresh.m_x10Port);
  top.String("X10HouseCodes", fresh.m_x10HouseCodes);
  top.String("FennickPort", fresh.m_fennickPort);
  top.String("SourceName", fresh.m_sourceName);
  top.Long("MulticastTTL", fresh.m_multicastTTL);
  top.Long("SyncUniverse", fresh.m_syncUniverse);
  top.Long("RefreshRate", fresh.m_refreshRate);
  top.String("SourceCID", fresh.m_sourceCID);

  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    TAVNetworkPreferences& tav = fresh.m_tav[i];
    SectionReader reader(store, TAVSection(i), problems);
    std::string port = tav.Port();
    reader.String("Port", port);
    tav.SetPort(port);
    int32_t number = tav.Speed();
    reader.Long("Speed", number);
    tav.SetSpeed(number);
    bool flag = tav.OldMCP();
    reader.Boolean("OldMCP", flag);
    tav.SetOldMCP(flag);
    flag = tav.Enhanced();
    reader.Boolean("Enhanced", flag);
    tav.SetEnhanced(flag);
    number = tav.UnitCount();
    reader.Long("UnitCount", number);
    tav.SetUnitCount(number);
    number = tav.CircuitsPerUnit();
    reader.Long("CircuitsPerUnit", number);
    tav.SetCircuitsPerUnit(number);
    number = tav.StopBits();
    reader.Long("StopBits", number);
    tav.SetStopBits(number);
    number = tav.DMXUniverse();
    reader.Long("DMXUniverse", number);
    tav.SetDMXUniverse(number);
    number = tav.DMXStartSlot();
    reader.Long("DMXStartSlot", number);
    tav.SetDMXStartSlot(number);
  }

  // DMX universes are the sub-keys 1, 2, 3 ... in order; the list ends at
  // the first number that is missing.
  std::string listKey = SharedSettingsKey(DMXListSection());
  for (size_t index = 0;; ++index) {
    std::string section = DMXSection(index);
    if (!RegistryKeyExists(store, SharedSettingsKey(section))) break;
    DMXUniversePrefs prefs;
    SectionReader reader(store, section, problems);
    int32_t number = prefs.Universe();
    reader.Long("Universe", number);
    prefs.SetUniverse(number);
    DMXTransport transport = prefs.Transport();
    reader.Transport("Transport", transport);
    prefs.SetTransport(transport);
    std::string text = prefs.Destination();
    reader.String("Destination", text);
    prefs.SetDestination(text);
    text = prefs.Interface();
    reader.String("Interface", text);
    prefs.SetInterface(text);
    number = prefs.Priority();
    reader.Long("Priority", number);
    prefs.SetPriority(number);
    number = static_cast<int32_t>(index) * 512 + 1;
    reader.Long("StartChannel", number);
    prefs.SetStartChannel(number);
    number = prefs.Size();
    reader.Long("Size", number);
    prefs.SetSize(number);
    text = prefs.Port();
    reader.String("Port", text);
    prefs.SetPort(text);
    bool enabled = prefs.Enabled();
    reader.Boolean("Enabled", enabled);
    prefs.SetEnabled(enabled);
    fresh.m_universes.push_back(prefs);
  }

  SectionReader fennick(store, FennickSection(), problems);
  FennickPreferences& f = fresh.m_fennick;
  int32_t number = f.Speed();
  fennick.Long("Speed", number);
  f.SetSpeed(number);
  number = f.StopBits();
  fennick.Long("StopBits", number);
  f.SetStopBits(number);
  number = f.Boards();
  fennick.Long("Boards", number);
  f.SetBoards(number);
  number = f.ChannelsPerBoard();
  fennick.Long("ChannelsPerBoard", number);
  f.SetChannelsPerBoard(number);
  bool flag = f.HeaderPerBank();
  fennick.Boolean("HeaderPerBank", flag);
  f.SetHeaderPerBank(flag);
  flag = f.ClampSpecialValues();
  fennick.Boolean("ClampSpecialValues", flag);
  f.SetClampSpecialValues(flag);

  SectionReader listener(store, ListenerSection(), problems);
  DMXListenerPrefs& l = fresh.m_listener;
  flag = l.Enabled();
  listener.Boolean("Enabled", flag);
  l.SetEnabled(flag);
  DMXTransport transport = l.Transport();
  listener.Transport("Transport", transport);
  l.SetTransport(transport);
  number = l.Universe();
  listener.Long("Universe", number);
  l.SetUniverse(number);
  std::string text = l.Interface();
  listener.String("Interface", text);
  l.SetInterface(text);
  number = l.Port();
  listener.Long("Port", number);
  l.SetPort(number);
  number = l.FirstSlot();
  listener.Long("FirstSlot", number);
  l.SetFirstSlot(number);
  number = l.SlotCount();
  listener.Long("SlotCount", number);
  l.SetSlotCount(number);
  number = l.Threshold();
  listener.Long("Threshold", number);
  l.SetThreshold(number);
  number = l.Network();
  listener.Long("Network", number);
  l.SetNetwork(number);
  number = l.Unit();
  listener.Long("Unit", number);
  l.SetUnit(number);

  *this = std::move(fresh);
}

void NetworkPreferences::SaveToRegistry(RegistryStore& store) const {
  SectionWriter top(store, kSection);
  top.String("X10Port", m_x10Port);
  top.String("X10HouseCodes", m_x10HouseCodes);
  top.String("FennickPort", m_fennickPort);
  top.String("SourceName", m_sourceName);
  top.Long("MulticastTTL", m_multicastTTL);
  top.Long("SyncUniverse", m_syncUniverse);
  top.Long("RefreshRate", m_refreshRate);
  top.String("SourceCID", m_sourceCID);

  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const TAVNetworkPreferences& tav = m_tav[i];
    SectionWriter writer(store, TAVSection(i));
    writer.String("Port", tav.Port());
    writer.Long("Speed", tav.Speed());
    writer.Boolean("OldMCP", tav.OldMCP());
    writer.Boolean("Enhanced", tav.Enhanced());
    writer.Long("UnitCount", tav.UnitCount());
    writer.Long("CircuitsPerUnit", tav.CircuitsPerUnit());
    writer.Long("StopBits", tav.StopBits());
    writer.Long("DMXUniverse", tav.DMXUniverse());
    writer.Long("DMXStartSlot", tav.DMXStartSlot());
  }

  for (size_t index = 0; index < m_universes.size(); ++index) {
    const DMXUniversePrefs& prefs = m_universes[index];
    SectionWriter writer(store, DMXSection(index));
    writer.Long("Universe", prefs.Universe());
    writer.String("Transport", DMXTransportName(prefs.Transport()));
    writer.String("Destination", prefs.Destination());
    writer.String("Interface", prefs.Interface());
    writer.Long("Priority", prefs.Priority());
    writer.Long("StartChannel", prefs.StartChannel());
    writer.Long("Size", prefs.Size());
    writer.String("Port", prefs.Port());
    writer.Boolean("Enabled", prefs.Enabled());
  }
  for (size_t index = m_universes.size();; ++index) {
    std::string key = SharedSettingsKey(DMXSection(index));
    if (!RegistryKeyExists(store, key)) break;
    RegistryDeleteKey(store, key);
  }

  SectionWriter fennick(store, FennickSection());
  fennick.Long("Speed", m_fennick.Speed());
  fennick.Long("StopBits", m_fennick.StopBits());
  fennick.Long("Boards", m_fennick.Boards());
  fennick.Long("ChannelsPerBoard", m_fennick.ChannelsPerBoard());
  fennick.Boolean("HeaderPerBank", m_fennick.HeaderPerBank());
  fennick.Boolean("ClampSpecialValues", m_fennick.ClampSpecialValues());

  SectionWriter listener(store, ListenerSection());
  listener.Boolean("Enabled", m_listener.Enabled());
  listener.String("Transport", DMXTransportName(m_listener.Transport()));
  listener.Long("Universe", m_listener.Universe());
  listener.String("Interface", m_listener.Interface());
  listener.Long("Port", m_listener.Port());
  listener.Long("FirstSlot", m_listener.FirstSlot());
  listener.Long("SlotCount", m_listener.SlotCount());
  listener.Long("Threshold", m_listener.Threshold());
  listener.Long("Network", m_listener.Network());
  listener.Long("Unit", m_listener.Unit());
}

void NetworkPreferences::BumpVersion(RegistryStore& store) {
  SetStringSetting(store, "Ver", kSection, NewVersionText());
}

std::vector<std::string> NetworkPreferences::Validate() const {
  std::vector<std::string> out;
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    const TAVNetworkPreferences& tav = m_tav[i];
    std::string name = "TAV network " + std::to_string(i);
    Range(out, name + " speed", tav.Speed(), 300, 4000000);
    Range(out, name + " units", tav.UnitCount(), 1, 127);
    Range(out, name + " circuits per unit", tav.CircuitsPerUnit(), 1, 512);
    Range(out, name + " stop bits", tav.StopBits(), 1, 2);
    if (tav.DMXUniverse() != 0) Range(out, name + " DMX universe", tav.DMXUniverse(), 1, 63999);
    Range(out, name + " DMX start slot", tav.DMXStartSlot(), 1, 512);
  }
  for (size_t index = 0; index < m_universes.size(); ++index) {
    const DMXUniversePrefs& prefs = m_universes[index];
    std::string name = "DMX universe entry " + std::to_string(index + 1);
    if (prefs.Transport() == DMXTransport::kArtNet) {
      Range(out, name + " universe", prefs.Universe(), 0, 32767);
    } else {
      Range(out, name + " universe", prefs.Universe(), 1, 63999);
    }
    Range(out, name + " priority", prefs.Priority(), 0, 200);
    Range(out, name + " start channel", prefs.StartChannel(), 1, 16777216);
    Range(out, name + " size", prefs.Size(), 1, 512);
    bool serial =
        prefs.Transport() == DMXTransport::kUSBPro || prefs.Transport() == DMXTransport::kOpenDMX;
    if (serial && prefs.Port().empty()) out.push_back(name + " needs a serial port");
  }
  Range(out, "Fennick speed", m_fennick.Speed(), 300, 4000000);
  Range(out, "Fennick stop bits", m_fennick.StopBits(), 1, 2);
  Range(out, "Fennick boards", m_fennick.Boards(), 1, 127);
  Range(out, "Fennick channels per board", m_fennick.ChannelsPerBoard(), 1, 512);
  for (char c : m_x10HouseCodes) {
    char upper = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
    if (upper < 'A' || upper > 'P') {
      out.push_back(std::string("X10 house code '") + c + "' is not a letter A-P");
    }
  }
  Range(out, "multicast TTL", m_multicastTTL, 1, 255);
  Range(out, "sync universe", m_syncUniverse, 0, 63999);
  Range(out, "refresh rate", m_refreshRate, 1, 1000);
  if (m_listener.Enabled()) {
    Range(out, "listener universe", m_listener.Universe(), 0, 63999);
    Range(out, "listener port", m_listener.Port(), 0, 65535);
    Range(out, "listener first slot", m_listener.FirstSlot(), 1, 512);
    Range(out, "listener slot count", m_listener.SlotCount(), 1, 513 - m_listener.FirstSlot());
    Range(out, "listener threshold", m_listener.Threshold(), 1, 255);
  }
  return out;
}

}  // namespace tav
