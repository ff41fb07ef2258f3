#pragma once
// Test double for the DatagramNetwork port: senders record every datagram
// (bytes, destination, and the tick of the clock it was sent at) in one list
// shared by the network, receivers let a test deliver datagrams as the loop
// would. Faults on request: unknown interfaces, unreachable destinations, a
// full buffer that drops what is sent, a port that cannot be bound.

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "ports/Clock.h"
#include "suite/channelio/Datagram.h"

namespace tav {

class RecordingDatagramNetwork : public DatagramNetwork {
 public:
  struct Sent {
    std::string interfaceName;  // of the sender
    IPv4Endpoint destination;
    std::vector<uint8_t> bytes;
    uint32_t tick = 0;
    size_t batch = 0;  // which Send call, counting from 1 over the network
  };
  struct Receiver {
    std::string interfaceName;
    uint16_t port = 0;
    std::optional<IPv4Endpoint> group;
    bool open = true;
  };

  explicit RecordingDatagramNetwork(const Clock& clock) : m_clock(clock) {}

  std::unique_ptr<DatagramSender> OpenSender(const std::string& interfaceName,
                                             int32_t multicastTTL) override;
  bool Resolve(const std::string& host, IPv4Endpoint& endpoint) override;
  std::unique_ptr<DatagramReceiver> OpenReceiver(const std::string& interfaceName, uint16_t port,
                                                 std::optional<IPv4Endpoint> group,
                                                 ReceiveHandler handler) override;

  // --- For tests ---
  std::vector<Sent>& SentDatagrams() { return m_sent; }
  void ClearSent() { m_sent.clear(); }
  size_t Batches() const { return m_batches; }
  size_t SendersOpened() const { return m_sendersOpened; }
  std::vector<Receiver> Receivers() const;

  void AddInterface(const std::string& name, IPv4Endpoint broadcast) {
    m_interfaces[name] = broadcast;
  }
  void SetUnreachable(const IPv4Endpoint& destination) { m_unreachable.insert(destination); }
  void AddHost(const std::string& name, IPv4Endpoint endpoint) { m_hosts[name] = endpoint; }
  // While set, every Send drops all it is given.
  void SetBufferFull(bool full) { m_bufferFull = full; }
  void FailReceiverOpen(bool fail) { m_failReceiver = fail; }
  // Hands a datagram to every open receiver on `port`.
  void Deliver(uint16_t port, const std::vector<uint8_t>& bytes, IPv4Endpoint source = {},
               bool truncated = false);

  struct Core;

 private:
  const Clock& m_clock;
  std::vector<Sent> m_sent;
  size_t m_batches = 0;
  size_t m_sendersOpened = 0;
  std::map<std::string, IPv4Endpoint> m_interfaces;
  std::set<IPv4Endpoint> m_unreachable;
  std::map<std::string, IPv4Endpoint> m_hosts;
  bool m_bufferFull = false;
  bool m_failReceiver = false;
  std::shared_ptr<Core> m_core;
};

}  // namespace tav
