#include "platform/TrayLinkFrame.h"

#include <gtest/gtest.h>

#include <vector>

namespace tav {
namespace {

using namespace std::string_literals;

std::string Hex(std::string_view bytes) {
  static const char* digits = "0123456789abcdef";
  std::string out;
  for (unsigned char c : bytes) {
    if (!out.empty()) out += ' ';
    out += digits[c >> 4];
    out += digits[c & 15];
  }
  return out;
}

TEST(TrayLinkFrame, HeaderIsMagicVersionReservedAndThreeLittleEndianFields) {
  std::string bytes = EncodeTrayFrame(TrayFrame{0x01020304, 3, "07hi\0"s});
  EXPECT_EQ(Hex(bytes),
            "54 41 56 4c 01 00 00 00 04 03 02 01 03 00 00 00 05 00 00 00 "
            "30 37 68 69 00");
  EXPECT_EQ(Hex(EncodeTrayFrame(TrayFrame{0xfffffffe, 0x80000000, ""})),
            "54 41 56 4c 01 00 00 00 fe ff ff ff 00 00 00 80 00 00 00 00");
}

// Feeds `stream` in pieces of `step` bytes and collects frames until an error.
std::vector<TrayFrame> ReadAll(const std::string& stream, size_t step, uint32_t max,
                               TrayFrameStatus* last = nullptr) {
  TrayFrameReader reader(max);
  std::vector<TrayFrame> frames;
  TrayFrameStatus status = TrayFrameStatus::kIncomplete;
  for (size_t at = 0; at < stream.size(); at += step) {
    reader.Append(std::string_view(stream).substr(at, step));
    TrayFrame frame;
    while ((status = reader.Next(frame)) == TrayFrameStatus::kFrame) frames.push_back(frame);
    if (status != TrayFrameStatus::kIncomplete) break;
  }
  if (last) *last = status;
  return frames;
}

TEST(TrayLinkFrame, FramesComeOutWhateverPiecesTheStreamArrivesIn) {
  std::vector<TrayFrame> sent = {
      {7, 3, "02\0"s}, {0, 3, ""}, {9, 1, std::string(3000, 'x')}, {1, 3, "07a\r\nb\0"s}};
  std::string stream;
  for (const auto& frame : sent) stream += EncodeTrayFrame(frame);
  for (size_t step : {size_t{1}, size_t{3}, size_t{19}, size_t{20}, size_t{4096}, stream.size()}) {
    TrayFrameStatus last;
    EXPECT_EQ(ReadAll(stream, step, 4096, &last), sent) << "step " << step;
    EXPECT_EQ(last, TrayFrameStatus::kIncomplete);
  }
}

TEST(TrayLinkFrame, AHeaderThatIsNoneIsRefusedAndTheRefusalSticks) {
  std::string good = EncodeTrayFrame(TrayFrame{1, 3, "x"});
  const struct {
    size_t offset;
    char value;
  } corruptions[] = {{0, 'X'}, {3, 'l'}, {4, 2}, {5, 1}, {6, 1}, {7, 1}};
  for (const auto& c : corruptions) {
    std::string bad = good;
    bad[c.offset] = c.value;
    TrayFrameStatus last;
    auto frames = ReadAll(good + bad + good, 1, 100, &last);
    EXPECT_EQ(frames.size(), 1u) << c.offset;
    EXPECT_EQ(last, TrayFrameStatus::kBadHeader) << c.offset;
  }
  TrayFrameReader reader(100);
  reader.Append("GET / HTTP/1.1\r\nHost: x\r\n\r\n");
  TrayFrame frame;
  EXPECT_EQ(reader.Next(frame), TrayFrameStatus::kBadHeader);
  reader.Append(good);
  EXPECT_EQ(reader.Next(frame), TrayFrameStatus::kBadHeader);
  EXPECT_EQ(reader.Buffered(), 0u);
}

TEST(TrayLinkFrame, AnOversizedFrameIsRefusedFromItsHeaderAlone) {
  TrayFrameReader reader(100);
  std::string header = EncodeTrayFrame(TrayFrame{1, 3, std::string(101, 'a')}).substr(0, 20);
  reader.Append(header);
  TrayFrame frame;
  EXPECT_EQ(reader.Next(frame), TrayFrameStatus::kTooLarge);
  EXPECT_STREQ(TrayFrameStatusText(TrayFrameStatus::kTooLarge), "oversized frame");

  TrayFrameStatus last;
  EXPECT_EQ(ReadAll(EncodeTrayFrame(TrayFrame{1, 3, std::string(100, 'a')}), 7, 100, &last).size(),
            1u);
}

}  // namespace
}  // namespace tav
