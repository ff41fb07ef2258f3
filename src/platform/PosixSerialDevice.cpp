#include "platform/PosixSerialDevice.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <termios.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <utility>

#include "platform/LinuxSerialSpeed.h"
#include "support/Error.h"

namespace tav {
namespace {

constexpr const char* kSource = "SerialPort.Open";

Error Invalid(const std::string& text) {
  return Error(kErrorPortInvalid, kSource, text);
}
Error Refused(const std::string& text) {
  return Error(kErrorPortSettings, kSource, text);
}
Error Held() {
  return Error(kErrorPortAlreadyOpen, kSource, kPortAlreadyOpenText);
}

// Closes the descriptor unless released: every failure path after open().
class FdGuard {
 public:
  explicit FdGuard(int fd) : m_fd(fd) {}
  ~FdGuard() {
    if (m_fd >= 0) ::close(m_fd);
  }
  int Release() { return std::exchange(m_fd, -1); }

 private:
  int m_fd;
};

}  // namespace

unsigned StandardSerialSpeed(int32_t baud) {
  static const std::pair<int32_t, speed_t> kSpeeds[] = {
      {50, B50},           {75, B75},           {110, B110},         {134, B134},
      {150, B150},         {200, B200},         {300, B300},         {600, B600},
      {1200, B1200},       {1800, B1800},       {2400, B2400},       {4800, B4800},
      {9600, B9600},       {19200, B19200},     {38400, B38400},     {57600, B57600},
      {115200, B115200},   {230400, B230400},   {460800, B460800},   {500000, B500000},
      {576000, B576000},   {921600, B921600},   {1000000, B1000000}, {1152000, B1152000},
      {1500000, B1500000}, {2000000, B2000000}, {2500000, B2500000}, {3000000, B3000000},
      {3500000, B3500000}, {4000000, B4000000},
  };
  for (const auto& [rate, constant] : kSpeeds) {
    if (rate == baud) return constant;
  }
  return 0;
}

int OpenSerialDevice(const SerialSettings& settings) {
  const std::string& path = settings.path;
  if (settings.baud <= 0) {
    throw Refused("Serial port " + path + " cannot run at " + std::to_string(settings.baud) +
                  " baud");
  }
  if (settings.stopBits != 1 && settings.stopBits != 2) {
    throw Refused("Serial port " + path + ": " + std::to_string(settings.stopBits) +
                  " stop bits (1 or 2 are possible)");
  }
  struct stat info {};
  if (::stat(path.c_str(), &info) != 0) {
    if (errno == ENOENT) throw Invalid("Serial port " + path + " does not exist");
    throw Invalid("Serial port " + path + ": " + std::strerror(errno));
  }
  const int fd = ::open(path.c_str(), O_RDWR | O_NOCTTY | O_NONBLOCK | O_CLOEXEC);
  if (fd < 0) {
    if (errno == EBUSY) throw Held();
    throw Invalid("Cannot open serial port " + path + ": " + std::strerror(errno));
  }
  FdGuard guard(fd);
  if (!::isatty(fd)) throw Invalid(path + " is not a serial port");
  if (::flock(fd, LOCK_EX | LOCK_NB) != 0) {
    if (errno == EWOULDBLOCK) throw Held();
    throw Invalid("Cannot lock serial port " + path + ": " + std::strerror(errno));
  }
  // Keeps later opens out (root excepted; the lock covers that case).
  ::ioctl(fd, TIOCEXCL);

  struct termios tio {};
  if (::tcgetattr(fd, &tio) != 0)
    throw Invalid("Serial port " + path + ": " + std::strerror(errno));
  ::cfmakeraw(&tio);
  tio.c_cflag &= ~static_cast<tcflag_t>(CSIZE | PARENB | CSTOPB | CRTSCTS);
  tio.c_cflag |= CS8 | CLOCAL | CREAD;
  if (settings.stopBits == 2) tio.c_cflag |= CSTOPB;
  tio.c_iflag &= ~static_cast<tcflag_t>(IXON | IXOFF | IXANY);
  // One byte satisfies a read, so a read of nothing means the device hung up
  // (with O_NONBLOCK an empty buffer is EAGAIN).
  tio.c_cc[VMIN] = 1;
  tio.c_cc[VTIME] = 0;
  const speed_t speed = StandardSerialSpeed(settings.baud);
  if (speed != 0) {
    ::cfsetispeed(&tio, speed);
    ::cfsetospeed(&tio, speed);
  }
  if (::tcsetattr(fd, TCSANOW, &tio) != 0) {
    throw Refused("Serial port " + path + " refuses its settings: " + std::strerror(errno));
  }
  const std::string refusal =
      "Serial port " + path + " refuses " + std::to_string(settings.baud) + " baud";
  if (speed != 0) {
    struct termios check {};
    if (::tcgetattr(fd, &check) != 0 || ::cfgetospeed(&check) != speed) throw Refused(refusal);
  } else {
    int32_t actual = 0;
    if (!SetCustomSerialSpeed(fd, settings.baud, actual)) throw Refused(refusal);
  }
  ::tcflush(fd, TCIOFLUSH);
  return guard.Release();
}

}  // namespace tav
