#include "platform/testing/PtyDevice.h"

#include <fcntl.h>
#include <pty.h>
#include <termios.h>
#include <unistd.h>

#include <array>
#include <asio.hpp>
#include <cerrno>
#include <stdexcept>

namespace tav {

struct PtyDevice::Reader : std::enable_shared_from_this<Reader> {
  Reader(asio::io_context& context, int fd, PtyDevice* owner) : master(context), device(owner) {
    master.assign(fd);
  }
  void Start() {
    std::weak_ptr<Reader> weak = weak_from_this();
    master.async_wait(
        asio::posix::stream_descriptor::wait_read, [weak](const asio::error_code& error) {
          auto self = weak.lock();
          if (!self || error || !self->device) return;
          for (;;) {
            ssize_t n =
                ::read(self->master.native_handle(), self->buffer.data(), self->buffer.size());
            if (n <= 0) break;  // EAGAIN, or EIO while no slave is open
            if (self->device && self->device->m_onBytes)
              self->device->m_onBytes(
                  std::span<const uint8_t>(self->buffer.data(), static_cast<size_t>(n)));
            if (!self->device || !self->device->m_reading) return;
          }
          if (self->device && self->device->m_reading) self->Start();
        });
  }
  asio::posix::stream_descriptor master;
  PtyDevice* device;
  std::array<uint8_t, 65536> buffer{};
};

PtyDevice::PtyDevice(EventLoop& loop, std::string linkPath)
    : m_loop(loop), m_linkPath(std::move(linkPath)) {
  Plug();
}

PtyDevice::~PtyDevice() {
  Unplug();
}

void PtyDevice::Plug() {
  std::array<char, 128> name{};
  if (::openpty(&m_master, &m_slave, name.data(), nullptr, nullptr) != 0)
    throw std::runtime_error("openpty failed");
  m_ttyPath = name.data();
  ::fcntl(m_master, F_SETFL, ::fcntl(m_master, F_GETFL) | O_NONBLOCK);
  ::fcntl(m_master, F_SETFD, FD_CLOEXEC);
  ::fcntl(m_slave, F_SETFD, FD_CLOEXEC);
  // Raw from the start, so nothing the code under test writes before it sets
  // the line up itself is cooked.
  struct termios tio {};
  ::tcgetattr(m_slave, &tio);
  ::cfmakeraw(&tio);
  ::tcsetattr(m_slave, TCSANOW, &tio);
  ::unlink(m_linkPath.c_str());
  if (::symlink(m_ttyPath.c_str(), m_linkPath.c_str()) != 0)
    throw std::runtime_error("cannot link " + m_linkPath);
  m_reader = std::make_shared<Reader>(m_loop.Context(), m_master, this);
  if (m_reading) m_reader->Start();
}

void PtyDevice::SetOnBytes(std::function<void(std::span<const uint8_t>)> handler) {
  m_onBytes = std::move(handler);
}

void PtyDevice::SetReading(bool reading) {
  const bool wasReading = m_reading;
  m_reading = reading;
  if (reading && !wasReading && m_reader) m_reader->Start();
}

void PtyDevice::Write(std::span<const uint8_t> bytes) {
  size_t done = 0;
  while (done < bytes.size() && m_master >= 0) {
    ssize_t n = ::write(m_master, bytes.data() + done, bytes.size() - done);
    if (n > 0) {
      done += static_cast<size_t>(n);
    } else if (n < 0 && errno != EAGAIN && errno != EINTR) {
      break;
    }
  }
}

void PtyDevice::Unplug() {
  if (m_master < 0) return;
  m_reader->device = nullptr;
  asio::error_code ignored;
  m_reader->master.close(ignored);  // closes the master descriptor
  m_reader.reset();
  m_master = -1;
  ::close(m_slave);
  m_slave = -1;
  ::unlink(m_linkPath.c_str());
}

void PtyDevice::Replug() {
  if (m_master < 0) Plug();
}

}  // namespace tav
