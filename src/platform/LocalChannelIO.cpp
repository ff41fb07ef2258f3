#include "platform/LocalChannelIO.h"

namespace tav {

LocalChannelIO::LocalChannelIO(EventLoop& loop, const Clock& clock, TimerService& timers,
                               MessageLog& log, RegistryStore& settings)
    : m_network(loop),
      m_frameTimer(loop),
      m_serialPorts(loop),
      m_serial({&m_serialPorts, &timers, &clock, &log},
               // The control is made below; no serial network is open before.
               [this](int32_t network, int32_t unit, int32_t input) {
                 if (m_control) m_control->InjectInput(network, unit, input);
               }) {
  ChannelIOPorts ports;
  ports.clock = &clock;
  ports.timer = &m_frameTimer;
  ports.network = &m_network;
  ports.log = &log;
  ports.settings = &settings;
  ports.claim = &m_claim;
  ports.serial = &m_serial;
  m_control = std::make_shared<ChannelIOControl>(ports);
}

}  // namespace tav
