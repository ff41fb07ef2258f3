#include "host/TrayOutbox.h"

#include "host/Msg.h"

namespace tav {

void TrayOutbox::Send(int32_t type, std::string_view body) {
  SendTypedMessage(m_link, m_trayWindow, type, body);
}

}  // namespace tav
