#include "platform/PosixSerialPort.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/file.h>
#include <termios.h>
#include <unistd.h>

#include <fcntl.h>
#include <chrono>

#include "platform/PosixSerialDevice.h"
#include "platform/testing/PtyDevice.h"
#include "support/Error.h"
#include "support/testing/TempFolder.h"

namespace tav {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;

class PosixSerialPortTest : public ::testing::Test {
 protected:
  PosixSerialPortTest() : device(loop, folder / "ttyUSB0"), ports(loop, Options()) {
    device.SetOnBytes([this](std::span<const uint8_t> bytes) {
      received.insert(received.end(), bytes.begin(), bytes.end());
    });
  }
  static PosixSerialOptions Options() {
    PosixSerialOptions options;
    options.maxQueuedBytes = 16 * 1024;
    options.firstReopenMs = 20;
    options.longestReopenMs = 100;
    return options;
  }

  std::unique_ptr<SerialLink> Open(int32_t baud = 57600, int32_t stopBits = 1) {
    auto link = ports.Open({device.Path(), baud, stopBits});
    link->SetOnReceive([this](std::span<const uint8_t> bytes) {
      fromDevice.insert(fromDevice.end(), bytes.begin(), bytes.end());
    });
    link->SetOnConnectionChange([this](bool connected, const std::string& reason) {
      changes.push_back(connected ? "back" : "lost: " + reason);
    });
    return link;
  }

  template <typename Predicate>
  bool RunUntil(Predicate done, int ms = 3000) {
    auto until = std::chrono::steady_clock::now() + std::chrono::milliseconds(ms);
    while (!done()) {
      if (std::chrono::steady_clock::now() > until) return false;
      loop.RunFor(std::chrono::milliseconds(2));
    }
    return true;
  }

  static Error FailureOf(const std::function<void()>& action) {
    try {
      action();
    } catch (const Error& e) {
      return e;
    }
    return Error(0, "", "no failure");
  }

  TempFolder folder{"tav-serial"};
  EventLoop loop;
  PtyDevice device;
  PosixSerialPorts ports;
  std::vector<uint8_t> received, fromDevice;
  std::vector<std::string> changes;
};

TEST_F(PosixSerialPortTest, EveryByteValuePassesUntouchedBothWays) {
  auto link = Open();
  // Line ends, flow-control and signal characters included: the line is raw.
  std::vector<uint8_t> all(256);
  for (size_t i = 0; i < all.size(); ++i) all[i] = static_cast<uint8_t>(i);
  ASSERT_TRUE(link->Write(all));
  ASSERT_TRUE(RunUntil([&] { return received.size() >= all.size(); }));
  EXPECT_EQ(received, all);
  device.Write(all);
  ASSERT_TRUE(RunUntil([&] { return fromDevice.size() >= all.size(); }));
  EXPECT_EQ(fromDevice, all);
}

TEST_F(PosixSerialPortTest, SpeedAndStopBitsAreSetOnTheLine) {
  for (auto [baud, stopBits] : {std::pair{115200, 1}, {4800, 2}, {250000, 2}}) {
    SCOPED_TRACE(baud);
    auto link = Open(baud, stopBits);
    struct termios tio {};
    ASSERT_EQ(::tcgetattr(device.SlaveFd(), &tio), 0);
    EXPECT_EQ((tio.c_cflag & CSTOPB) != 0, stopBits == 2);
    EXPECT_EQ(tio.c_cflag & CSIZE, static_cast<tcflag_t>(CS8));
    EXPECT_EQ(tio.c_cflag & (PARENB | CRTSCTS), 0u);
    if (StandardSerialSpeed(baud) != 0) {
      EXPECT_EQ(::cfgetospeed(&tio), StandardSerialSpeed(baud));
    }
  }
}

TEST_F(PosixSerialPortTest, PortsThatCannotBeUsedAreClearErrors) {
  const std::string regular = folder.Write("plain-file", "x");
  struct Case {
    SerialSettings settings;
    int32_t number;
    const char* text;
  };
  const Case cases[] = {
      {{folder / "ttyUSB9", 57600, 1}, kErrorPortInvalid, "does not exist"},
      {{regular, 57600, 1}, kErrorPortInvalid, "is not a serial port"},
      {{"/dev/null", 57600, 1}, kErrorPortInvalid, "is not a serial port"},
      {{device.Path(), 0, 1}, kErrorPortSettings, "cannot run at 0 baud"},
      {{device.Path(), 57600, 3}, kErrorPortSettings, "stop bits"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.settings.path);
    Error e = FailureOf([&] { ports.Open(c.settings); });
    EXPECT_EQ(e.Number(), c.number);
    EXPECT_THAT(e.Description(), HasSubstr(c.text));
  }
}

TEST_F(PosixSerialPortTest, APortHeldByAnotherProgramIs8005WithTheHostsWords) {
  // Another program holding the device (an exclusive lock, as serial tools
  // take; the test runs as root, for whom TIOCEXCL is no barrier).
  int other = ::open(device.TtyPath().c_str(), O_RDWR | O_NOCTTY | O_CLOEXEC);
  ASSERT_GE(other, 0);
  ASSERT_EQ(::flock(other, LOCK_EX | LOCK_NB), 0);
  Error e = FailureOf([&] { ports.Open({device.Path(), 57600, 1}); });
  EXPECT_EQ(e.Number(), kErrorPortAlreadyOpen);
  EXPECT_EQ(e.Description(),
            "Shows can not be enabled because the comm port is already open.  If the Tessavar "
            "Hardware Utility is running, shut it down and then enable shows.");
  ::close(other);
  // And this program's own second open meets its first.
  auto link = Open();
  EXPECT_EQ(FailureOf([&] {
              ports.Open({device.Path(), 57600, 1});
            }).Number(),
            kErrorPortAlreadyOpen);
}

TEST_F(PosixSerialPortTest, UnplugAndReplugAreReportedOnceEachAndBytesFlowAgain) {
  auto link = Open();
  ASSERT_TRUE(link->Write(std::vector<uint8_t>{1, 2, 3}));
  ASSERT_TRUE(RunUntil([&] { return received.size() == 3; }));
  device.Unplug();
  ASSERT_TRUE(RunUntil([&] { return !changes.empty(); }));
  EXPECT_FALSE(link->Connected());
  EXPECT_FALSE(link->Write(std::vector<uint8_t>{4}));
  // Away for a while: the link keeps trying, quietly.
  loop.RunFor(std::chrono::milliseconds(300));
  EXPECT_EQ(changes.size(), 1u);
  device.Replug();
  ASSERT_TRUE(RunUntil([&] { return changes.size() == 2; }));
  EXPECT_THAT(changes[0], HasSubstr("lost: "));
  EXPECT_EQ(changes[1], "back");
  EXPECT_TRUE(link->Connected());
  received.clear();
  ASSERT_TRUE(link->Write(std::vector<uint8_t>{5, 6}));
  ASSERT_TRUE(RunUntil([&] { return received.size() == 2; }));
  EXPECT_THAT(received, ElementsAre(5, 6));
  device.Write(std::vector<uint8_t>{7});
  ASSERT_TRUE(RunUntil([&] { return !fromDevice.empty(); }));
}

TEST_F(PosixSerialPortTest, ADeviceThatDoesNotReadFillsABoundedQueueWithoutBlocking) {
  auto link = Open(115200);
  device.SetReading(false);
  std::vector<uint8_t> chunk(1000);
  size_t accepted = 0;
  auto started = std::chrono::steady_clock::now();
  for (int i = 0; i < 1000; ++i) {
    for (size_t j = 0; j < chunk.size(); ++j) chunk[j] = static_cast<uint8_t>(accepted + j);
    if (link->Write(chunk)) accepted += chunk.size();
    loop.RunFor(std::chrono::milliseconds(0));
  }
  EXPECT_LT(std::chrono::steady_clock::now() - started, std::chrono::seconds(2));
  EXPECT_LE(link->QueuedBytes(), 16u * 1024);
  EXPECT_LT(accepted, 1000u * 1000);  // the bound refused some
  device.SetReading(true);
  ASSERT_TRUE(RunUntil([&] { return received.size() == accepted; }));
  EXPECT_EQ(link->QueuedBytes(), 0u);
  // Nothing lost or reordered among what was accepted.
  for (size_t i = 0; i < received.size(); i += 997) EXPECT_EQ(received[i], static_cast<uint8_t>(i));
}

TEST_F(PosixSerialPortTest, BreakFramesFollowTheBytesBeforeThem) {
  auto link = Open(250000, 2);
  ASSERT_TRUE(link->Write(std::vector<uint8_t>(100, 0xAA)));
  ASSERT_TRUE(link->WriteAfterBreak(std::vector<uint8_t>(513, 0x55), 110, 16));
  ASSERT_TRUE(link->WriteAfterBreak(std::vector<uint8_t>(513, 0x66), 110, 16));
  ASSERT_TRUE(RunUntil([&] { return received.size() == 100 + 2 * 513; }));
  EXPECT_EQ(received[99], 0xAA);
  EXPECT_EQ(received[100], 0x55);
  EXPECT_EQ(received[613], 0x66);
}

}  // namespace
}  // namespace tav
