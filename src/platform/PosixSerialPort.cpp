#include "platform/PosixSerialPort.h"

#include <poll.h>
#include <sys/ioctl.h>
#include <termios.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <asio.hpp>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <deque>
#include <thread>
#include <vector>

#include "platform/PosixSerialDevice.h"
#include "suite/channelio/serial/SerialLineTiming.h"

namespace tav {
namespace {

using SteadyClock = std::chrono::steady_clock;

struct Chunk {
  std::vector<uint8_t> bytes;
  size_t offset = 0;
  uint32_t breakMicros = 0;  // 0: no break before these bytes
  uint32_t markMicros = 0;
};

std::string SystemText(int error) {
  return std::strerror(error);
}

}  // namespace

// The link's state, shared with the handlers it leaves on the loop so that a
// handler running after the link is gone finds `closed` and does nothing.
struct LinkCore : std::enable_shared_from_this<LinkCore> {
  LinkCore(asio::io_context& c, SerialSettings s, PosixSerialOptions o)
      : context(c),
        settings(std::move(s)),
        options(o),
        descriptor(c),
        breakTimer(c),
        reopenTimer(c),
        reopenMs(o.firstReopenMs) {}

  void Adopt(int fd);
  void Read();
  bool Queue(std::span<const uint8_t> bytes, uint32_t breakMicros, uint32_t markMicros);
  void Flush();
  void WaitWritable();
  void BeginBreak();
  void Lost(const std::string& reason);
  void Reopen();
  void Report(bool connected, const std::string& reason);
  void FlushBeforeClose(std::chrono::milliseconds limit);
  void Close();
  int Fd() { return descriptor.native_handle(); }

  asio::io_context& context;
  SerialSettings settings;
  PosixSerialOptions options;
  asio::posix::stream_descriptor descriptor;
  asio::steady_timer breakTimer;
  asio::steady_timer reopenTimer;
  uint32_t reopenMs;
  bool connected = false;
  bool closed = false;
  bool waitingToWrite = false;
  bool inBreak = false;
  std::deque<Chunk> queue;
  size_t queued = 0;
  SteadyClock::time_point lineFreeAt{};
  std::array<uint8_t, 4096> readBuffer{};
  std::function<void(std::span<const uint8_t>)> onReceive;
  std::function<void(bool, const std::string&)> onConnectionChange;
};

void LinkCore::Adopt(int fd) {
  descriptor.assign(fd);
  connected = true;
  reopenMs = options.firstReopenMs;
  lineFreeAt = SteadyClock::now();
  Read();
}

void LinkCore::Read() {
  std::weak_ptr<LinkCore> weak = weak_from_this();
  descriptor.async_wait(
      asio::posix::stream_descriptor::wait_read, [weak](const asio::error_code& error) {
        auto self = weak.lock();
        if (!self || self->closed || !self->connected) return;
        if (error) {
          if (error != asio::error::operation_aborted) self->Lost(error.message());
          return;
        }
        for (;;) {
          const ssize_t n = ::read(self->Fd(), self->readBuffer.data(), self->readBuffer.size());
          if (n > 0) {
            if (self->onReceive) {
              auto handler = self->onReceive;
              handler(std::span<const uint8_t>(self->readBuffer.data(), static_cast<size_t>(n)));
            }
            if (self->closed || !self->connected) return;
            continue;
          }
          if (n < 0 && errno == EINTR) continue;
          if (n < 0 && (errno == EAGAIN || errno == EWOULDBLOCK)) break;
          self->Lost(n == 0 ? "the device hung up" : SystemText(errno));
          return;
        }
        self->Read();
      });
}

bool LinkCore::Queue(std::span<const uint8_t> bytes, uint32_t breakMicros, uint32_t markMicros) {
  if (closed || !connected) return false;
  if (queued + bytes.size() > options.maxQueuedBytes) return false;
  queue.push_back({std::vector<uint8_t>(bytes.begin(), bytes.end()), 0, breakMicros, markMicros});
  queued += bytes.size();
  if (!waitingToWrite && !inBreak) Flush();
  return true;
}

void LinkCore::Flush() {
  while (!queue.empty() && connected && !closed) {
    Chunk& chunk = queue.front();
    if (chunk.breakMicros > 0) {
      BeginBreak();
      return;
    }
    const ssize_t n =
        ::write(Fd(), chunk.bytes.data() + chunk.offset, chunk.bytes.size() - chunk.offset);
    if (n < 0) {
      if (errno == EINTR) continue;
      if (errno == EAGAIN || errno == EWOULDBLOCK) {
        WaitWritable();
        return;
      }
      Lost(SystemText(errno));
      return;
    }
    const auto now = SteadyClock::now();
    lineFreeAt =
        std::max(now, lineFreeAt) + std::chrono::microseconds(SerialLineMicros(
                                        static_cast<size_t>(n), settings.baud, settings.stopBits));
    chunk.offset += static_cast<size_t>(n);
    queued -= static_cast<size_t>(n);
    if (chunk.offset == chunk.bytes.size()) queue.pop_front();
  }
}

void LinkCore::WaitWritable() {
  waitingToWrite = true;
  std::weak_ptr<LinkCore> weak = weak_from_this();
  descriptor.async_wait(asio::posix::stream_descriptor::wait_write,
                        [weak](const asio::error_code& error) {
                          auto self = weak.lock();
                          if (!self || self->closed || !self->connected) return;
                          self->waitingToWrite = false;
                          if (error) {
                            if (error != asio::error::operation_aborted)
                              self->Lost(error.message());
                            return;
                          }
                          self->Flush();
                        });
}

// Break, mark, then the chunk's bytes, each step on a timer. The break must
// not cut into the bytes before it, so it waits until the line has sent
// them by the speed's reckoning and the driver's queue is empty.
void LinkCore::BeginBreak() {
  inBreak = true;
  std::weak_ptr<LinkCore> weak = weak_from_this();
  auto after = [this, weak](std::chrono::microseconds wait, auto next) {
    breakTimer.expires_after(wait);
    breakTimer.async_wait([weak, next](const asio::error_code& error) {
      auto self = weak.lock();
      if (!self || self->closed || !self->connected || error) return;
      next(*self);
    });
  };
  int pending = 0;
  if (::ioctl(Fd(), TIOCOUTQ, &pending) != 0) pending = 0;
  auto wait =
      std::chrono::duration_cast<std::chrono::microseconds>(lineFreeAt - SteadyClock::now());
  if (pending > 0) {
    wait = std::max(wait, std::chrono::microseconds(SerialLineMicros(
                              static_cast<size_t>(pending), settings.baud, settings.stopBits)));
  }
  if (wait.count() > 0) {
    after(wait, [](LinkCore& self) { self.BeginBreak(); });
    return;
  }
  if (::ioctl(Fd(), TIOCSBRK) != 0 && errno != ENOTTY && errno != EINVAL) {
    Lost(SystemText(errno));
    return;
  }
  after(std::chrono::microseconds(queue.front().breakMicros), [after](LinkCore& self) {
    ::ioctl(self.Fd(), TIOCCBRK);
    after(std::chrono::microseconds(self.queue.front().markMicros), [](LinkCore& self) {
      self.queue.front().breakMicros = 0;
      self.inBreak = false;
      self.lineFreeAt = SteadyClock::now();
      self.Flush();
    });
  });
}

void LinkCore::Report(bool isConnected, const std::string& reason) {
  std::weak_ptr<LinkCore> weak = weak_from_this();
  asio::post(context, [weak, isConnected, reason] {
    auto self = weak.lock();
    if (!self || self->closed || !self->onConnectionChange) return;
    auto handler = self->onConnectionChange;
    handler(isConnected, reason);
  });
}

void LinkCore::Lost(const std::string& reason) {
  if (!connected) return;
  connected = false;
  waitingToWrite = false;
  inBreak = false;
  asio::error_code ignored;
  breakTimer.cancel();
  descriptor.close(ignored);
  queue.clear();
  queued = 0;
  Report(false, reason);
  reopenMs = options.firstReopenMs;
  Reopen();
}

void LinkCore::Reopen() {
  std::weak_ptr<LinkCore> weak = weak_from_this();
  reopenTimer.expires_after(std::chrono::milliseconds(reopenMs));
  reopenTimer.async_wait([weak](const asio::error_code& error) {
    auto self = weak.lock();
    if (!self || self->closed || error) return;
    int fd = -1;
    try {
      fd = OpenSerialDevice(self->settings);
    } catch (const std::exception&) {
      // Still away (or held): look again a little later, quietly.
      self->reopenMs = std::min(self->reopenMs * 2, self->options.longestReopenMs);
      self->Reopen();
      return;
    }
    self->Adopt(fd);
    self->Report(true, "");
  });
}

// Hands the device what is still queued, waiting for it at most `limit`, on
// the calling thread: a network's last frame is usually its lights-off, and
// the program is about to let go of the port. Breaks are timed by sleeping;
// they last a fraction of a millisecond.
void LinkCore::FlushBeforeClose(std::chrono::milliseconds limit) {
  if (closed || !connected) return;
  const auto deadline = SteadyClock::now() + limit;
  breakTimer.cancel();
  if (inBreak) ::ioctl(Fd(), TIOCCBRK);
  inBreak = false;
  while (!queue.empty() && SteadyClock::now() < deadline) {
    Chunk& chunk = queue.front();
    if (chunk.breakMicros > 0) {
      // The break must not cut into the bytes before it; tcdrain could wait
      // for ever on a stalled device, so the driver's queue is watched instead.
      std::this_thread::sleep_until(std::min(lineFreeAt, deadline));
      int pending = 0;
      while (::ioctl(Fd(), TIOCOUTQ, &pending) == 0 && pending > 0 &&
             SteadyClock::now() < deadline) {
        std::this_thread::sleep_for(std::chrono::microseconds(
            SerialLineMicros(static_cast<size_t>(pending), settings.baud, settings.stopBits)));
      }
      if (SteadyClock::now() >= deadline) return;
      ::ioctl(Fd(), TIOCSBRK);
      std::this_thread::sleep_for(std::chrono::microseconds(chunk.breakMicros));
      ::ioctl(Fd(), TIOCCBRK);
      std::this_thread::sleep_for(std::chrono::microseconds(chunk.markMicros));
      chunk.breakMicros = 0;
    }
    const ssize_t n =
        ::write(Fd(), chunk.bytes.data() + chunk.offset, chunk.bytes.size() - chunk.offset);
    if (n < 0) {
      if (errno == EINTR) continue;
      if (errno != EAGAIN && errno != EWOULDBLOCK) return;
      auto left =
          std::chrono::duration_cast<std::chrono::milliseconds>(deadline - SteadyClock::now());
      pollfd writable{Fd(), POLLOUT, 0};
      if (left.count() <= 0 || ::poll(&writable, 1, static_cast<int>(left.count())) <= 0) return;
      continue;
    }
    lineFreeAt = std::max(SteadyClock::now(), lineFreeAt) +
                 std::chrono::microseconds(
                     SerialLineMicros(static_cast<size_t>(n), settings.baud, settings.stopBits));
    chunk.offset += static_cast<size_t>(n);
    queued -= static_cast<size_t>(n);
    if (chunk.offset == chunk.bytes.size()) queue.pop_front();
  }
}

void LinkCore::Close() {
  if (closed) return;
  closed = true;
  connected = false;
  asio::error_code ignored;
  breakTimer.cancel();
  reopenTimer.cancel();
  descriptor.close(ignored);
  queue.clear();
  queued = 0;
}

namespace {

// How long closing a link may wait for the device to take what is queued.
constexpr std::chrono::milliseconds kLastWordsLimit{250};

class PosixSerialLink : public SerialLink {
 public:
  explicit PosixSerialLink(std::shared_ptr<LinkCore> core) : m_core(std::move(core)) {}
  ~PosixSerialLink() override {
    m_core->FlushBeforeClose(kLastWordsLimit);
    m_core->Close();
  }

  bool Write(std::span<const uint8_t> bytes) override { return m_core->Queue(bytes, 0, 0); }
  bool WriteAfterBreak(std::span<const uint8_t> bytes, uint32_t breakMicros,
                       uint32_t markMicros) override {
    return m_core->Queue(bytes, std::max<uint32_t>(breakMicros, 1), markMicros);
  }
  size_t QueuedBytes() const override { return m_core->queued; }
  bool Connected() const override { return m_core->connected; }
  void SetOnReceive(std::function<void(std::span<const uint8_t>)> handler) override {
    m_core->onReceive = std::move(handler);
  }
  void SetOnConnectionChange(
      std::function<void(bool connected, const std::string& reason)> handler) override {
    m_core->onConnectionChange = std::move(handler);
  }

 private:
  std::shared_ptr<LinkCore> m_core;
};

}  // namespace

PosixSerialPorts::PosixSerialPorts(EventLoop& loop, PosixSerialOptions options)
    : m_loop(loop), m_options(options) {}

std::unique_ptr<SerialLink> PosixSerialPorts::Open(const SerialSettings& settings) {
  const int fd = OpenSerialDevice(settings);
  auto core = std::make_shared<LinkCore>(m_loop.Context(), settings, m_options);
  core->Adopt(fd);
  return std::make_unique<PosixSerialLink>(std::move(core));
}

}  // namespace tav
