#pragma once
// The DatagramNetwork port on Linux UDP sockets and the program's event
// loop. Senders are non-blocking sockets that put a whole batch on the wire
// with sendmmsg (1024 datagrams per call at most); what the socket cannot
// take at once is dropped and counted, so the loop never waits on the
// network. Receivers wait on the loop and drain their socket with recvmmsg,
// handing each batch to the handler on the loop thread.
//
// Interfaces are found by name or by one of their IPv4 addresses
// (getifaddrs); a sender on an interface binds to its address and sends
// multicast through it. Owned by the composition root; the EventLoop must
// outlive it and every receiver it opens.

#include "platform/EventLoop.h"
#include "suite/channelio/Datagram.h"

namespace tav {

class UdpDatagramNetwork : public DatagramNetwork {
 public:
  // Send buffer asked for each sender: a frame of 1,000 universes is about
  // 640 kB. The kernel caps it at net.core.wmem_max unless the program may
  // override that (CAP_NET_ADMIN).
  static constexpr int kSendBufferBytes = 4 << 20;
  static constexpr int kReceiveBufferBytes = 1 << 20;

  explicit UdpDatagramNetwork(EventLoop& loop) : m_loop(loop) {}

  std::unique_ptr<DatagramSender> OpenSender(const std::string& interfaceName,
                                             int32_t multicastTTL) override;
  bool Resolve(const std::string& host, IPv4Endpoint& endpoint) override;
  std::unique_ptr<DatagramReceiver> OpenReceiver(const std::string& interfaceName, uint16_t port,
                                                 std::optional<IPv4Endpoint> group,
                                                 ReceiveHandler handler) override;

 private:
  EventLoop& m_loop;
};

}  // namespace tav
