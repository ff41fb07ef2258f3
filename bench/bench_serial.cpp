// Serial network figures, with the targets they are judged by:
//
// 1. Channels per second through the dimmer-frame encoder, escaping and
//    clamping, with typical levels and with every level a special value.
//    Target: at least 50 million channels/s escaping typical levels (a
//    4096-channel frame in under 0.1 ms), so encoding never matters.
// 2. Frames per second reaching a one-board, 574-channel receiver at 115200
//    baud, through the real serial adapter on a pseudo-terminal, against
//    the line's limit (115200 / 10 bits per byte / bytes per frame).
//    Target: at least 97% of the limit.
// 3. X10 commands per second through an interface model with the power
//    line's timing (60 Hz), over a pseudo-terminal, against the model's own
//    best (two transmissions of 25 mains cycles and two serial bytes each).
//    Target: at least 95% of it.
//
// Exits non-zero when a target is missed. Run it from the release preset.

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <random>
#include <span>
#include <string>
#include <vector>

#include "platform/AsioTimerService.h"
#include "platform/PosixSerialPort.h"
#include "platform/SystemClock.h"
#include "platform/testing/PtyDevice.h"
#include "ports/testing/RecordingMessageLog.h"
#include "suite/channelio/serial/DimmerFraming.h"
#include "suite/channelio/serial/DimmerTransmitter.h"
#include "suite/channelio/serial/SerialLineTiming.h"
#include "suite/channelio/serial/X10Transmitter.h"
#include "suite/channelio/serial/testing/Cm11aModel.h"
#include "suite/channelio/serial/testing/DimmerBoardModel.h"

namespace {

using Steady = std::chrono::steady_clock;

double SecondsSince(Steady::time_point start) {
  return std::chrono::duration<double>(Steady::now() - start).count();
}

std::string TempPath(const std::string& name) {
  return (std::filesystem::temp_directory_path() / (name + "-" + std::to_string(::getpid())))
      .string();
}

// 1. The encoder.
double EncoderChannelsPerSecond(tav::DimmerSpecialValues specials, bool allSpecial) {
  tav::DimmerFrameLayout layout;
  layout.boards = 512;
  layout.channelsPerBoard = 8;
  layout.specials = specials;
  tav::DimmerFrameEncoder encoder(layout);
  std::vector<uint8_t> levels(4096), out;
  std::mt19937 random(1);
  for (auto& level : levels)
    level = allSpecial ? static_cast<uint8_t>(0x7D + random() % 3) : static_cast<uint8_t>(random());
  const int kFrames = 20000;
  size_t bytes = 0;
  auto start = Steady::now();
  for (int i = 0; i < kFrames; ++i) {
    levels[static_cast<size_t>(i) % levels.size()] ^= 1;  // not the same frame twice
    encoder.Encode(levels, out);
    bytes += out.size();
  }
  double seconds = SecondsSince(start);
  if (bytes == 0) std::puts("");  // keep the work
  return kFrames * 4096.0 / seconds;
}

// The real serial adapter on the loop, with a pseudo-terminal for the
// device.
struct PtyRig {
  explicit PtyRig(const std::string& name) : device(loop, TempPath(name)) {}
  tav::EventLoop loop;
  tav::AsioTimerService timers{loop};
  tav::SystemClock clock;
  tav::RecordingMessageLog log;
  tav::PosixSerialPorts ports{loop};
  tav::PtyDevice device;
};

// 2. Frame rate at 115200 baud, 574 channels.
struct FrameRate {
  double achieved = 0;
  double limit = 0;
  size_t frameBytes = 0;
};

FrameRate MeasureFrameRate(double seconds) {
  PtyRig rig("tav-bench-tty");
  auto& [loop, timers, clock, log, ports, device] = rig;
  tav::DimmerChainModel board(1, 574);
  std::vector<Steady::time_point> arrivals;
  board.Board(0).SetOnFrame([&](const auto&) { arrivals.push_back(Steady::now()); });
  device.SetOnBytes([&](std::span<const uint8_t> bytes) { board.Feed(bytes); });

  tav::DimmerNetworkSettings settings;
  settings.name = "Fennick network";
  settings.serial = {device.Path(), 115200, 1};
  settings.layout.channelsPerBoard = 574;
  tav::DimmerTransmitter fennick(settings, ports.Open(settings.serial), timers, clock, log);

  // New levels every 10 ms, faster than the line: the line sets the pace.
  std::vector<uint8_t> levels(574);
  auto start = Steady::now();
  int n = 0;
  while (SecondsSince(start) < seconds) {
    std::fill(levels.begin(), levels.end(), static_cast<uint8_t>(n++ % 0x7C));
    fennick.SendLevels(levels);
    loop.RunFor(std::chrono::milliseconds(10));
  }
  FrameRate rate;
  std::vector<uint8_t> frame;
  tav::DimmerFrameEncoder(settings.layout).Encode(levels, frame);
  rate.frameBytes = frame.size();
  rate.limit = tav::SerialFrameRateLimit(frame.size(), 115200, 1);
  // Between the first and the last arrival, leaving out the start.
  if (arrivals.size() > 12) {
    double span = std::chrono::duration<double>(arrivals.back() - arrivals[10]).count();
    rate.achieved = (arrivals.size() - 11) / span;
  }
  return rate;
}

// 3. X10 commands per second.
struct X10Rate {
  double achieved = 0;
  double ideal = 0;
  int commands = 0;
};

X10Rate MeasureX10(int units) {
  PtyRig rig("tav-bench-x10");
  auto& [loop, timers, clock, log, ports, device] = rig;
  tav::Cm11aModel model({}, tav::Cm11aModelTiming{60.0, false});
  auto nowMs = [&] { return static_cast<uint64_t>(clock.TickCount()); };
  device.SetOnBytes([&](std::span<const uint8_t> bytes) { model.FromHost(bytes, nowMs()); });
  model.toHost = [&](const std::vector<uint8_t>& bytes) { device.Write(bytes); };
  tav::X10NetworkSettings settings;
  settings.path = device.Path();
  settings.warnDepth = 0;
  tav::X10Transmitter x10(settings, ports.Open(tav::X10Transmitter::PortSettings(settings)), timers,
                          clock, log);
  auto start = Steady::now();
  for (int unit = 1; unit <= units; ++unit) x10.SetLevel(1, unit, 255);
  while (x10.QueueDepth() > 0 || !model.Idle()) {
    loop.RunFor(std::chrono::milliseconds(1));
    model.Advance(nowMs());
  }
  X10Rate rate;
  rate.commands = units;
  rate.achieved = units / SecondsSince(start);
  // Address and On: 25 mains cycles each, plus the 0x00 and 0x55 bytes.
  const double perTransmission = 25.0 / 60.0 + 2 * 10.0 / 4800.0;
  rate.ideal = 1.0 / (2 * perTransmission);
  return rate;
}

}  // namespace

int main() {
  bool ok = true;
  std::printf("1. Dimmer-frame encoder (4096-channel frames)\n");
  const double escapeTypical = EncoderChannelsPerSecond(tav::DimmerSpecialValues::kEscape, false);
  const double clampTypical = EncoderChannelsPerSecond(tav::DimmerSpecialValues::kClamp, false);
  const double escapeWorst = EncoderChannelsPerSecond(tav::DimmerSpecialValues::kEscape, true);
  const double clampWorst = EncoderChannelsPerSecond(tav::DimmerSpecialValues::kClamp, true);
  std::printf("   escape, typical levels:   %8.1f million channels/s\n", escapeTypical / 1e6);
  std::printf("   clamp,  typical levels:   %8.1f million channels/s\n", clampTypical / 1e6);
  std::printf("   escape, every value 7D-7F: %7.1f million channels/s\n", escapeWorst / 1e6);
  std::printf("   clamp,  every value 7D-7F: %7.1f million channels/s\n", clampWorst / 1e6);
  if (escapeTypical < 50e6) {
    std::printf("   MISSED: escaping typical levels below 50 million channels/s\n");
    ok = false;
  }

  std::printf("2. Frame rate at 115200 baud, 574 channels, one board, pseudo-terminal\n");
  const FrameRate rate = MeasureFrameRate(6.0);
  std::printf("   frame: %zu bytes (2 header, 574 channels, %zu pads)\n", rate.frameBytes,
              rate.frameBytes - 576);
  std::printf("   line limit: %.2f frames/s (20.00 without pads)\n", rate.limit);
  std::printf("   achieved:   %.2f frames/s (%.1f%% of the limit)\n", rate.achieved,
              100.0 * rate.achieved / rate.limit);
  if (rate.achieved < 0.97 * rate.limit) {
    std::printf("   MISSED: below 97%% of the line's limit\n");
    ok = false;
  }

  std::printf("3. X10 through a CM11A model (60 Hz power line), pseudo-terminal\n");
  const X10Rate x10 = MeasureX10(12);
  std::printf("   %d commands (address + On): %.3f commands/s; the model's best %.3f (%.1f%%)\n",
              x10.commands, x10.achieved, x10.ideal, 100.0 * x10.achieved / x10.ideal);
  if (x10.achieved < 0.95 * x10.ideal) {
    std::printf("   MISSED: below 95%% of the interface's own pace\n");
    ok = false;
  }
  return ok ? 0 : 1;
}
