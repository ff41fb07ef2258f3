// showctl sequence play, run for real, into serial networks: the settings
// name pseudo-terminals as a TAV network's port and as the Fennick port, and
// board models in the test read what the command writes there.

#include <fcntl.h>
#include <poll.h>
#include <pty.h>
#include <termios.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <mutex>
#include <thread>

#include "ShowctlRunner.h"
#include "suite/channelio/serial/testing/DimmerBoardModel.h"

namespace tav::showctl::testing {
namespace {

// A pseudo-terminal whose master side a thread reads into a board chain
// while the command runs.
class PtyBoards {
 public:
  PtyBoards(size_t boards, size_t channels) : m_chain(boards, channels) {
    char name[128] = {};
    if (::openpty(&m_master, &m_slave, name, nullptr, nullptr) != 0)
      throw std::runtime_error("openpty");
    m_path = name;
    termios tio{};
    ::tcgetattr(m_slave, &tio);
    ::cfmakeraw(&tio);
    ::tcsetattr(m_slave, TCSANOW, &tio);
    m_reader = std::thread([this] {
      std::vector<uint8_t> buffer(4096);
      while (!m_stop) {
        pollfd p{m_master, POLLIN, 0};
        if (::poll(&p, 1, 20) <= 0) {
          ++m_idlePolls;
          continue;
        }
        ssize_t n = ::read(m_master, buffer.data(), buffer.size());
        if (n <= 0) continue;
        m_idlePolls = 0;
        std::lock_guard<std::mutex> lock(m_mutex);
        m_chain.Feed(std::span<const uint8_t>(buffer.data(), static_cast<size_t>(n)));
      }
    });
  }
  ~PtyBoards() {
    m_stop = true;
    m_reader.join();
    ::close(m_master);
    ::close(m_slave);
  }
  const std::string& Path() const { return m_path; }
  // The command may have ended with its last frames still in the terminal's
  // buffer: waits until the reader has found nothing more for a while.
  void Drain() {
    for (int i = 0; i < 200 && m_idlePolls < 3; ++i) {
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
  }
  template <typename Look>
  void With(Look look) {
    std::lock_guard<std::mutex> lock(m_mutex);
    look(m_chain);
  }

 private:
  int m_master = -1, m_slave = -1;
  std::string m_path;
  DimmerChainModel m_chain;
  std::mutex m_mutex;
  std::atomic<bool> m_stop{false};
  std::atomic<int> m_idlePolls{0};
  std::thread m_reader;
};

class SequencePlaySerial : public ShowctlTest {};

TEST_F(SequencePlaySerial, APlainSequenceReachesTheTAVAndFennickBoards) {
  PtyBoards tav(4, 8), fennick(2, 8);
  Write("registry.reg",
        "Windows Registry Editor Version 5.00\n\n"
        "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network]\n"
        "\"FennickPort\"=\"" +
            fennick.Path() +
            "\"\n\n"
            "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\Fennick]\n"
            "\"Boards\"=dword:00000002\n\n"
            "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\TAV0]\n"
            "\"Port\"=\"" +
            tav.Path() +
            "\"\n\"Speed\"=dword:0001c200\n"
            "\"UnitCount\"=dword:00000004\n\"CircuitsPerUnit\"=dword:00000008\n");
  std::vector<uint8_t> roofLine;
  tav.With([&](DimmerChainModel& chain) {
    chain.Board(1).SetOnFrame([&](const auto& c) { roofLine.push_back(c[4]); });
  });
  std::vector<uint8_t> arch;
  fennick.With([&](DimmerChainModel& chain) {
    chain.Board(1).SetOnFrame([&](const auto& c) { arch.push_back(c[3]); });
  });
  // front-yard.tseq: the roof line (TAV 1, unit 2, circuit 5) is full from
  // the start; the arch (Fennick channel 12) twinkles from 1 s.
  Result r =
      Run({"sequence", "play", std::string(TAV_SOURCE_DIR) + "/examples/sequences/front-yard.tseq",
           "--seconds", "2"});
  ASSERT_EQ(r.exitCode, 0) << r.err;
  tav.Drain();
  fennick.Drain();
  tav.With([&](DimmerChainModel& chain) {
    EXPECT_EQ(chain.Errors(), 0u);
    ASSERT_FALSE(roofLine.empty());
    EXPECT_NE(std::find(roofLine.begin(), roofLine.end(), 255), roofLine.end());
    EXPECT_EQ(roofLine.back(), 0);  // stopped with the lights off
  });
  fennick.With([&](DimmerChainModel& chain) {
    EXPECT_EQ(chain.Errors(), 0u);
    EXPECT_TRUE(std::any_of(arch.begin(), arch.end(), [](uint8_t v) { return v > 0; }));
    ASSERT_FALSE(arch.empty());
    EXPECT_EQ(arch.back(), 0);
  });
}

}  // namespace
}  // namespace tav::showctl::testing
