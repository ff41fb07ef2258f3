#pragma once
// Where the player's messages to the tray program go: the tray's window
// (TrayWindow, 0 while no tray has introduced itself) on the tray link, sent
// from the player's own window. It sends to whatever window it holds, 0
// included, and never checks the outcome; deciding when the tray window
// changes, and what follows, is the tray messaging's business. Owned by the
// host, beside the log and the tray messaging that share it.

#include <cstdint>
#include <string_view>

#include "host/TrayLink.h"

namespace tav {

class TrayOutbox {
 public:
  explicit TrayOutbox(TrayLink& link) : m_link(link) {}

  // The player's own window handle.
  uint32_t HostWindow() const { return m_link.OwnHandle(); }
  uint32_t TrayWindow() const { return m_trayWindow; }
  // Only stores the handle.
  void Retarget(uint32_t trayWindow) { m_trayWindow = trayWindow; }

  // A typed message to TrayWindow.
  void Send(int32_t type, std::string_view body);

 private:
  TrayLink& m_link;
  uint32_t m_trayWindow = 0;
};

}  // namespace tav
