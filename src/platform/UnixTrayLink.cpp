#include "platform/UnixTrayLink.h"

#include <fcntl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <asio.hpp>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <map>

#include "platform/TrayLinkFrame.h"
#include "support/Error.h"

namespace tav {
namespace {

using Socket = asio::local::stream_protocol::socket;

constexpr const char* kSource = "UnixTrayLink";
constexpr size_t kReadChunk = 16 * 1024;

Error Unavailable(const std::string& description) {
  return Error(kTrayLinkUnavailable, kSource, description);
}

std::string SystemText(int error) {
  return std::strerror(error);
}

std::string ParentOf(const std::string& path) {
  size_t slash = path.rfind('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

// Creates `dir` and its missing parents, each only its user may enter.
void MakeDirectories(const std::string& dir) {
  struct stat info {};
  if (::stat(dir.c_str(), &info) == 0) {
    if (!S_ISDIR(info.st_mode)) throw Unavailable(dir + " is not a directory");
    return;
  }
  std::string parent = ParentOf(dir);
  if (parent != dir) MakeDirectories(parent);
  if (::mkdir(dir.c_str(), 0700) != 0 && errno != EEXIST) {
    throw Unavailable("Cannot create " + dir + ": " + SystemText(errno));
  }
}

// Another user must not be able to put a socket of their own in our place:
// the directory is ours, or a shared one that protects its entries (sticky,
// owned by root, like /tmp).
void CheckDirectory(const std::string& dir) {
  struct stat info {};
  if (::stat(dir.c_str(), &info) != 0)
    throw Unavailable("Cannot use " + dir + ": " + SystemText(errno));
  bool ours = info.st_uid == ::geteuid();
  bool sharedButSafe = info.st_uid == 0 && (info.st_mode & S_ISVTX);
  if (!ours && !sharedButSafe) throw Unavailable(dir + " belongs to another user");
}

void SetCloseOnExec(int fd) {
  // Shell commands the player starts must not inherit the socket: a child
  // holding the listening socket would make a later player think one runs.
  int flags = ::fcntl(fd, F_GETFD);
  if (flags >= 0) ::fcntl(fd, F_SETFD, flags | FD_CLOEXEC);
}

enum class Probe { kNothing, kStale, kLive };

Probe ProbeSocket(const std::string& path) {
  struct stat info {};
  if (::lstat(path.c_str(), &info) != 0) {
    if (errno == ENOENT) return Probe::kNothing;
    throw Unavailable("Cannot use " + path + ": " + SystemText(errno));
  }
  if (!S_ISSOCK(info.st_mode)) throw Unavailable(path + " exists and is not a socket");
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.size() >= sizeof(address.sun_path)) throw Unavailable("Socket path too long: " + path);
  std::memcpy(address.sun_path, path.c_str(), path.size() + 1);
  // Never a blocking connect: a player that is alive but stuck, with its
  // queue of waiting connections full, would keep it waiting for ever. A
  // full queue (EAGAIN) means somebody listens there all the same.
  int fd = ::socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0);
  if (fd < 0) throw Unavailable("Cannot make a socket: " + SystemText(errno));
  int result = ::connect(fd, reinterpret_cast<sockaddr*>(&address), sizeof(address));
  int error = errno;
  ::close(fd);
  if (result == 0 || error == EAGAIN || error == EINPROGRESS) return Probe::kLive;
  if (error == ECONNREFUSED) return Probe::kStale;
  if (error == ENOENT) return Probe::kNothing;
  throw Unavailable("Cannot use " + path + ": " + SystemText(error));
}

struct Connection {
  Connection(Socket s, uint32_t h, uint32_t maxFrameBytes)
      : handle(h), socket(std::move(s)), reader(maxFrameBytes) {}

  size_t Queued() const { return pending.size() - pendingOffset; }

  uint32_t handle;
  Socket socket;
  TrayFrameReader reader;
  std::array<char, kReadChunk> readBuffer{};
  std::string pending;  // encoded frames not yet written, from pendingOffset on
  size_t pendingOffset = 0;
  bool waitingToWrite = false;
  bool open = true;
};

}  // namespace

struct UnixTrayLink::Impl : std::enable_shared_from_this<UnixTrayLink::Impl> {
  Impl(asio::io_context& c, std::string p, UnixTrayLinkLimits l)
      : context(c), path(std::move(p)), limits(l), acceptor(c), acceptRetry(c) {}

  void Listen();
  void Accept();
  void Adopt(Socket socket);
  void Read(const std::shared_ptr<Connection>& connection);
  void Flush(const std::shared_ptr<Connection>& connection);
  void Drop(const std::shared_ptr<Connection>& connection, const std::string& reason);
  bool Send(uint32_t targetHwnd, const TrayFrame& frame);
  void Close();
  uint32_t NewHandle();

  asio::io_context& context;
  std::string path;
  UnixTrayLinkLimits limits;
  asio::local::stream_protocol::acceptor acceptor;
  asio::steady_timer acceptRetry;
  std::map<uint32_t, std::shared_ptr<Connection>> connections;
  uint32_t nextHandle = kPlayerHandle + 1;
  uint64_t refused = 0;
  bool closed = false;
  dev_t socketDevice = 0;
  ino_t socketInode = 0;
  std::function<void(const TrayFrame&)> onFrame;
  std::function<void(uint32_t)> onConnect;
  std::function<void(uint32_t, const std::string&)> onDisconnect;
};

void UnixTrayLink::Impl::Listen() {
  std::string dir = ParentOf(path);
  MakeDirectories(dir);
  CheckDirectory(dir);
  switch (ProbeSocket(path)) {
    case Probe::kLive:
      throw Error(kTrayLinkInUse, kSource,
                  "Another show player is running (it listens at " + path + ")");
    case Probe::kStale:
      // Left by a player that died: nobody answers there any more.
      ::unlink(path.c_str());
      break;
    case Probe::kNothing:
      break;
  }
  try {
    asio::local::stream_protocol::endpoint endpoint(path);
    acceptor.open(endpoint.protocol());
    SetCloseOnExec(acceptor.native_handle());
    // The socket file is made with mode 0600 from the start: connecting needs
    // write permission on it, so only this user can talk to the player.
    mode_t previous = ::umask(0177);
    asio::error_code bindError;
    acceptor.bind(endpoint, bindError);
    ::umask(previous);
    if (bindError) throw asio::system_error(bindError);
    acceptor.listen(static_cast<int>(limits.maxConnections) + 4);
  } catch (const std::exception& e) {
    asio::error_code ignored;
    acceptor.close(ignored);
    throw Unavailable("Cannot listen at " + path + ": " + e.what());
  }
  struct stat info {};
  if (::stat(path.c_str(), &info) == 0) {
    socketDevice = info.st_dev;
    socketInode = info.st_ino;
  }
}

void UnixTrayLink::Impl::Accept() {
  std::weak_ptr<Impl> weak = weak_from_this();
  acceptor.async_accept([weak](const asio::error_code& error, Socket socket) {
    auto self = weak.lock();
    if (!self || self->closed) return;
    if (error) {
      if (error == asio::error::operation_aborted) return;
      // Out of descriptors, say: try again shortly rather than spin.
      self->acceptRetry.expires_after(std::chrono::milliseconds(100));
      self->acceptRetry.async_wait([weak](const asio::error_code& waitError) {
        auto again = weak.lock();
        if (again && !again->closed && !waitError) again->Accept();
      });
      return;
    }
    self->Adopt(std::move(socket));
    if (!self->closed) self->Accept();
  });
}

uint32_t UnixTrayLink::Impl::NewHandle() {
  while (nextHandle == 0 || nextHandle == kPlayerHandle || connections.count(nextHandle)) {
    ++nextHandle;
  }
  return nextHandle++;
}

void UnixTrayLink::Impl::Adopt(Socket socket) {
  asio::error_code ignored;
  if (connections.size() >= limits.maxConnections) {
    ++refused;
    socket.close(ignored);
    return;
  }
  SetCloseOnExec(socket.native_handle());
  socket.non_blocking(true, ignored);
  uint32_t handle = NewHandle();
  auto connection = std::make_shared<Connection>(std::move(socket), handle, limits.maxFrameBytes);
  connections[handle] = connection;
  if (onConnect) {
    auto callback = onConnect;
    callback(handle);
  }
  if (connection->open && !closed) Read(connection);
}

void UnixTrayLink::Impl::Read(const std::shared_ptr<Connection>& connection) {
  std::weak_ptr<Impl> weak = weak_from_this();
  connection->socket.async_read_some(
      asio::buffer(connection->readBuffer),
      [weak, connection](const asio::error_code& error, size_t count) {
        auto self = weak.lock();
        if (!self || self->closed || !connection->open) return;
        if (error) {
          self->Drop(connection, error == asio::error::eof ? "closed" : error.message());
          return;
        }
        connection->reader.Append(std::string_view(connection->readBuffer.data(), count));
        TrayFrame frame;
        for (;;) {
          TrayFrameStatus status = connection->reader.Next(frame);
          if (status == TrayFrameStatus::kIncomplete) break;
          if (status != TrayFrameStatus::kFrame) {
            self->Drop(connection, TrayFrameStatusText(status));
            return;
          }
          // Whatever the tray wrote there, the frame is from this connection.
          frame.senderHwnd = connection->handle;
          if (self->onFrame) {
            auto callback = self->onFrame;
            callback(frame);
          }
          if (self->closed || !connection->open) return;
        }
        self->Read(connection);
      });
}

bool UnixTrayLink::Impl::Send(uint32_t targetHwnd, const TrayFrame& frame) {
  auto it = connections.find(targetHwnd);
  if (it == connections.end()) return false;
  std::shared_ptr<Connection> connection = it->second;
  AppendTrayFrame(connection->pending, frame);
  if (!connection->waitingToWrite) Flush(connection);
  if (!connection->open) return false;
  if (connection->Queued() > limits.maxQueuedBytes) {
    Drop(connection, "tray not reading");
    return false;
  }
  return true;
}

void UnixTrayLink::Impl::Flush(const std::shared_ptr<Connection>& connection) {
  while (connection->Queued() > 0) {
    asio::error_code error;
    size_t written = connection->socket.write_some(
        asio::buffer(connection->pending.data() + connection->pendingOffset, connection->Queued()),
        error);
    if (error == asio::error::would_block || error == asio::error::try_again) break;
    if (error) {
      Drop(connection, "write failed: " + error.message());
      return;
    }
    connection->pendingOffset += written;
  }
  if (connection->Queued() == 0) {
    connection->pending.clear();
    connection->pendingOffset = 0;
    return;
  }
  if (connection->pendingOffset >= connection->pending.size() / 2) {
    connection->pending.erase(0, connection->pendingOffset);
    connection->pendingOffset = 0;
  }
  connection->waitingToWrite = true;
  std::weak_ptr<Impl> weak = weak_from_this();
  connection->socket.async_wait(Socket::wait_write,
                                [weak, connection](const asio::error_code& error) {
                                  auto self = weak.lock();
                                  if (!self || self->closed || !connection->open) return;
                                  connection->waitingToWrite = false;
                                  if (error) {
                                    self->Drop(connection, error.message());
                                    return;
                                  }
                                  self->Flush(connection);
                                });
}

void UnixTrayLink::Impl::Drop(const std::shared_ptr<Connection>& connection,
                              const std::string& reason) {
  if (!connection->open) return;
  connection->open = false;
  asio::error_code ignored;
  connection->socket.close(ignored);
  connections.erase(connection->handle);
  // Reported from the loop, so that a Send that drops a tray never calls
  // back into its caller.
  std::weak_ptr<Impl> weak = weak_from_this();
  asio::post(context, [weak, handle = connection->handle, reason] {
    auto self = weak.lock();
    if (!self || self->closed || !self->onDisconnect) return;
    auto callback = self->onDisconnect;
    callback(handle, reason);
  });
}

void UnixTrayLink::Impl::Close() {
  if (closed) return;
  closed = true;
  asio::error_code ignored;
  acceptor.close(ignored);
  acceptRetry.cancel();
  for (auto& [handle, connection] : connections) {
    connection->open = false;
    connection->socket.close(ignored);
  }
  connections.clear();
  // Remove the socket file only if it is still ours: a newer player may
  // have replaced it.
  struct stat info {};
  if (socketInode != 0 && ::stat(path.c_str(), &info) == 0 && info.st_dev == socketDevice &&
      info.st_ino == socketInode) {
    ::unlink(path.c_str());
  }
}

std::string UnixTrayLink::DefaultSocketPath() {
  const char* explicitPath = std::getenv("TAV_TRAY_SOCKET");
  if (explicitPath != nullptr && *explicitPath != '\0') return explicitPath;
  const char* runtimeDir = std::getenv("XDG_RUNTIME_DIR");
  if (runtimeDir != nullptr && *runtimeDir != '\0') {
    return std::string(runtimeDir) + "/tessavar/showplayer.sock";
  }
  return "/tmp/tessavar-" + std::to_string(::getuid()) + "/showplayer.sock";
}

UnixTrayLink::UnixTrayLink(EventLoop& loop, std::string socketPath, UnixTrayLinkLimits limits)
    : m_impl(std::make_shared<Impl>(loop.Context(), std::move(socketPath), limits)) {
  m_impl->Listen();
  m_impl->Accept();
}

UnixTrayLink::~UnixTrayLink() {
  m_impl->Close();
}

const std::string& UnixTrayLink::SocketPath() const {
  return m_impl->path;
}

size_t UnixTrayLink::ConnectionCount() const {
  return m_impl->connections.size();
}

size_t UnixTrayLink::QueuedBytes(uint32_t hwnd) const {
  auto it = m_impl->connections.find(hwnd);
  return it == m_impl->connections.end() ? 0 : it->second->Queued();
}

uint64_t UnixTrayLink::RefusedConnections() const {
  return m_impl->refused;
}

void UnixTrayLink::Close() {
  m_impl->Close();
}

bool UnixTrayLink::Send(uint32_t targetHwnd, const TrayFrame& frame) {
  if (m_impl->closed) return false;
  return m_impl->Send(targetHwnd, frame);
}

void UnixTrayLink::SetOnFrame(std::function<void(const TrayFrame&)> onFrame) {
  m_impl->onFrame = std::move(onFrame);
}

void UnixTrayLink::SetOnConnect(std::function<void(uint32_t)> onConnect) {
  m_impl->onConnect = std::move(onConnect);
}

void UnixTrayLink::SetOnDisconnect(std::function<void(uint32_t, const std::string&)> onDisconnect) {
  m_impl->onDisconnect = std::move(onDisconnect);
}

}  // namespace tav
