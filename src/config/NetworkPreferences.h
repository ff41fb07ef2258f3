#pragma once
// The network preferences: every lighting network the player drives and how
// to reach it. Sixteen TAV networks (the suite's serial controllers, or
// mapped onto a DMX universe where none is attached), the DMX universes with
// their transport (E1.31, Art-Net, or a USB widget), the X10 and Fennick
// serial networks, and the DMX listener whose slots act as inputs.
//
// Stored under HKEY_CURRENT_USER\Software\Tessavar\Shared\Network (layout in
// docs/network-preferences.md). Other programs announce a new configuration
// by changing the text of its "Ver" value; the show engine watches it.
//
// Value types: copies share nothing. Reading never fails on a bad value: a
// value of the wrong type or out of range keeps its default and is reported
// in Problems(), so one typo cannot stop a show.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "config/RegistryStore.h"

namespace tav {

inline constexpr int32_t kTAVNetworkCount = 16;

class TAVNetworkPreferences {
 public:
  // The serial device the network's controllers hang on ("" = none).
  const std::string& Port() const { return m_port; }
  void SetPort(std::string value) { m_port = std::move(value); }
  // Baud.
  int32_t Speed() const { return m_speed; }
  void SetSpeed(int32_t value) { m_speed = value; }
  // Controllers of the old master-control-processor generation.
  bool OldMCP() const { return m_oldMCP; }
  void SetOldMCP(bool value) { m_oldMCP = value; }
  // Controllers with the enhanced (per-bank addressed) protocol.
  bool Enhanced() const { return m_enhanced; }
  void SetEnhanced(bool value) { m_enhanced = value; }
  // Units on the network (boards, in serial terms) and circuits per unit.
  int32_t UnitCount() const { return m_unitCount; }
  void SetUnitCount(int32_t value) { m_unitCount = value; }
  int32_t CircuitsPerUnit() const { return m_circuitsPerUnit; }
  void SetCircuitsPerUnit(int32_t value) { m_circuitsPerUnit = value; }
  // Serial stop bits, 1 or 2.
  int32_t StopBits() const { return m_stopBits; }
  void SetStopBits(int32_t value) { m_stopBits = value; }
  // Where no controller is attached, the network's levels go to this DMX
  // universe (0 = not mapped): unit u, circuit c lands on slot
  // DMXStartSlot + (u - 1) * CircuitsPerUnit + (c - 1).
  int32_t DMXUniverse() const { return m_dmxUniverse; }
  void SetDMXUniverse(int32_t value) { m_dmxUniverse = value; }
  int32_t DMXStartSlot() const { return m_dmxStartSlot; }
  void SetDMXStartSlot(int32_t value) { m_dmxStartSlot = value; }

  friend bool operator==(const TAVNetworkPreferences&, const TAVNetworkPreferences&) = default;

 private:
  std::string m_port;
  int32_t m_speed = 57600;
  bool m_oldMCP = false;
  bool m_enhanced = false;
  int32_t m_unitCount = 8;
  int32_t m_circuitsPerUnit = 16;
  int32_t m_stopBits = 1;
  int32_t m_dmxUniverse = 0;
  int32_t m_dmxStartSlot = 1;
};

// How a DMX universe leaves the machine.
enum class DMXTransport : int32_t {
  kE131 = 0,     // sACN: multicast 239.255.hi.lo, or unicast to Destination
  kArtNet = 1,   // ArtDmx: broadcast, or unicast to Destination
  kUSBPro = 2,   // a DMX USB Pro widget on the serial Port
  kOpenDMX = 3,  // a bare FTDI dongle on the serial Port (break, MAB, 250 kBd)
};
// "E1.31", "ArtNet", "USBPro", "OpenDMX".
std::string DMXTransportName(DMXTransport transport);
// Accepts the names above in any letter case (and "sACN", "Art-Net"); false
// for anything else.
bool DMXTransportFromName(const std::string& name, DMXTransport& transport);

class DMXUniversePrefs {
 public:
  // E1.31: 1-63999. Art-Net: the 15-bit port-address, 0-32767.
  int32_t Universe() const { return m_universe; }
  void SetUniverse(int32_t value) { m_universe = value; }
  DMXTransport Transport() const { return m_transport; }
  void SetTransport(DMXTransport value) { m_transport = value; }
  // Unicast IPv4 address or host name; "" = multicast (E1.31) or the
  // interface's broadcast address (Art-Net).
  const std::string& Destination() const { return m_destination; }
  void SetDestination(std::string value) { m_destination = std::move(value); }
  // The network interface (name such as "eth0", or a local IPv4 address) to
  // send from; "" = the system's choice.
  const std::string& Interface() const { return m_interface; }
  void SetInterface(std::string value) { m_interface = std::move(value); }
  // E1.31 priority, 0-200.
  int32_t Priority() const { return m_priority; }
  void SetPriority(int32_t value) { m_priority = value; }
  // Where the universe sits in the absolute channel space of FSEQ files:
  // its slot 1 is absolute channel StartChannel (1-based); Size slots.
  int32_t StartChannel() const { return m_startChannel; }
  void SetStartChannel(int32_t value) { m_startChannel = value; }
  int32_t Size() const { return m_size; }
  void SetSize(int32_t value) { m_size = value; }
  // The serial device of a USB widget.
  const std::string& Port() const { return m_port; }
  void SetPort(std::string value) { m_port = std::move(value); }
  // A universe may be kept in the list but switched off.
  bool Enabled() const { return m_enabled; }
  void SetEnabled(bool value) { m_enabled = value; }

  friend bool operator==(const DMXUniversePrefs&, const DMXUniversePrefs&) = default;

 private:
  int32_t m_universe = 1;
  DMXTransport m_transport = DMXTransport::kE131;
  std::string m_destination;
  std::string m_interface;
  int32_t m_priority = 100;
  int32_t m_startChannel = 1;
  int32_t m_size = 512;
  std::string m_port;
  bool m_enabled = true;
};

// The Fennick network: the hobby serial dimmer framing (sync 0x7E, address
// 0x80, escapes) on a chain of boards.
class FennickPreferences {
 public:
  int32_t Speed() const { return m_speed; }
  void SetSpeed(int32_t value) { m_speed = value; }
  int32_t StopBits() const { return m_stopBits; }
  void SetStopBits(int32_t value) { m_stopBits = value; }
  int32_t Boards() const { return m_boards; }
  void SetBoards(int32_t value) { m_boards = value; }
  int32_t ChannelsPerBoard() const { return m_channelsPerBoard; }
  void SetChannelsPerBoard(int32_t value) { m_channelsPerBoard = value; }
  // A header before every bank of 8 channels instead of one for the frame.
  bool HeaderPerBank() const { return m_headerPerBank; }
  void SetHeaderPerBank(bool value) { m_headerPerBank = value; }
  // Clamp the special values (0x7D-0x7F) instead of escaping them.
  bool ClampSpecialValues() const { return m_clamp; }
  void SetClampSpecialValues(bool value) { m_clamp = value; }

  friend bool operator==(const FennickPreferences&, const FennickPreferences&) = default;

 private:
  int32_t m_speed = 57600;
  int32_t m_stopBits = 1;
  int32_t m_boards = 1;
  int32_t m_channelsPerBoard = 8;
  bool m_headerPerBank = false;
  bool m_clamp = false;
};

// The DMX listener: an incoming universe whose slots act as inputs. Slot s
// (FirstSlot <= s < FirstSlot + SlotCount) crossing Threshold upwards fires
// input s of unit Unit on network Network.
class DMXListenerPrefs {
 public:
  bool Enabled() const { return m_enabled; }
  void SetEnabled(bool value) { m_enabled = value; }
  DMXTransport Transport() const { return m_transport; }  // E1.31 or Art-Net
  void SetTransport(DMXTransport value) { m_transport = value; }
  int32_t Universe() const { return m_universe; }
  void SetUniverse(int32_t value) { m_universe = value; }
  const std::string& Interface() const { return m_interface; }
  void SetInterface(std::string value) { m_interface = std::move(value); }
  // The UDP port listened on; 0 = the protocol's own (5568 E1.31, 6454
  // Art-Net).
  int32_t Port() const { return m_port; }
  void SetPort(int32_t value) { m_port = value; }
  int32_t FirstSlot() const { return m_firstSlot; }
  void SetFirstSlot(int32_t value) { m_firstSlot = value; }
  int32_t SlotCount() const { return m_slotCount; }
  void SetSlotCount(int32_t value) { m_slotCount = value; }
  // 0-255; a slot presses its input when it rises from below to at least
  // this level.
  int32_t Threshold() const { return m_threshold; }
  void SetThreshold(int32_t value) { m_threshold = value; }
  int32_t Network() const { return m_network; }
  void SetNetwork(int32_t value) { m_network = value; }
  int32_t Unit() const { return m_unit; }
  void SetUnit(int32_t value) { m_unit = value; }

  friend bool operator==(const DMXListenerPrefs&, const DMXListenerPrefs&) = default;

 private:
  bool m_enabled = false;
  DMXTransport m_transport = DMXTransport::kE131;
  int32_t m_universe = 1;
  std::string m_interface;
  int32_t m_port = 0;
  int32_t m_firstSlot = 1;
  int32_t m_slotCount = 512;
  int32_t m_threshold = 128;
  int32_t m_network = 0;
  int32_t m_unit = 1;
};

class NetworkPreferences {
 public:
  NetworkPreferences();

  // network 0-15; fails with the subscript error (9) outside.
  TAVNetworkPreferences& TAVNetwork(int32_t network);
  const TAVNetworkPreferences& TAVNetwork(int32_t network) const;

  int32_t DMXUniverseCount() const { return static_cast<int32_t>(m_universes.size()); }
  // index 0 to DMXUniverseCount() - 1; fails with the subscript error (9).
  DMXUniversePrefs& DMXUniverse(int32_t index);
  const DMXUniversePrefs& DMXUniverse(int32_t index) const;
  void AddDMXUniverse(DMXUniversePrefs prefs) { m_universes.push_back(std::move(prefs)); }
  void RemoveDMXUniverse(int32_t index);
  // The first entry for this universe number, or null.
  const DMXUniversePrefs* FindDMXUniverse(int32_t universe) const;

  const std::string& X10Port() const { return m_x10Port; }
  void SetX10Port(std::string value) { m_x10Port = std::move(value); }
  // The house codes in use, letters A-P ("A", "ACP"); "" = A.
  const std::string& X10HouseCodes() const { return m_x10HouseCodes; }
  void SetX10HouseCodes(std::string value) { m_x10HouseCodes = std::move(value); }
  const std::string& FennickPort() const { return m_fennickPort; }
  void SetFennickPort(std::string value) { m_fennickPort = std::move(value); }
  FennickPreferences& Fennick() { return m_fennick; }
  const FennickPreferences& Fennick() const { return m_fennick; }
  DMXListenerPrefs& Listener() { return m_listener; }
  const DMXListenerPrefs& Listener() const { return m_listener; }

  // E1.31 source name, multicast TTL, the synchronization universe (0 =
  // none; Art-Net then sends no ArtSync either), the effect engine's frame
  // rate, and the source CID (a UUID as text; made once by the I/O control
  // and kept here).
  const std::string& SourceName() const { return m_sourceName; }
  void SetSourceName(std::string value) { m_sourceName = std::move(value); }
  int32_t MulticastTTL() const { return m_multicastTTL; }
  void SetMulticastTTL(int32_t value) { m_multicastTTL = value; }
  int32_t SyncUniverse() const { return m_syncUniverse; }
  void SetSyncUniverse(int32_t value) { m_syncUniverse = value; }
  int32_t RefreshRate() const { return m_refreshRate; }
  void SetRefreshRate(int32_t value) { m_refreshRate = value; }
  const std::string& SourceCID() const { return m_sourceCID; }
  void SetSourceCID(std::string value) { m_sourceCID = std::move(value); }

  // The section below the Shared key that holds all of the above, and whose
  // "Ver" value announces a change.
  std::string NetPrefUUIDKey() const { return "Network"; }

  // Replaces everything with what the registry holds (defaults where a value
  // is missing or of the wrong type, each reported in Problems()). A store
  // that fails (an unreadable file, say) is raised and changes nothing.
  void InitFromRegistry(RegistryStore& store);
  // Writes everything, removing DMX universe keys beyond the current count.
  // Does not touch "Ver": BumpVersion announces the change.
  void SaveToRegistry(RegistryStore& store) const;
  // Writes a new random "Ver" text so a running player reloads.
  static void BumpVersion(RegistryStore& store);
  bool DiffersFrom(const NetworkPreferences& other) const { return !(*this == other); }
  void CopyFrom(const NetworkPreferences& other) { *this = other; }

  // What the last InitFromRegistry could not read, one line each, naming the
  // key, the value and what was used instead.
  const std::vector<std::string>& Problems() const { return m_problems; }
  // Every setting that is out of its range, one line each (empty = fine).
  std::vector<std::string> Validate() const;

  // Problems are not part of the preferences.
  friend bool operator==(const NetworkPreferences& a, const NetworkPreferences& b) {
    return a.m_tav == b.m_tav && a.m_universes == b.m_universes && a.m_x10Port == b.m_x10Port &&
           a.m_x10HouseCodes == b.m_x10HouseCodes && a.m_fennickPort == b.m_fennickPort &&
           a.m_fennick == b.m_fennick && a.m_listener == b.m_listener &&
           a.m_sourceName == b.m_sourceName && a.m_multicastTTL == b.m_multicastTTL &&
           a.m_syncUniverse == b.m_syncUniverse && a.m_refreshRate == b.m_refreshRate &&
           a.m_sourceCID == b.m_sourceCID;
  }

 private:
  std::vector<TAVNetworkPreferences> m_tav;
  std::vector<DMXUniversePrefs> m_universes;
  std::string m_x10Port;
  std::string m_x10HouseCodes;
  std::string m_fennickPort;
  FennickPreferences m_fennick;
  DMXListenerPrefs m_listener;
  std::string m_sourceName = "Tessavar Show Player";
  int32_t m_multicastTTL = 1;
  int32_t m_syncUniverse = 0;
  int32_t m_refreshRate = 40;
  std::string m_sourceCID;
  std::vector<std::string> m_problems;
};

}  // namespace tav
