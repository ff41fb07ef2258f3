#include "suite/channelio/serial/SerialLineTiming.h"

#include <gtest/gtest.h>

namespace tav {
namespace {

TEST(SerialLineTiming, ChannelsPerSpeedMatchTheCommonLimits) {
  // The limits the open-source players publish for 8N1 at 20 frames/s.
  EXPECT_EQ(DimmerChannelsForSpeed(19200, 1), 94);
  EXPECT_EQ(DimmerChannelsForSpeed(38400, 1), 190);
  EXPECT_EQ(DimmerChannelsForSpeed(57600, 1), 286);
  EXPECT_EQ(DimmerChannelsForSpeed(115200, 1), 574);
  // Two stop bits make every byte 11 bits long.
  EXPECT_EQ(DimmerChannelsForSpeed(115200, 2), 521);
  EXPECT_EQ(DimmerChannelsForSpeed(300, 1), 0);
}

TEST(SerialLineTiming, LineTimeCountsStartAndStopBits) {
  EXPECT_EQ(SerialLineMicros(576, 115200, 1), 50000);
  EXPECT_EQ(SerialLineMicros(1, 9600, 1), 1042);  // rounded up
  EXPECT_EQ(SerialLineMicros(513, 250000, 2), 22572);
  EXPECT_DOUBLE_EQ(SerialFrameRateLimit(576, 115200, 1), 20.0);
}

TEST(SerialLineTiming, PacerKnowsWhenTheLineIsFreeAcrossTheTickWrap) {
  LinePacer pacer(115200, 1);
  const uint32_t start = 0xFFFFFFF0u;  // 16 ms before the tick wraps
  EXPECT_EQ(pacer.BusyMicros(start), 0);
  pacer.Wrote(576, start);  // 50 ms of line
  EXPECT_EQ(pacer.BusyMicros(start + 20), 30000);
  pacer.Wrote(576, start + 20);  // queued behind the first
  EXPECT_EQ(pacer.BusyMicros(start + 20), 80000);
  EXPECT_EQ(pacer.BusyMicros(start + 100), 0);
  pacer.Wrote(576, start + 100);  // an idle line starts afresh
  EXPECT_EQ(pacer.BusyMicros(start + 100), 50000);
  pacer.Reset();
  EXPECT_EQ(pacer.BusyMicros(start + 100), 0);
}

}  // namespace
}  // namespace tav
