#include "config/NetworkPreferences.h"

#include <algorithm>
#include <cctype>
#include <random>
#include <variant>

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

// One stored value of a preferences object: its name in the registry and
// the object's getter and setter. Each part of the preferences lists its
// values once (below), and reading and writing both walk that list.
template <class P>
struct LongField {
  const char* name;
  int32_t (P::*get)() const;
  void (P::*set)(int32_t);
};
template <class P>
struct BoolField {
  const char* name;
  bool (P::*get)() const;
  void (P::*set)(bool);
};
template <class P>
struct TextField {
  const char* name;
  const std::string& (P::*get)() const;
  void (P::*set)(std::string);
};
template <class P>
struct TransportField {
  const char* name;
  DMXTransport (P::*get)() const;
  void (P::*set)(DMXTransport);
};
template <class P>
using Field = std::variant<LongField<P>, BoolField<P>, TextField<P>, TransportField<P>>;

template <class... Ts>
struct Overloaded : Ts... {
  using Ts::operator()...;
};
template <class... Ts>
Overloaded(Ts...) -> Overloaded<Ts...>;

// Reads one section's values into `object`, the value it already holds being
// the default. An unreadable value (of another type, or a number out of
// range) keeps the default and adds a line to `problems`. A store that
// cannot be read at all is raised instead: defaults standing in for a whole
// configuration would reconfigure every network.
template <class P>
void ReadFields(RegistryStore& store, const std::string& section, P& object,
                const std::vector<Field<P>>& fields, std::vector<std::string>& problems) {
  auto where = [&section](const char* name) { return "Shared\\" + section + "\\" + name; };
  auto guarded = [&](const char* name, const std::string& used, auto read) {
    try {
      read();
    } catch (const Error& error) {
      bool badValue = error.Number() == 6 || error.Number() == 13 ||
                      error.Number() == kRegistryInvalidParameter;
      if (!badValue) throw;
      problems.push_back(where(name) + ": " + error.Description() + "; using " + used);
    }
  };
  for (const Field<P>& field : fields) {
    std::visit(
        Overloaded{
            [&](const LongField<P>& f) {
              int32_t value = (object.*f.get)();
              guarded(f.name, std::to_string(value),
                      [&] { (object.*f.set)(GetLongSetting(store, f.name, section, value)); });
            },
            [&](const BoolField<P>& f) {
              bool value = (object.*f.get)();
              guarded(f.name, value ? "true" : "false",
                      [&] { (object.*f.set)(GetBooleanSetting(store, f.name, section, value)); });
            },
            [&](const TextField<P>& f) {
              std::string value = (object.*f.get)();
              guarded(f.name, "\"" + value + "\"",
                      [&] { (object.*f.set)(GetStringSetting(store, f.name, section, value)); });
            },
            [&](const TransportField<P>& f) {
              DMXTransport value = (object.*f.get)();
              std::string text = DMXTransportName(value);
              guarded(f.name, text, [&] { text = GetStringSetting(store, f.name, section, text); });
              if (DMXTransportFromName(text, value)) {
                (object.*f.set)(value);
              } else {
                problems.push_back(where(f.name) + ": unknown transport \"" + text + "\"; using " +
                                   DMXTransportName(value));
              }
            },
        },
        field);
  }
}

template <class P>
void WriteFields(RegistryStore& store, const std::string& section, const P& object,
                 const std::vector<Field<P>>& fields) {
  for (const Field<P>& field : fields) {
    std::visit(Overloaded{
                   [&](const LongField<P>& f) {
                     SetLongSetting(store, f.name, section, (object.*f.get)());
                   },
                   [&](const BoolField<P>& f) {
                     SetBooleanSetting(store, f.name, section, (object.*f.get)());
                   },
                   [&](const TextField<P>& f) {
                     SetStringSetting(store, f.name, section, (object.*f.get)());
                   },
                   [&](const TransportField<P>& f) {
                     SetStringSetting(store, f.name, section, DMXTransportName((object.*f.get)()));
                   },
               },
               field);
  }
}

using N = NetworkPreferences;
using T = TAVNetworkPreferences;
using D = DMXUniversePrefs;
using F = FennickPreferences;
using L = DMXListenerPrefs;

const std::vector<Field<N>>& TopFields() {
  static const std::vector<Field<N>> fields = {
      TextField<N>{"X10Port", &N::X10Port, &N::SetX10Port},
      TextField<N>{"X10HouseCodes", &N::X10HouseCodes, &N::SetX10HouseCodes},
      TextField<N>{"FennickPort", &N::FennickPort, &N::SetFennickPort},
      TextField<N>{"SourceName", &N::SourceName, &N::SetSourceName},
      LongField<N>{"MulticastTTL", &N::MulticastTTL, &N::SetMulticastTTL},
      LongField<N>{"SyncUniverse", &N::SyncUniverse, &N::SetSyncUniverse},
      LongField<N>{"RefreshRate", &N::RefreshRate, &N::SetRefreshRate},
      TextField<N>{"SourceCID", &N::SourceCID, &N::SetSourceCID},
  };
  return fields;
}

const std::vector<Field<T>>& TAVFields() {
  static const std::vector<Field<T>> fields = {
      TextField<T>{"Port", &T::Port, &T::SetPort},
      LongField<T>{"Speed", &T::Speed, &T::SetSpeed},
      BoolField<T>{"OldMCP", &T::OldMCP, &T::SetOldMCP},
      BoolField<T>{"Enhanced", &T::Enhanced, &T::SetEnhanced},
      LongField<T>{"UnitCount", &T::UnitCount, &T::SetUnitCount},
      LongField<T>{"CircuitsPerUnit", &T::CircuitsPerUnit, &T::SetCircuitsPerUnit},
      LongField<T>{"StopBits", &T::StopBits, &T::SetStopBits},
      LongField<T>{"DMXUniverse", &T::DMXUniverse, &T::SetDMXUniverse},
      LongField<T>{"DMXStartSlot", &T::DMXStartSlot, &T::SetDMXStartSlot},
  };
  return fields;
}

const std::vector<Field<D>>& UniverseFields() {
  static const std::vector<Field<D>> fields = {
      LongField<D>{"Universe", &D::Universe, &D::SetUniverse},
      TransportField<D>{"Transport", &D::Transport, &D::SetTransport},
      TextField<D>{"Destination", &D::Destination, &D::SetDestination},
      TextField<D>{"Interface", &D::Interface, &D::SetInterface},
      LongField<D>{"Priority", &D::Priority, &D::SetPriority},
      LongField<D>{"StartChannel", &D::StartChannel, &D::SetStartChannel},
      LongField<D>{"Size", &D::Size, &D::SetSize},
      TextField<D>{"Port", &D::Port, &D::SetPort},
      BoolField<D>{"Enabled", &D::Enabled, &D::SetEnabled},
  };
  return fields;
}

const std::vector<Field<F>>& FennickFields() {
  static const std::vector<Field<F>> fields = {
      LongField<F>{"Speed", &F::Speed, &F::SetSpeed},
      LongField<F>{"StopBits", &F::StopBits, &F::SetStopBits},
      LongField<F>{"Boards", &F::Boards, &F::SetBoards},
      LongField<F>{"ChannelsPerBoard", &F::ChannelsPerBoard, &F::SetChannelsPerBoard},
      BoolField<F>{"HeaderPerBank", &F::HeaderPerBank, &F::SetHeaderPerBank},
      BoolField<F>{"ClampSpecialValues", &F::ClampSpecialValues, &F::SetClampSpecialValues},
  };
  return fields;
}

const std::vector<Field<L>>& ListenerFields() {
  static const std::vector<Field<L>> fields = {
      BoolField<L>{"Enabled", &L::Enabled, &L::SetEnabled},
      TransportField<L>{"Transport", &L::Transport, &L::SetTransport},
      LongField<L>{"Universe", &L::Universe, &L::SetUniverse},
      TextField<L>{"Interface", &L::Interface, &L::SetInterface},
      LongField<L>{"Port", &L::Port, &L::SetPort},
      LongField<L>{"FirstSlot", &L::FirstSlot, &L::SetFirstSlot},
      LongField<L>{"SlotCount", &L::SlotCount, &L::SetSlotCount},
      LongField<L>{"Threshold", &L::Threshold, &L::SetThreshold},
      LongField<L>{"Network", &L::Network, &L::SetNetwork},
      LongField<L>{"Unit", &L::Unit, &L::SetUnit},
  };
  return fields;
}

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
  ReadFields(store, kSection, fresh, TopFields(), problems);
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    ReadFields(store, TAVSection(i), fresh.m_tav[i], TAVFields(), problems);
  }
  // DMX universes are the sub-keys 1, 2, 3 ... in order; the list ends at
  // the first number that is missing. A universe without a start channel
  // follows the one before it.
  for (size_t index = 0;; ++index) {
    std::string section = DMXSection(index);
    if (!RegistryKeyExists(store, SharedSettingsKey(section))) break;
    DMXUniversePrefs prefs;
    prefs.SetStartChannel(static_cast<int32_t>(index) * 512 + 1);
    ReadFields(store, section, prefs, UniverseFields(), problems);
    fresh.m_universes.push_back(prefs);
  }
  ReadFields(store, FennickSection(), fresh.m_fennick, FennickFields(), problems);
  ReadFields(store, ListenerSection(), fresh.m_listener, ListenerFields(), problems);
  *this = std::move(fresh);
}

void NetworkPreferences::SaveToRegistry(RegistryStore& store) const {
  WriteFields(store, kSection, *this, TopFields());
  for (int32_t i = 0; i < kTAVNetworkCount; ++i) {
    WriteFields(store, TAVSection(i), m_tav[i], TAVFields());
  }
  for (size_t index = 0; index < m_universes.size(); ++index) {
    WriteFields(store, DMXSection(index), m_universes[index], UniverseFields());
  }
  for (size_t index = m_universes.size();; ++index) {
    std::string key = SharedSettingsKey(DMXSection(index));
    if (!RegistryKeyExists(store, key)) break;
    RegistryDeleteKey(store, key);
  }
  WriteFields(store, FennickSection(), m_fennick, FennickFields());
  WriteFields(store, ListenerSection(), m_listener, ListenerFields());
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
