#pragma once
// A pseudo-terminal standing in for a serial device in tests: the code under
// test opens Path() (a symbolic link, as /dev/serial/by-id/... is), and the
// test plays the device on the master side, on the event loop. Unplug closes
// the master (the tty hangs up and its node goes, as when a USB adapter is
// pulled) and removes the link; Replug makes a fresh pseudo-terminal and
// points the link at it.
//
// The test keeps a descriptor of the slave side open as well, so the master
// reads nothing but what the code under test writes, from before it opens
// the device until after it closes it.

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>

#include "platform/EventLoop.h"

namespace tav {

class PtyDevice {
 public:
  PtyDevice(EventLoop& loop, std::string linkPath);
  ~PtyDevice();
  PtyDevice(const PtyDevice&) = delete;
  PtyDevice& operator=(const PtyDevice&) = delete;

  const std::string& Path() const { return m_linkPath; }
  // The slave's own path (/dev/pts/N) while plugged.
  const std::string& TtyPath() const { return m_ttyPath; }
  // The slave descriptor the test holds (for tcgetattr), -1 when unplugged.
  int SlaveFd() const { return m_slave; }
  bool Plugged() const { return m_master >= 0; }

  // Bytes the code under test wrote, as they arrive.
  void SetOnBytes(std::function<void(std::span<const uint8_t>)> handler);
  // Stops reading (the device's buffer fills up) or starts again.
  void SetReading(bool reading);
  // Bytes to the code under test.
  void Write(std::span<const uint8_t> bytes);

  void Unplug();
  void Replug();

 private:
  struct Reader;
  void Plug();

  EventLoop& m_loop;
  std::string m_linkPath;
  std::string m_ttyPath;
  int m_master = -1;
  int m_slave = -1;
  bool m_reading = true;
  std::shared_ptr<Reader> m_reader;
  std::function<void(std::span<const uint8_t>)> m_onBytes;
};

}  // namespace tav
