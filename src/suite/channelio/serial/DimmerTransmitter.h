#pragma once
// One serial dimmer network (a Fennick chain, or a TAV network whose
// controllers hang on a serial port): turns the network's levels into frames
// of the dimmer framing and sends them paced to the line's speed, so the
// frame rate is what the speed can carry and a busy line never delays the
// lights by more than one frame.
//
// A network holding more channels than its speed carries twenty times a
// second still works, only more slowly; that is worth one warning line when
// the network opens, naming the limit.
//
// Owned by the I/O control, one per open network. The TimerService, Clock
// and MessageLog must outlive it.

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "suite/channelio/serial/DimmerFraming.h"
#include "suite/channelio/serial/SerialFrameSender.h"

namespace tav {

struct DimmerNetworkSettings {
  std::string name;  // "Fennick network", "TAV network 3"
  SerialSettings serial;
  DimmerFrameLayout layout;
  uint32_t refreshMs = 1000;
};

class DimmerTransmitter {
 public:
  // Fails like DimmerFrameEncoder for a layout it cannot frame.
  DimmerTransmitter(DimmerNetworkSettings settings, std::unique_ptr<SerialLink> link,
                    TimerService& timers, const Clock& clock, MessageLog& log);

  // The levels of the network's channels, board 1 channel 1 first.
  void SendLevels(std::span<const uint8_t> levels);

  int32_t ChannelCount() const { return m_encoder.ChannelCount(); }
  // Frames per second the speed carries with frames of this layout (values
  // that need no escape).
  double FrameRateLimit() const;
  const DimmerNetworkSettings& Settings() const { return m_settings; }
  SerialFrameSender& Sender() { return m_sender; }

 private:
  DimmerNetworkSettings m_settings;
  DimmerFrameEncoder m_encoder;
  SerialFrameSender m_sender;
  std::vector<uint8_t> m_frame;
};

}  // namespace tav
