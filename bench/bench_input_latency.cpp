// Input latency of the DMX listener: from the moment a sender puts a
// packet with a slot crossing its threshold on the wire to the moment the
// registered input's event reaches its handler on the event loop, while the
// same control sends 16 universes at 40 frames a second (so the listener
// shares the loop with real output work, as in a show).
//
// A sender thread presses and releases slot 1 of universe 9 (E1.31 over
// loopback) with a random pause between presses, stamping each press with
// the monotonic clock just before sendto; the handler stamps the event.
// Prints p50, p99 and max over the presses.
//
//   bench_input_latency [presses=2000] [universes=16] [realtime priority=0]

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <thread>
#include <vector>

#include "platform/EventLoop.h"
#include "platform/Realtime.h"
#include "platform/SystemClock.h"
#include "platform/TimerfdDeadlineTimer.h"
#include "platform/UdpDatagramNetwork.h"
#include "suite/channelio/ChannelIOControl.h"
#include "suite/channelio/E131Packet.h"

namespace {

int64_t NowNs() {
  return std::chrono::duration_cast<std::chrono::nanoseconds>(
             std::chrono::steady_clock::now().time_since_epoch())
      .count();
}

class QuietLog : public tav::MessageLog {
 public:
  void LogMessage(int32_t level, const std::string& text, const tav::SequenceIdentity*) override {
    if (level >= 2) std::fprintf(stderr, "log: %s\n", text.c_str());
  }
};

// A UDP port bound and never read: where the outputs go.
int BindPort(uint16_t& port) {
  int fd = ::socket(AF_INET, SOCK_DGRAM, 0);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  ::bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof address);
  socklen_t length = sizeof address;
  ::getsockname(fd, reinterpret_cast<sockaddr*>(&address), &length);
  port = ntohs(address.sin_port);
  return fd;
}

}  // namespace

int main(int argc, char** argv) {
  int presses = argc > 1 ? std::atoi(argv[1]) : 2000;
  int universes = argc > 2 ? std::atoi(argv[2]) : 16;
  int priority = argc > 3 ? std::atoi(argv[3]) : 0;
  if (priority > 0) {
    std::string refused = tav::RequestRealtimePriority(priority);
    if (!refused.empty()) std::fprintf(stderr, "real-time priority refused: %s\n", refused.c_str());
  }

  uint16_t sinkPort = 0;
  int sink = BindPort(sinkPort);
  uint16_t listenPort = 0;
  ::close(BindPort(listenPort));  // a free port for the listener

  tav::EventLoop loop;
  tav::SystemClock clock;
  tav::UdpDatagramNetwork network(loop);
  tav::TimerfdDeadlineTimer frameTimer(loop);
  tav::TimerfdDeadlineTimer pumpTimer(loop);
  QuietLog log;
  tav::ChannelIOPorts ports;
  ports.clock = &clock;
  ports.timer = &frameTimer;
  ports.network = &network;
  ports.log = &log;
  tav::ChannelIOControl control(ports);

  tav::NetworkPreferences prefs;
  for (int u = 1; u <= universes; ++u) {
    tav::DMXUniversePrefs entry;
    entry.SetUniverse(u);
    entry.SetDestination("127.0.0.1:" + std::to_string(sinkPort));
    prefs.AddDMXUniverse(entry);
  }
  prefs.Listener().SetEnabled(true);
  prefs.Listener().SetUniverse(9);
  prefs.Listener().SetPort(listenPort);
  prefs.Listener().SetInterface("lo");
  prefs.Listener().SetNetwork(1);
  prefs.Listener().SetUnit(1);
  control.ApplyNetworkPreferences(prefs);
  control.SetupClient(false, "bench", true);
  control.RegisterInput(1, 1, 1, "press");

  std::atomic<int64_t> pressedAt{0};
  std::atomic<int> acknowledged{0};
  std::vector<double> latencies;
  latencies.reserve(static_cast<size_t>(presses));
  control.SetOnInput([&](const tav::ChannelInputEvent&) {
    latencies.push_back((NowNs() - pressedAt.load()) / 1e6);
    acknowledged.fetch_add(1);
  });

  // 40 frames a second of changing levels on every universe.
  std::vector<uint8_t> levels(512);
  uint32_t due = clock.TickCount() + 25;
  std::function<void()> frame = [&] {
    std::fill(levels.begin(), levels.end(), static_cast<uint8_t>(due / 25));
    for (int u = 1; u <= universes; ++u) control.OutputDMXLevels(u, 1, 512, levels.data(), due);
    control.SendAccumulated(due);
    due += 25;
    pumpTimer.SetDeadline(due - 25);
  };
  pumpTimer.SetOnDeadline(frame);
  pumpTimer.SetDeadline(due - 25);

  std::thread presser([&] {
    int fd = ::socket(AF_INET, SOCK_DGRAM, 0);
    sockaddr_in to{};
    to.sin_family = AF_INET;
    to.sin_port = htons(listenPort);
    to.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    std::mt19937 random(7);
    tav::E131DataFields fields;
    fields.cid = {9, 8, 7, 6, 5, 4, 3, 2, 1, 2, 3, 4, 5, 6, 7, 8};
    fields.universe = 9;
    std::vector<uint8_t> packet(tav::E131DataPacketSize(512));
    auto send = [&](uint8_t level) {
      std::vector<uint8_t> slots(512, 0);
      slots[0] = level;
      tav::EncodeE131Data(fields, slots.data(), slots.size(), packet.data());
      ++fields.sequence;
      ::sendto(fd, packet.data(), packet.size(), 0, reinterpret_cast<sockaddr*>(&to), sizeof to);
    };
    send(0);
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    for (int i = 0; i < presses; ++i) {
      send(0);
      std::this_thread::sleep_for(std::chrono::microseconds(2000 + random() % 10000));
      int before = acknowledged.load();
      pressedAt.store(NowNs());
      send(255);
      for (int wait = 0; wait < 1000 && acknowledged.load() == before; ++wait)
        std::this_thread::sleep_for(std::chrono::microseconds(100));
    }
    ::close(fd);
    loop.Post([&] { loop.Stop(); });
  });
  loop.Run();
  presser.join();
  ::close(sink);

  std::sort(latencies.begin(), latencies.end());
  auto at = [&](double p) {
    return latencies.empty() ? 0.0
                             : latencies[std::min(latencies.size() - 1,
                                                  static_cast<size_t>(p * latencies.size()))];
  };
  tav::ChannelIOStatistics stats = control.Statistics();
  std::printf(
      "input latency over %zu of %d presses (%d universes sending at 40 fps, %s): "
      "p50 %.3f ms, p99 %.3f ms, max %.3f ms; frames %llu, late %llu, listener accepted %llu\n",
      latencies.size(), presses, universes, priority > 0 ? "SCHED_FIFO" : "normal priority",
      at(0.50), at(0.99), latencies.empty() ? 0.0 : latencies.back(),
      static_cast<unsigned long long>(stats.frames),
      static_cast<unsigned long long>(stats.framesLate),
      static_cast<unsigned long long>(stats.listener.accepted));
  return latencies.size() == static_cast<size_t>(presses) ? 0 : 1;
}
