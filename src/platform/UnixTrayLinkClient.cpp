#include "platform/UnixTrayLinkClient.h"

#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>

#include "platform/UnixTrayLink.h"
#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kSource = "UnixTrayLinkClient";

Error Unavailable(const std::string& description) {
  return Error(kTrayLinkUnavailable, kSource, description);
}

}  // namespace

UnixTrayLinkClient::UnixTrayLinkClient(const std::string& socketPath, uint32_t maxFrameBytes)
    : m_reader(maxFrameBytes) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (socketPath.size() >= sizeof(address.sun_path)) {
    throw Unavailable("Socket path too long: " + socketPath);
  }
  std::memcpy(address.sun_path, socketPath.c_str(), socketPath.size() + 1);
  m_fd = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (m_fd < 0) throw Unavailable(std::string("Cannot make a socket: ") + std::strerror(errno));
  if (::connect(m_fd, reinterpret_cast<sockaddr*>(&address), sizeof(address)) != 0) {
    int error = errno;
    ::close(m_fd);
    m_fd = -1;
    if (error == ENOENT || error == ECONNREFUSED) {
      throw Unavailable("The show player is not running (nothing listens at " + socketPath + ")");
    }
    throw Unavailable("Cannot reach the show player at " + socketPath + ": " +
                      std::strerror(error));
  }
}

UnixTrayLinkClient::~UnixTrayLinkClient() {
  if (m_fd >= 0) ::close(m_fd);
}

void UnixTrayLinkClient::Send(const TrayFrame& frame) {
  SendBytes(EncodeTrayFrame(frame));
}

void UnixTrayLinkClient::SendBytes(std::string_view bytes) {
  while (!bytes.empty()) {
    ssize_t written = ::send(m_fd, bytes.data(), bytes.size(), MSG_NOSIGNAL);
    if (written < 0) {
      if (errno == EINTR) continue;
      if (errno == EPIPE || errno == ECONNRESET) m_closed = true;
      throw Unavailable(std::string("Cannot send to the show player: ") + std::strerror(errno));
    }
    bytes.remove_prefix(static_cast<size_t>(written));
  }
}

void UnixTrayLinkClient::FinishSending() {
  ::shutdown(m_fd, SHUT_WR);
}

std::optional<TrayFrame> UnixTrayLinkClient::Receive(int timeoutMs) {
  using SteadyClock = std::chrono::steady_clock;
  auto deadline = SteadyClock::now() + std::chrono::milliseconds(timeoutMs < 0 ? 0 : timeoutMs);
  char buffer[64 * 1024];
  for (;;) {
    TrayFrame frame;
    TrayFrameStatus status = m_reader.Next(frame);
    if (status == TrayFrameStatus::kFrame) return frame;
    if (status != TrayFrameStatus::kIncomplete) {
      throw Unavailable(std::string("The show player sent a ") + TrayFrameStatusText(status));
    }
    if (m_closed) throw Unavailable("The show player closed the connection");

    int wait = -1;
    if (timeoutMs >= 0) {
      auto left =
          std::chrono::duration_cast<std::chrono::milliseconds>(deadline - SteadyClock::now());
      // A time limit that has passed still looks once at what has arrived.
      wait = left.count() > 0 ? static_cast<int>(left.count()) : 0;
    }
    pollfd poller{m_fd, POLLIN, 0};
    int ready = ::poll(&poller, 1, wait);
    if (ready < 0) {
      if (errno == EINTR) continue;
      throw Unavailable(std::string("Cannot wait for the show player: ") + std::strerror(errno));
    }
    if (ready == 0) return std::nullopt;
    ssize_t count = ::recv(m_fd, buffer, sizeof(buffer), 0);
    if (count < 0) {
      if (errno == EINTR || errno == EAGAIN) continue;
      m_closed = true;
      throw Unavailable(std::string("Connection to the show player failed: ") +
                        std::strerror(errno));
    }
    if (count == 0) {
      m_closed = true;
      throw Unavailable("The show player closed the connection");
    }
    m_reader.Append(std::string_view(buffer, static_cast<size_t>(count)));
  }
}

}  // namespace tav
