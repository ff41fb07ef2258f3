// Media lengths read from the files' own headers, built here byte by byte
// from the formats' published layouts.

#include <gmock/gmock.h>

#include <filesystem>
#include <string>

#include "platform/LocalFileSystem.h"
#include "simulation/MediaLength.h"
#include "support/testing/TempFolder.h"

namespace tav::simulation {
namespace {

std::string Le(uint64_t v, int bytes) {
  std::string s;
  for (int i = 0; i < bytes; ++i) s += static_cast<char>(v >> (8 * i));
  return s;
}

std::string Be(uint64_t v, int bytes) {
  std::string s;
  for (int i = bytes - 1; i >= 0; --i) s += static_cast<char>(v >> (8 * i));
  return s;
}

std::string Wav(uint16_t format, uint32_t rate, uint16_t blockAlign, uint32_t byteRate,
                uint32_t dataSize, size_t dataBytes) {
  return "RIFF" + Le(36 + dataSize, 4) + "WAVE" + "LIST" + Le(3, 4) + "abc" + std::string(1, 0) +
         "fmt " + Le(16, 4) + Le(format, 2) + Le(2, 2) + Le(rate, 4) + Le(byteRate, 4) +
         Le(blockAlign, 2) + Le(16, 2) + "data" + Le(dataSize, 4) + std::string(dataBytes, 0);
}

TEST(WavSeconds, CountsFramesOrBytesAndTrustsTheFileOverAStreamsSize) {
  // 16-bit stereo at 8 kHz: 4-byte frames, 32000 bytes a second.
  EXPECT_DOUBLE_EQ(*WavSeconds(Wav(1, 8000, 4, 32000, 64000, 0), 64000 + 56), 2.0);
  // A streamed file says 0 or all ones: the file's size decides.
  std::string streamed = Wav(1, 8000, 4, 32000, 0, 0);
  EXPECT_DOUBLE_EQ(*WavSeconds(streamed, streamed.size() + 16000), 0.5);
  EXPECT_DOUBLE_EQ(*WavSeconds(Wav(1, 8000, 4, 32000, 0xFFFFFFFF, 0), 56 + 8000), 0.25);
  // A data size beyond the end of the file counts to the end.
  EXPECT_DOUBLE_EQ(*WavSeconds(Wav(1, 8000, 4, 32000, 640000, 0), 56 + 32000), 1.0);
  // A compressed coding (IMA ADPCM, 17) goes by its byte rate.
  EXPECT_DOUBLE_EQ(*WavSeconds(Wav(17, 8000, 256, 4055, 4055 * 3, 0), 56 + 4055 * 3), 3.0);
  EXPECT_FALSE(WavSeconds("RIFF\0\0\0\0AVI LIST", 100));
  EXPECT_FALSE(WavSeconds("RIFF" + Le(4, 4) + "WAVE" + "data" + Le(8, 4), 100));  // no fmt
}

TEST(FlacSeconds, ReadsTheSampleCountOfStreamInfo) {
  // 44.1 kHz, stereo, 16 bits, 441000 samples; behind an ID3 tag of 5 bytes.
  std::string info = Be(4096, 2) + Be(4096, 2) + Be(0, 3) + Be(0, 3) + "\x0A\xC4\x42\xF0" +
                     Be(441000, 4) + std::string(16, 0);
  std::string flac = "fLaC" + std::string("\x80", 1) + Be(34, 3) + info;
  EXPECT_DOUBLE_EQ(*FlacSeconds(flac), 10.0);
  EXPECT_DOUBLE_EQ(*FlacSeconds("ID3\x04" + std::string(5, 0) + "\x05" + "abcde" + flac), 10.0);
  EXPECT_FALSE(FlacSeconds(flac.substr(0, 30)));
  EXPECT_FALSE(FlacSeconds("OggS" + flac));
}

// MPEG-1 layer III, 128 kbit/s, 44.1 kHz, stereo: 417-byte frames.
const std::string kMp3Header("\xFF\xFB\x90\x00", 4);
constexpr size_t kMp3FrameBytes = 417;

std::string Mp3Frames(int count, std::string firstBody = "") {
  std::string frames;
  for (int i = 0; i < count; ++i) {
    std::string body = i == 0 ? firstBody : "";
    body.resize(kMp3FrameBytes - 4, '\0');
    frames += kMp3Header + body;
  }
  return frames;
}

TEST(Mp3Seconds, UsesTheFrameCountWhenThereIsOneElseTheBitRate) {
  const std::string id3 = "ID3\x03" + std::string(5, 0) + "\x14" + std::string(20, 0);
  std::string cbr = id3 + Mp3Frames(100);
  EXPECT_NEAR(*Mp3Seconds(cbr, cbr.size()), 100.0 * kMp3FrameBytes * 8 / 128000, 1e-9);

  // Xing after the 32 bytes of stereo side information: 1000 frames.
  std::string xing = Mp3Frames(3, std::string(32, 0) + "Xing" + Be(1, 4) + Be(1000, 4));
  EXPECT_NEAR(*Mp3Seconds(xing, 5'000'000), 1000.0 * 1152 / 44100, 1e-9);
  std::string info = Mp3Frames(3, std::string(32, 0) + "Info" + Be(1, 4) + Be(441, 4));
  EXPECT_NEAR(*Mp3Seconds(info, 5'000'000), 441.0 * 1152 / 44100, 1e-9);

  // A sync pattern in junk before the audio is passed over: no frame
  // follows it where its length says.
  std::string junk = std::string("\xFF\xFB\x90\x00", 4) + std::string(50, 'j') + Mp3Frames(10);
  EXPECT_NEAR(*Mp3Seconds(junk, junk.size()), (junk.size() - 54) * 8.0 / 128000, 1e-9);

  EXPECT_FALSE(Mp3Seconds(std::string(5000, 'x'), 5000));
  // Reserved version, free bit rate, reserved sample rate.
  EXPECT_FALSE(Mp3Seconds(std::string("\xFF\xEB\x90\x00", 4) + std::string(900, 0), 904));
  EXPECT_FALSE(Mp3Seconds(std::string("\xFF\xFB\x00\x00", 4) + std::string(900, 0), 904));
  EXPECT_FALSE(Mp3Seconds(std::string("\xFF\xFB\x9C\x00", 4) + std::string(900, 0), 904));
}

std::string OggPage(uint64_t granule, uint32_t serial, const std::string& body) {
  return "OggS" + std::string(1, 0) + std::string(1, 0) + Le(granule, 8) + Le(serial, 4) +
         Le(0, 4) + Le(0, 4) + std::string(1, 1) + std::string(1, static_cast<char>(body.size())) +
         body;
}

TEST(OggSeconds, DividesTheLastPositionOfTheStreamByItsRate) {
  std::string vorbis =
      OggPage(0, 77, "\x01vorbis" + Le(0, 4) + "\x02" + Le(44100, 4) + std::string(10, 0));
  std::string tail = std::string(100, 'a') + OggPage(44100 * 3, 77, std::string(20, 'b')) +
                     OggPage(~uint64_t{0}, 77, std::string(20, 'c')) +
                     OggPage(44100 * 9, 78, std::string(20, 'd'));
  EXPECT_DOUBLE_EQ(*OggSeconds(vorbis, tail), 3.0);

  std::string opus = OggPage(
      0, 5,
      "OpusHead" + std::string("\x01\x02", 2) + Le(312, 2) + Le(44100, 4) + std::string(3, 0));
  EXPECT_DOUBLE_EQ(*OggSeconds(opus, OggPage(48000 * 2 + 312, 5, "x")), 2.0);

  EXPECT_FALSE(OggSeconds(vorbis, std::string(200, 'z')));
  EXPECT_FALSE(OggSeconds(OggPage(0, 77,
                                  "\x7F"
                                  "FLAC" +
                                      std::string(20, 0)),
                          tail));
  EXPECT_FALSE(OggSeconds("RIFF", tail));
}

TEST(ProbeMediaLength, SaysWhatItFoundAndWhy) {
  TempFolder folder("tav-media-length");
  auto files = LocalFileSystem();
  folder.Write("song.wav", Wav(1, 8000, 4, 32000, 32000, 32000));
  folder.Write("song.mp3", Mp3Frames(20));
  folder.Write("tagged", "ID3\x03" + std::string(5, 0) + "\x01" + "x" + Mp3Frames(20));
  folder.Write("song.m4a", std::string(2000, 'm'));
  folder.Write("noise.mp3", std::string(2000, 'n'));
  folder.Write("empty.wav", "");
  std::filesystem::create_directories(folder / "folder.wav");

  struct Case {
    std::string name;
    MediaLength::Found found;
    std::string source;
  };
  const std::vector<Case> cases = {
      {"song.wav", MediaLength::Found::kSeconds, "WAV header"},
      {"song.mp3", MediaLength::Found::kSeconds, "MP3 frames"},
      {"tagged", MediaLength::Found::kSeconds, "MP3 frames"},
      {"song.m4a", MediaLength::Found::kUnknown, "M4A file"},
      {"noise.mp3", MediaLength::Found::kUnknown, "MP3 file"},
      {"gone.ogg", MediaLength::Found::kMissing, "file not found"},
      {"empty.wav", MediaLength::Found::kUnreadable, "the file is empty"},
      {"folder.wav", MediaLength::Found::kUnreadable, "it is a folder"},
  };
  for (const Case& c : cases) {
    MediaLength length = ProbeMediaLength(*files, folder / c.name);
    EXPECT_EQ(length.found, c.found) << c.name;
    EXPECT_EQ(length.source, c.source) << c.name;
  }
  EXPECT_DOUBLE_EQ(ProbeMediaLength(*files, folder / "song.wav").seconds, 1.0);
}

TEST(LengthText, MinutesOrHoursToATenth) {
  EXPECT_EQ(LengthText(0.04), "0:00.0");
  EXPECT_EQ(LengthText(133.44), "2:13.4");
  EXPECT_EQ(LengthText(59.96), "1:00.0");
  EXPECT_EQ(LengthText(3723), "1:02:03.0");
  EXPECT_EQ(LengthText(-5), "0:00.0");
}

}  // namespace
}  // namespace tav::simulation
