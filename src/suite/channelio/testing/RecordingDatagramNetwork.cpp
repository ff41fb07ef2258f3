#include "suite/channelio/testing/RecordingDatagramNetwork.h"

#include "support/Error.h"

namespace tav {

struct RecordingDatagramNetwork::Core {
  struct Open {
    Receiver receiver;
    ReceiveHandler handler;
  };
  std::map<int, Open> receivers;
  int next = 0;
};

namespace {

class RecordingSender : public DatagramSender {
 public:
  RecordingSender(
      std::string interfaceName, IPv4Endpoint broadcast,
      std::function<SendResult(const std::string&, std::span<const OutgoingDatagram>)> send,
      std::function<std::string(const IPv4Endpoint&)> check)
      : m_interface(std::move(interfaceName)),
        m_broadcast(broadcast),
        m_send(std::move(send)),
        m_check(std::move(check)) {}
  SendResult Send(std::span<const OutgoingDatagram> datagrams) override {
    return m_send(m_interface, datagrams);
  }
  std::string CheckDestination(const IPv4Endpoint& destination) override {
    return m_check(destination);
  }
  IPv4Endpoint BroadcastAddress(uint16_t port) const override {
    IPv4Endpoint endpoint = m_broadcast;
    endpoint.port = port;
    return endpoint;
  }

 private:
  std::string m_interface;
  IPv4Endpoint m_broadcast;
  std::function<SendResult(const std::string&, std::span<const OutgoingDatagram>)> m_send;
  std::function<std::string(const IPv4Endpoint&)> m_check;
};

class RecordingReceiver : public DatagramReceiver {
 public:
  RecordingReceiver(std::shared_ptr<RecordingDatagramNetwork::Core> core, int id)
      : m_core(std::move(core)), m_id(id) {}
  ~RecordingReceiver() override { m_core->receivers.erase(m_id); }

 private:
  std::shared_ptr<RecordingDatagramNetwork::Core> m_core;
  int m_id;
};

}  // namespace

std::unique_ptr<DatagramSender> RecordingDatagramNetwork::OpenSender(
    const std::string& interfaceName, int32_t) {
  IPv4Endpoint broadcast{{255, 255, 255, 255}, 0};
  if (!interfaceName.empty()) {
    auto it = m_interfaces.find(interfaceName);
    if (it == m_interfaces.end())
      throw Error(5, "RecordingDatagramNetwork.OpenSender",
                  "there is no network interface \"" + interfaceName + "\"");
    broadcast = it->second;
  }
  ++m_sendersOpened;
  auto send = [this](const std::string& interfaceName,
                     std::span<const OutgoingDatagram> datagrams) {
    SendResult result;
    ++m_batches;
    if (m_bufferFull) {
      result.dropped = datagrams.size();
      result.error = "Resource temporarily unavailable";
      return result;
    }
    for (const auto& d : datagrams) {
      m_sent.push_back({interfaceName, d.destination, std::vector<uint8_t>(d.data, d.data + d.size),
                        m_clock.TickCount(), m_batches});
      ++result.sent;
    }
    return result;
  };
  auto check = [this](const IPv4Endpoint& destination) -> std::string {
    return m_unreachable.count(destination) ? "Network is unreachable" : "";
  };
  return std::make_unique<RecordingSender>(interfaceName, broadcast, send, check);
}

bool RecordingDatagramNetwork::Resolve(const std::string& host, IPv4Endpoint& endpoint) {
  auto it = m_hosts.find(host);
  if (it == m_hosts.end()) return false;
  endpoint = it->second;
  return true;
}

std::unique_ptr<DatagramReceiver> RecordingDatagramNetwork::OpenReceiver(
    const std::string& interfaceName, uint16_t port, std::optional<IPv4Endpoint> group,
    ReceiveHandler handler) {
  if (m_failReceiver)
    throw Error(98, "RecordingDatagramNetwork.OpenReceiver", "Address already in use");
  if (!m_core) m_core = std::make_shared<Core>();
  int id = ++m_core->next;
  m_core->receivers[id] = {{interfaceName, port, group, true}, std::move(handler)};
  return std::make_unique<RecordingReceiver>(m_core, id);
}

std::vector<RecordingDatagramNetwork::Receiver> RecordingDatagramNetwork::Receivers() const {
  std::vector<Receiver> list;
  if (!m_core) return list;
  for (const auto& [id, open] : m_core->receivers) list.push_back(open.receiver);
  return list;
}

void RecordingDatagramNetwork::Deliver(uint16_t port, const std::vector<uint8_t>& bytes,
                                       IPv4Endpoint source, bool truncated) {
  if (!m_core) return;
  std::vector<ReceiveHandler> handlers;
  for (const auto& [id, open] : m_core->receivers) {
    if (open.receiver.port == port) handlers.push_back(open.handler);
  }
  ReceivedDatagram datagram{bytes.data(), bytes.size(), truncated, source};
  for (auto& handler : handlers) handler(std::span<const ReceivedDatagram>(&datagram, 1));
}

}  // namespace tav
