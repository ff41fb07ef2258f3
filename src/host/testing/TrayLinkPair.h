#pragma once
// The tray link inside one process, for tests and for wiring a tray and a
// player together without a socket. The player's side is the TrayLink; tray
// windows are made with Connect() and live as long as the pair. A window's
// Send delivers at once, inside the call, as a synchronous window message
// does; frames sent to a window are kept in its Received() list.

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "host/TrayLink.h"

namespace tav {

class TrayLinkPair : public TrayLink {
 public:
  class Window {
   public:
    uint32_t Handle() const { return m_handle; }
    bool IsOpen() const { return m_open; }
    // Delivers `frame` to the player with this window's handle stamped on it;
    // nothing happens once the window is closed.
    void Send(const TrayFrame& frame);
    const std::vector<TrayFrame>& Received() const { return m_received; }
    void ClearReceived() { m_received.clear(); }
    void Close();

   private:
    friend class TrayLinkPair;
    Window(TrayLinkPair& pair, uint32_t handle) : m_pair(pair), m_handle(handle) {}
    TrayLinkPair& m_pair;
    uint32_t m_handle;
    bool m_open = true;
    std::vector<TrayFrame> m_received;
  };

  explicit TrayLinkPair(uint32_t ownHandle = 1);

  // A new tray window with a handle not used before.
  Window& Connect();

  uint32_t OwnHandle() const override { return m_ownHandle; }
  bool Send(uint32_t targetHwnd, const TrayFrame& frame) override;
  void SetOnFrame(std::function<void(const TrayFrame&)> onFrame) override;
  void SetOnConnect(std::function<void(uint32_t)> onConnect) override;
  void SetOnDisconnect(std::function<void(uint32_t, const std::string&)> onDisconnect) override;

 private:
  uint32_t m_ownHandle;
  uint32_t m_nextHandle;
  std::map<uint32_t, std::unique_ptr<Window>> m_windows;
  std::function<void(const TrayFrame&)> m_onFrame;
  std::function<void(uint32_t)> m_onConnect;
  std::function<void(uint32_t, const std::string&)> m_onDisconnect;
};

}  // namespace tav
