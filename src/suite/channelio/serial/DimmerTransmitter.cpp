#include "suite/channelio/serial/DimmerTransmitter.h"

#include <iomanip>
#include <sstream>

namespace tav {
namespace {

FrameSenderOptions SenderOptions(const DimmerNetworkSettings& settings) {
  FrameSenderOptions options;
  options.name = settings.name;
  options.path = settings.serial.path;
  options.paceBaud = settings.serial.baud;
  options.stopBits = settings.serial.stopBits;
  options.refreshMs = settings.refreshMs;
  return options;
}

std::string OneDecimal(double value) {
  std::ostringstream text;
  text << std::fixed << std::setprecision(1) << value;
  return text.str();
}

}  // namespace

DimmerTransmitter::DimmerTransmitter(DimmerNetworkSettings settings,
                                     std::unique_ptr<SerialLink> link, TimerService& timers,
                                     const Clock& clock, MessageLog& log)
    : m_settings(std::move(settings)),
      m_encoder(m_settings.layout),
      m_sender(SenderOptions(m_settings), std::move(link), timers, clock, log) {
  const int32_t carried =
      DimmerChannelsForSpeed(m_settings.serial.baud, m_settings.serial.stopBits);
  if (ChannelCount() > carried) {
    log.LogMessage(2, m_settings.name + " on " + m_settings.serial.path + ": " +
                          std::to_string(ChannelCount()) + " channels are more than " +
                          std::to_string(m_settings.serial.baud) + " baud carries " +
                          std::to_string(kDimmerTargetFrameRate) + " times a second (at most " +
                          std::to_string(carried) + "); frames will come about " +
                          OneDecimal(FrameRateLimit()) + " times a second");
  }
}

double DimmerTransmitter::FrameRateLimit() const {
  return SerialFrameRateLimit(m_encoder.ShortestFrameBytes(), m_settings.serial.baud,
                              m_settings.serial.stopBits);
}

void DimmerTransmitter::SendLevels(std::span<const uint8_t> levels) {
  m_encoder.Encode(levels, m_frame);
  m_sender.Send(m_frame);
}

}  // namespace tav
