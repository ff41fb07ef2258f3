// showctl sequence play, run for real: a test FSEQ file (written by an
// independent writer, pattern in testdata/fseq/README.md) goes out as E1.31
// to a UDP socket of the test on loopback.

#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>

#include "ShowctlRunner.h"
#include "suite/channelio/E131Packet.h"
#include "support/testing/TestData.h"

namespace tav::showctl::testing {
namespace {

class SequencePlay : public ShowctlTest {
 protected:
  void SetUp() override {
    ShowctlTest::SetUp();
    m_socket = ::socket(AF_INET, SOCK_DGRAM | SOCK_NONBLOCK, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    ASSERT_EQ(::bind(m_socket, reinterpret_cast<sockaddr*>(&address), sizeof address), 0);
    socklen_t length = sizeof address;
    ::getsockname(m_socket, reinterpret_cast<sockaddr*>(&address), &length);
    m_port = ntohs(address.sin_port);
    int buffer = 4 << 20;
    ::setsockopt(m_socket, SOL_SOCKET, SO_RCVBUF, &buffer, sizeof buffer);
  }
  void TearDown() override {
    ::close(m_socket);
    ShowctlTest::TearDown();
  }
  void Universes(int count) {
    std::string text = "Windows Registry Editor Version 5.00\n";
    for (int u = 1; u <= count; ++u) {
      char section[256];
      std::snprintf(section, sizeof section,
                    "\n[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\DMX\\%d]\n"
                    "\"Universe\"=dword:%08x\n\"Destination\"=\"127.0.0.1:%d\"\n",
                    u, u, m_port);
      text += section;
    }
    Write("registry.reg", text);
  }
  // Every E1.31 data packet that arrived.
  std::vector<std::vector<uint8_t>> Received() {
    std::vector<std::vector<uint8_t>> packets;
    std::vector<uint8_t> buffer(2000);
    for (;;) {
      ssize_t n = ::recv(m_socket, buffer.data(), buffer.size(), 0);
      if (n <= 0) break;
      packets.emplace_back(buffer.begin(), buffer.begin() + n);
    }
    return packets;
  }

  int m_socket = -1;
  uint16_t m_port = 0;
};

TEST_F(SequencePlay, EveryFrameLeavesOnThePatternThenLightsOffAndTerminated) {
  Universes(1);
  std::string file = tav::testing::TestDataFile("fseq/v1_basic.fseq");  // 100 frames of 50 ms
  Result r = Run({"sequence", "play", file, "--quiet"});
  ASSERT_EQ(r.exitCode, 0) << r.err;
  std::vector<int> frames;
  int terminated = 0;
  uint8_t lastSequence = 0;
  bool first = true;
  for (const auto& packet : Received()) {
    E131DataView view;
    ASSERT_EQ(ParseE131(packet.data(), packet.size(), view), E131Parse::kData);
    if (!first) {
      EXPECT_EQ(view.sequence, static_cast<uint8_t>(lastSequence + 1));
    }
    first = false;
    lastSequence = view.sequence;
    if (view.options & kE131OptionTerminated) {
      ++terminated;
      continue;
    }
    ASSERT_EQ(view.slotCount, 512);
    // value(f, c) = (c * 7 + f * 13 + 17) mod 256; 13 * 197 = 1 (mod 256).
    int f = ((view.slots[0] - 17) * 197) & 255;
    bool dark = std::all_of(view.slots, view.slots + 512, [](uint8_t v) { return v == 0; });
    if (dark) {
      frames.push_back(-1);
      continue;
    }
    for (int c = 0; c < 512; ++c) ASSERT_EQ(view.slots[c], (c * 7 + f * 13 + 17) & 255);
    frames.push_back(f);
  }
  ASSERT_EQ(frames.size(), 101u);
  for (int f = 0; f < 100; ++f) EXPECT_EQ(frames[f], f);
  EXPECT_EQ(frames.back(), -1);
  EXPECT_EQ(terminated, 3);
}

TEST_F(SequencePlay, WithoutUniversesItSaysWhatIsMissing) {
  Result r = Run({"sequence", "play", tav::testing::TestDataFile("fseq/v1_basic.fseq")});
  EXPECT_EQ(r.exitCode, 1);
  EXPECT_NE(r.err.find("no DMX universe is set up in the network preferences"), std::string::npos)
      << r.err;
}

TEST_F(SequencePlay, ABadViewOrAMissingFileIsAClearError) {
  Universes(1);
  Result r =
      Run({"sequence", "play", tav::testing::TestDataFile("fseq/v1_basic.fseq"), "--view", "1-x"});
  EXPECT_EQ(r.exitCode, 1);
  EXPECT_NE(r.err.find("--view: \"1-x\" is not a universe"), std::string::npos) << r.err;
  r = Run({"sequence", "play", Path("nothing.fseq")});
  EXPECT_NE(r.exitCode, 0);
  EXPECT_TRUE(Received().empty());
}

}  // namespace
}  // namespace tav::showctl::testing
