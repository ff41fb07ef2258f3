#pragma once
// Port: UDP as the hardware-I/O control uses it. A sender puts batches of
// datagrams on the wire from one network interface without ever blocking the
// loop; a receiver hands the datagrams that arrive for a port (and a
// multicast group) to a handler on the loop. Addresses are plain IPv4 values
// so no socket type reaches the core.
//
// The adapter (platform/UdpDatagramNetwork) batches a sender's datagrams
// into as few system calls as the platform allows (sendmmsg on Linux);
// a test double records them.

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace tav {

struct IPv4Endpoint {
  std::array<uint8_t, 4> address{};
  uint16_t port = 0;

  bool IsMulticast() const { return address[0] >= 224 && address[0] <= 239; }
  // "a.b.c.d:port"
  std::string ToString() const;
  friend bool operator==(const IPv4Endpoint&, const IPv4Endpoint&) = default;
  friend auto operator<=>(const IPv4Endpoint&, const IPv4Endpoint&) = default;
};

// Reads "a.b.c.d" (the port is then `defaultPort`) or "a.b.c.d:port".
// False for anything else, host names included.
bool ParseIPv4Endpoint(std::string_view text, uint16_t defaultPort, IPv4Endpoint& endpoint);

struct OutgoingDatagram {
  const uint8_t* data = nullptr;
  size_t size = 0;
  IPv4Endpoint destination;
};

struct SendResult {
  size_t sent = 0;
  size_t dropped = 0;  // a full buffer or an unreachable destination
  std::string error;   // why the first dropped datagram was dropped; "" when none was
};

class DatagramSender {
 public:
  virtual ~DatagramSender() = default;
  // Sends the datagrams in order. Never blocks: what cannot leave at once
  // (the socket's buffer is full) is dropped and counted.
  virtual SendResult Send(std::span<const OutgoingDatagram> datagrams) = 0;
  // "" when datagrams to this unicast destination can leave from the
  // sender's interface; otherwise the reason ("Network is unreachable").
  virtual std::string CheckDestination(const IPv4Endpoint& destination) = 0;
  // The broadcast address of the sender's interface, or 255.255.255.255
  // when it was opened on no interface in particular.
  virtual IPv4Endpoint BroadcastAddress(uint16_t port) const = 0;
};

struct ReceivedDatagram {
  const uint8_t* data = nullptr;
  size_t size = 0;
  bool truncated = false;  // longer than the receiver's buffer; `data` holds the start
  IPv4Endpoint source;
};

class DatagramReceiver {
 public:
  virtual ~DatagramReceiver() = default;
};

class DatagramNetwork {
 public:
  using ReceiveHandler = std::function<void(std::span<const ReceivedDatagram>)>;

  virtual ~DatagramNetwork() = default;
  // A sender on the named interface ("eth0", or one of its IPv4 addresses;
  // "" for the system's choice), with this multicast TTL. Throws tav::Error
  // naming the interface when it does not exist or has no IPv4 address.
  virtual std::unique_ptr<DatagramSender> OpenSender(const std::string& interfaceName,
                                                     int32_t multicastTTL) = 0;
  // Looks a unicast destination up: an IPv4 address, or a host name through
  // the system's resolver (which may take a while: only called when
  // preferences are applied). False when it cannot be found.
  virtual bool Resolve(const std::string& host, IPv4Endpoint& endpoint) = 0;
  // Receives what is sent to `port` on any local address, and to `group`
  // (a multicast address) joined on the named interface. The handler runs on
  // the loop with each batch that arrived; the data is valid during the
  // call only. Closing the receiver (destroying it) stops the calls.
  // Throws tav::Error when the port cannot be bound or the group joined.
  virtual std::unique_ptr<DatagramReceiver> OpenReceiver(const std::string& interfaceName,
                                                         uint16_t port,
                                                         std::optional<IPv4Endpoint> group,
                                                         ReceiveHandler handler) = 0;
};

}  // namespace tav
