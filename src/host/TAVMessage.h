#pragma once
// One message received from a tray program: its type, the window that sent
// it and its body. A plain record; the queue drain decides what it means.

#include <cstdint>
#include <string>

namespace tav {

class TAVMessage {
 public:
  int32_t MessageType() const { return m_messageType; }
  void SetMessageType(int32_t value) { m_messageType = value; }
  uint32_t SenderHwnd() const { return m_senderHwnd; }
  void SetSenderHwnd(uint32_t value) { m_senderHwnd = value; }
  const std::string& Text() const { return m_text; }
  void SetText(std::string value) { m_text = std::move(value); }

 private:
  int32_t m_messageType = 0;
  uint32_t m_senderHwnd = 0;
  std::string m_text;
};

}  // namespace tav
