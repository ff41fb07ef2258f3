#include "platform/UdpDatagramNetwork.h"

#include <arpa/inet.h>
#include <ifaddrs.h>
#include <net/if.h>
#include <netdb.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <asio.hpp>
#include <cerrno>
#include <cstring>
#include <vector>

#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kSource = "UdpDatagramNetwork";
constexpr size_t kMaxBatch = 1024;  // sendmmsg takes at most UIO_MAXIOV at once
constexpr size_t kReceiveBatch = 32;
constexpr size_t kReceiveRounds = 8;  // then let the loop run other work first
constexpr size_t kDatagramBytes = 1500;

std::string SystemText(int error) {
  return std::strerror(error);
}

struct Interface {
  std::string name;
  in_addr address{};
  std::optional<in_addr> broadcast;
  unsigned index = 0;
};

// The interface with this name or IPv4 address.
std::optional<Interface> FindInterface(const std::string& nameOrAddress) {
  ifaddrs* list = nullptr;
  if (::getifaddrs(&list) != 0) return std::nullopt;
  std::optional<Interface> found;
  for (ifaddrs* a = list; a && !found; a = a->ifa_next) {
    if (!a->ifa_addr || a->ifa_addr->sa_family != AF_INET) continue;
    in_addr address = reinterpret_cast<sockaddr_in*>(a->ifa_addr)->sin_addr;
    char text[INET_ADDRSTRLEN] = {};
    ::inet_ntop(AF_INET, &address, text, sizeof text);
    if (nameOrAddress != a->ifa_name && nameOrAddress != text) continue;
    Interface i;
    i.name = a->ifa_name;
    i.address = address;
    if ((a->ifa_flags & IFF_BROADCAST) && a->ifa_broadaddr)
      i.broadcast = reinterpret_cast<sockaddr_in*>(a->ifa_broadaddr)->sin_addr;
    i.index = ::if_nametoindex(a->ifa_name);
    found = i;
  }
  ::freeifaddrs(list);
  return found;
}

sockaddr_in ToSockaddr(const IPv4Endpoint& endpoint) {
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_port = htons(endpoint.port);
  std::memcpy(&address.sin_addr, endpoint.address.data(), 4);
  return address;
}

IPv4Endpoint FromSockaddr(const sockaddr_in& address) {
  IPv4Endpoint endpoint;
  std::memcpy(endpoint.address.data(), &address.sin_addr, 4);
  endpoint.port = ntohs(address.sin_port);
  return endpoint;
}

IPv4Endpoint FromInAddr(in_addr address, uint16_t port) {
  IPv4Endpoint endpoint;
  std::memcpy(endpoint.address.data(), &address, 4);
  endpoint.port = port;
  return endpoint;
}

Interface NamedInterface(const std::string& name, const std::string& source) {
  std::optional<Interface> found = FindInterface(name);
  if (!found) {
    throw Error(errors::kInvalidProcedureCall, source,
                "there is no network interface \"" + name + "\" with an IPv4 address");
  }
  return *found;
}

void SetOption(int fd, int level, int name, int value) {
  ::setsockopt(fd, level, name, &value, sizeof value);
}

class FileDescriptor {
 public:
  explicit FileDescriptor(int fd) : m_fd(fd) {}
  ~FileDescriptor() {
    if (m_fd >= 0) ::close(m_fd);
  }
  FileDescriptor(const FileDescriptor&) = delete;
  FileDescriptor& operator=(const FileDescriptor&) = delete;
  int Get() const { return m_fd; }
  int Release() { return std::exchange(m_fd, -1); }

 private:
  int m_fd;
};

class UdpSender : public DatagramSender {
 public:
  UdpSender(int fd, std::optional<Interface> on) : m_fd(fd), m_interface(std::move(on)) {}

  SendResult Send(std::span<const OutgoingDatagram> datagrams) override {
    SendResult result;
    size_t n = datagrams.size();
    if (n == 0) return result;
    if (m_messages.size() < n) {
      m_messages.resize(n);
      m_iov.resize(n);
      m_addresses.resize(n);
    }
    // A batch for one destination (unicast to one controller) goes through
    // a connected socket: the kernel then looks the route up once, not per
    // datagram, which is most of the cost of a large frame.
    bool one = std::all_of(datagrams.begin(), datagrams.end(), [&](const OutgoingDatagram& d) {
      return d.destination == datagrams[0].destination;
    });
    Connect(one ? std::optional<IPv4Endpoint>(datagrams[0].destination) : std::nullopt);
    for (size_t i = 0; i < n; ++i) {
      m_iov[i].iov_base = const_cast<uint8_t*>(datagrams[i].data);
      m_iov[i].iov_len = datagrams[i].size;
      msghdr& h = m_messages[i].msg_hdr;
      h = {};
      if (!m_connected) {
        m_addresses[i] = ToSockaddr(datagrams[i].destination);
        h.msg_name = &m_addresses[i];
        h.msg_namelen = sizeof(sockaddr_in);
      }
      h.msg_iov = &m_iov[i];
      h.msg_iovlen = 1;
    }
    size_t i = 0;
    bool retried = false;
    while (i < n) {
      unsigned chunk = static_cast<unsigned>(std::min(n - i, kMaxBatch));
      int sent = ::sendmmsg(m_fd.Get(), &m_messages[i], chunk, MSG_DONTWAIT);
      if (sent > 0) {
        result.sent += static_cast<size_t>(sent);
        i += static_cast<size_t>(sent);
        retried = false;
        continue;
      }
      int error = sent < 0 ? errno : EAGAIN;
      if (error == EINTR) continue;
      // A connected socket reports an earlier datagram's "port unreachable"
      // on the next send, which then did not happen: once more.
      if (error == ECONNREFUSED && !retried) {
        retried = true;
        continue;
      }
      retried = false;
      if (result.error.empty()) result.error = SystemText(error);
      if (error == EAGAIN || error == EWOULDBLOCK || error == ENOBUFS) {
        // The buffer is full: the rest of this batch cannot leave now.
        result.dropped += n - i;
        break;
      }
      // Particular to this datagram (no route, too large): skip it.
      ++result.dropped;
      ++i;
    }
    return result;
  }

  std::string CheckDestination(const IPv4Endpoint& destination) override {
    FileDescriptor probe(::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0));
    if (probe.Get() < 0) return SystemText(errno);
    if (m_interface) {
      sockaddr_in local{};
      local.sin_family = AF_INET;
      local.sin_addr = m_interface->address;
      if (::bind(probe.Get(), reinterpret_cast<sockaddr*>(&local), sizeof local) != 0)
        return SystemText(errno);
    }
    // Connecting a UDP socket sends nothing; it only looks the route up.
    sockaddr_in remote = ToSockaddr(destination);
    if (::connect(probe.Get(), reinterpret_cast<sockaddr*>(&remote), sizeof remote) != 0)
      return SystemText(errno);
    return "";
  }

  IPv4Endpoint BroadcastAddress(uint16_t port) const override {
    if (m_interface && m_interface->broadcast) return FromInAddr(*m_interface->broadcast, port);
    return {{255, 255, 255, 255}, port};
  }

 private:
  void Connect(std::optional<IPv4Endpoint> destination) {
    if (destination == m_connected) return;
    if (destination) {
      sockaddr_in remote = ToSockaddr(*destination);
      if (::connect(m_fd.Get(), reinterpret_cast<sockaddr*>(&remote), sizeof remote) == 0) {
        m_connected = destination;
        return;
      }
    }
    if (m_connected) {
      sockaddr unspecified{};
      unspecified.sa_family = AF_UNSPEC;
      ::connect(m_fd.Get(), &unspecified, sizeof unspecified);
    }
    m_connected.reset();
  }

  FileDescriptor m_fd;
  std::optional<Interface> m_interface;
  std::optional<IPv4Endpoint> m_connected;
  std::vector<mmsghdr> m_messages;
  std::vector<iovec> m_iov;
  std::vector<sockaddr_in> m_addresses;
};

// The receiver's state lives in a shared core so a handler may destroy the
// receiver while its own batch is being delivered.
struct ReceiverCore : std::enable_shared_from_this<ReceiverCore> {
  ReceiverCore(asio::io_context& context, DatagramNetwork::ReceiveHandler h)
      : socket(context), handler(std::move(h)) {
    for (size_t i = 0; i < kReceiveBatch; ++i) {
      iov[i] = {buffers[i].data(), kDatagramBytes};
      messages[i].msg_hdr.msg_iov = &iov[i];
      messages[i].msg_hdr.msg_iovlen = 1;
    }
  }

  void Wait() {
    socket.async_wait(asio::socket_base::wait_read,
                      [self = shared_from_this()](const asio::error_code& error) {
                        if (error || !self->open) return;
                        self->DrainThenWait();
                      });
  }

  // The loop reports readiness once per arrival (edge-triggered), so the
  // socket is read until empty; after a long run of datagrams the rest is
  // read once other work has had its turn.
  void DrainThenWait() {
    bool more = Drain();
    if (!open) return;
    if (more) {
      asio::post(socket.get_executor(), [self = shared_from_this()] {
        if (self->open) self->DrainThenWait();
      });
    } else {
      Wait();
    }
  }

  // True when datagrams may be left.
  bool Drain() {
    for (size_t round = 0; round < kReceiveRounds; ++round) {
      if (!open) return false;
      for (size_t i = 0; i < kReceiveBatch; ++i) {
        msghdr& h = messages[i].msg_hdr;
        h.msg_name = &sources[i];
        h.msg_namelen = sizeof(sockaddr_in);
        h.msg_flags = 0;
      }
      int n =
          ::recvmmsg(socket.native_handle(), messages.data(), kReceiveBatch, MSG_DONTWAIT, nullptr);
      if (n < 0 && errno == EINTR) continue;
      if (n <= 0) return false;
      batch.clear();
      for (int i = 0; i < n; ++i) {
        const msghdr& h = messages[i].msg_hdr;
        batch.push_back({buffers[i].data(), std::min<size_t>(messages[i].msg_len, kDatagramBytes),
                         (h.msg_flags & MSG_TRUNC) != 0, FromSockaddr(sources[i])});
      }
      handler(batch);
      if (static_cast<size_t>(n) < kReceiveBatch) return false;
    }
    return true;
  }

  asio::ip::udp::socket socket;
  DatagramNetwork::ReceiveHandler handler;
  bool open = true;
  std::array<std::array<uint8_t, kDatagramBytes>, kReceiveBatch> buffers{};
  std::array<iovec, kReceiveBatch> iov{};
  std::array<mmsghdr, kReceiveBatch> messages{};
  std::array<sockaddr_in, kReceiveBatch> sources{};
  std::vector<ReceivedDatagram> batch;
};

class UdpReceiver : public DatagramReceiver {
 public:
  explicit UdpReceiver(std::shared_ptr<ReceiverCore> core) : m_core(std::move(core)) {}
  ~UdpReceiver() override {
    m_core->open = false;
    asio::error_code ignored;
    m_core->socket.close(ignored);
  }

 private:
  std::shared_ptr<ReceiverCore> m_core;
};

}  // namespace

std::unique_ptr<DatagramSender> UdpDatagramNetwork::OpenSender(const std::string& interfaceName,
                                                               int32_t multicastTTL) {
  std::string source = std::string(kSource) + ".OpenSender";
  std::optional<Interface> on;
  if (!interfaceName.empty()) on = NamedInterface(interfaceName, source);
  FileDescriptor fd(::socket(AF_INET, SOCK_DGRAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0));
  if (fd.Get() < 0) throw Error(errno, source, "cannot open a UDP socket: " + SystemText(errno));
  SetOption(fd.Get(), SOL_SOCKET, SO_BROADCAST, 1);
  SetOption(fd.Get(), IPPROTO_IP, IP_MULTICAST_TTL, std::clamp(multicastTTL, 1, 255));
  if (::setsockopt(fd.Get(), SOL_SOCKET, SO_SNDBUFFORCE, &kSendBufferBytes,
                   sizeof kSendBufferBytes) != 0) {
    SetOption(fd.Get(), SOL_SOCKET, SO_SNDBUF, kSendBufferBytes);
  }
  if (on) {
    sockaddr_in local{};
    local.sin_family = AF_INET;
    local.sin_addr = on->address;
    if (::bind(fd.Get(), reinterpret_cast<sockaddr*>(&local), sizeof local) != 0) {
      throw Error(errno, source,
                  "cannot send from interface \"" + interfaceName + "\": " + SystemText(errno));
    }
    ip_mreqn multicast{};
    multicast.imr_address = on->address;
    multicast.imr_ifindex = static_cast<int>(on->index);
    ::setsockopt(fd.Get(), IPPROTO_IP, IP_MULTICAST_IF, &multicast, sizeof multicast);
  }
  return std::make_unique<UdpSender>(fd.Release(), on);
}

bool UdpDatagramNetwork::Resolve(const std::string& host, IPv4Endpoint& endpoint) {
  std::string name = host;
  uint16_t port = 0;
  size_t colon = host.rfind(':');
  if (colon != std::string::npos) {
    std::string portText = host.substr(colon + 1);
    if (portText.empty() || portText.size() > 5 ||
        !std::all_of(portText.begin(), portText.end(), ::isdigit) || std::stoi(portText) == 0 ||
        std::stoi(portText) > 65535) {
      return false;
    }
    port = static_cast<uint16_t>(std::stoi(portText));
    name = host.substr(0, colon);
  }
  addrinfo hints{};
  hints.ai_family = AF_INET;
  hints.ai_socktype = SOCK_DGRAM;
  addrinfo* found = nullptr;
  if (::getaddrinfo(name.c_str(), nullptr, &hints, &found) != 0 || !found) return false;
  endpoint = FromSockaddr(*reinterpret_cast<sockaddr_in*>(found->ai_addr));
  endpoint.port = port;
  ::freeaddrinfo(found);
  return true;
}

std::unique_ptr<DatagramReceiver> UdpDatagramNetwork::OpenReceiver(
    const std::string& interfaceName, uint16_t port, std::optional<IPv4Endpoint> group,
    ReceiveHandler handler) {
  std::string source = std::string(kSource) + ".OpenReceiver";
  std::optional<Interface> on;
  if (!interfaceName.empty()) on = NamedInterface(interfaceName, source);
  FileDescriptor fd(::socket(AF_INET, SOCK_DGRAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0));
  if (fd.Get() < 0) throw Error(errno, source, "cannot open a UDP socket: " + SystemText(errno));
  // Other receivers of the same universe (a visualiser, OLA) may share it.
  SetOption(fd.Get(), SOL_SOCKET, SO_REUSEADDR, 1);
  SetOption(fd.Get(), SOL_SOCKET, SO_RCVBUF, kReceiveBufferBytes);
  sockaddr_in local{};
  local.sin_family = AF_INET;
  local.sin_port = htons(port);
  local.sin_addr.s_addr = htonl(INADDR_ANY);
  if (::bind(fd.Get(), reinterpret_cast<sockaddr*>(&local), sizeof local) != 0) {
    throw Error(errno, source,
                "cannot listen on UDP port " + std::to_string(port) + ": " + SystemText(errno));
  }
  if (group) {
    ip_mreqn membership{};
    std::memcpy(&membership.imr_multiaddr, group->address.data(), 4);
    if (on) {
      membership.imr_address = on->address;
      membership.imr_ifindex = static_cast<int>(on->index);
    }
    if (::setsockopt(fd.Get(), IPPROTO_IP, IP_ADD_MEMBERSHIP, &membership, sizeof membership) !=
        0) {
      IPv4Endpoint shown = *group;
      std::string text = shown.ToString();
      throw Error(errno, source,
                  "cannot join " + text.substr(0, text.find(':')) + " on " +
                      (on ? "interface \"" + interfaceName + "\"" : "the default interface") +
                      ": " + SystemText(errno));
    }
  }
  auto core = std::make_shared<ReceiverCore>(m_loop.Context(), std::move(handler));
  asio::error_code error;
  core->socket.assign(asio::ip::udp::v4(), fd.Get(), error);
  if (error) throw Error(error.value(), source, error.message());
  fd.Release();
  core->Wait();
  return std::make_unique<UdpReceiver>(core);
}

}  // namespace tav
