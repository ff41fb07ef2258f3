// Log lines per second from the player's log to a tray that reads them, over
// the real Unix tray link: HostLog composes each line, the link frames it and
// writes it on the event loop, and a client in another thread reads and
// decodes every frame. Also prints the cost of a line held back while no
// tray is known.

// A standard header first: Asio picks its aligned allocator from what the
// standard library has declared, and every file must pick the same one.
#include <cstddef>
// clang-format off
#include <asio.hpp>
// clang-format on
#include <atomic>
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <string>
#include <thread>

#include "host/HostLog.h"
#include "host/Msg.h"
#include "platform/EventLoop.h"
#include "platform/SystemClock.h"
#include "platform/UnixTrayLink.h"
#include "platform/UnixTrayLinkClient.h"

namespace {

using SteadyClock = std::chrono::steady_clock;

struct Sequence : tav::SequenceIdentity {
  int32_t PlayType() const override { return 1; }
  std::string Filename() const override { return "/home/show/Sequences/Xmas/Intro sequence.tsq"; }
  int32_t Section() const override { return 1; }
};

double Seconds(SteadyClock::duration d) {
  return std::chrono::duration<double>(d).count();
}

}  // namespace

int main() {
  namespace fs = std::filesystem;
  std::string dir =
      (fs::temp_directory_path() / ("tav-bench-" + std::to_string(::getpid()))).string();
  std::string path = dir + "/showplayer.sock";

  tav::EventLoop loop;
  tav::SystemClock clock;
  tav::UnixTrayLink link(loop, path);
  tav::TrayOutbox outbox(link);
  tav::HostLog log(clock, outbox);
  Sequence sequence;

  // Lines held back while no tray is known (the buffer trims itself).
  const int heldLines = 1'000'000;
  auto heldStart = SteadyClock::now();
  for (int i = 0; i < heldLines; ++i) log.LogMessage(1, "Starting", &sequence);
  double heldSeconds = Seconds(SteadyClock::now() - heldStart);

  uint32_t trayHandle = 0;
  link.SetOnConnect([&](uint32_t handle) { trayHandle = handle; });

  const int64_t lines = 2'000'000;
  std::atomic<int64_t> received{0};
  std::atomic<int64_t> receivedBytes{0};
  std::atomic<bool> readerFailed{false};
  std::thread reader([&] {
    try {
      tav::UnixTrayLinkClient client(path);
      while (received.load() < lines + 1) {  // the held-back text comes first
        auto frame = client.Receive(5000);
        if (!frame) throw std::runtime_error("no frame for 5 s");
        tav::TAVMessage message = tav::DecodeReceivedMessage(*frame);
        if (message.MessageType() != tav::kMsgLogText) throw std::runtime_error("not a log line");
        receivedBytes += static_cast<int64_t>(frame->data.size());
        ++received;
      }
    } catch (const std::exception& e) {
      std::fprintf(stderr, "reader: %s\n", e.what());
      readerFailed = true;
    }
  });

  auto& context = loop.Context();
  while (trayHandle == 0 && !readerFailed) context.run_one_for(std::chrono::milliseconds(100));
  outbox.Retarget(trayHandle);

  // Log in batches while the tray keeps up, as a busy show would.
  const size_t highWater = 256 * 1024;
  auto start = SteadyClock::now();
  int64_t logged = 0;
  while (received.load() < lines + 1 && !readerFailed) {
    if (logged < lines && link.QueuedBytes(trayHandle) < highWater) {
      for (int i = 0; i < 512 && logged < lines; ++i, ++logged) {
        log.LogMessage(1, "Starting", &sequence);
      }
    }
    context.poll();
  }
  double seconds = Seconds(SteadyClock::now() - start);
  reader.join();
  link.Close();
  fs::remove_all(dir);
  if (readerFailed) return 1;

  std::printf("held back without a tray: %.0f lines/s (%.3f us per line)\n",
              heldLines / heldSeconds, heldSeconds * 1e6 / heldLines);
  std::printf("to a reading tray over the Unix socket: %.0f log lines/s, %.1f MB/s, %lld lines\n",
              static_cast<double>(lines) / seconds, receivedBytes.load() / seconds / 1e6,
              static_cast<long long>(lines));
  return 0;
}
