#include "platform/LinuxSerialSpeed.h"

#include <asm/termbits.h>
#include <sys/ioctl.h>

#include <cstdlib>

namespace tav {

bool SetCustomSerialSpeed(int fd, int32_t baud, int32_t& actual) {
  actual = 0;
  struct termios2 settings {};
  if (::ioctl(fd, TCGETS2, &settings) != 0) return false;
  settings.c_cflag &= ~(CBAUD | (CBAUD << IBSHIFT));
  settings.c_cflag |= BOTHER | (BOTHER << IBSHIFT);
  settings.c_ispeed = static_cast<speed_t>(baud);
  settings.c_ospeed = static_cast<speed_t>(baud);
  if (::ioctl(fd, TCSETS2, &settings) != 0) return false;
  if (::ioctl(fd, TCGETS2, &settings) != 0) return false;
  actual = static_cast<int32_t>(settings.c_ospeed);
  return std::abs(static_cast<int64_t>(actual) - baud) * 50 <= baud;
}

}  // namespace tav
