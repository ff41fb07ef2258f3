#pragma once
// Speeds that the classic termios interface cannot name (250 000 baud for a
// host-timed DMX dongle, say): set through Linux's termios2 with BOTHER. Kept
// in a file of its own because the kernel's termios2 header cannot share a
// translation unit with <termios.h>.

#include <cstdint>

namespace tav {

// Sets `baud` on the open tty `fd` (input and output), leaving every other
// setting as it is. False when the device refuses it or ends up more than 2%
// away; `actual` then holds what it took (0 when the call failed).
bool SetCustomSerialSpeed(int fd, int32_t baud, int32_t& actual);

}  // namespace tav
