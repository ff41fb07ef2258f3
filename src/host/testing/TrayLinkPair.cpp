#include "host/testing/TrayLinkPair.h"

namespace tav {

void TrayLinkPair::Window::Send(const TrayFrame& frame) {
  if (!m_open || !m_pair.m_onFrame) return;
  TrayFrame stamped = frame;
  stamped.senderHwnd = m_handle;
  m_pair.m_onFrame(stamped);
}

void TrayLinkPair::Window::Close() {
  if (!m_open) return;
  m_open = false;
  if (m_pair.m_onDisconnect) m_pair.m_onDisconnect(m_handle, "closed");
}

TrayLinkPair::TrayLinkPair(uint32_t ownHandle)
    : m_ownHandle(ownHandle == 0 ? 1 : ownHandle), m_nextHandle(m_ownHandle + 1) {}

TrayLinkPair::Window& TrayLinkPair::Connect() {
  while (m_nextHandle == 0 || m_nextHandle == m_ownHandle || m_windows.count(m_nextHandle)) {
    ++m_nextHandle;
  }
  uint32_t handle = m_nextHandle++;
  auto& window = m_windows[handle];
  window.reset(new Window(*this, handle));
  if (m_onConnect) m_onConnect(handle);
  return *window;
}

bool TrayLinkPair::Send(uint32_t targetHwnd, const TrayFrame& frame) {
  auto it = m_windows.find(targetHwnd);
  if (it == m_windows.end() || !it->second->m_open) return false;
  it->second->m_received.push_back(frame);
  return true;
}

void TrayLinkPair::SetOnFrame(std::function<void(const TrayFrame&)> onFrame) {
  m_onFrame = std::move(onFrame);
}

void TrayLinkPair::SetOnConnect(std::function<void(uint32_t)> onConnect) {
  m_onConnect = std::move(onConnect);
}

void TrayLinkPair::SetOnDisconnect(std::function<void(uint32_t, const std::string&)> onDisconnect) {
  m_onDisconnect = std::move(onDisconnect);
}

}  // namespace tav
