// Sequence library figures, with the targets they are judged by:
//
// 1. Loading a plain sequence of 100,000 effects against loading its
//    compressed export and checking that it still matches its source (the
//    hash of the source file, as the player checks at every load): the
//    export must load at least 20x faster, check included.
// 2. Opening an FSEQ file of 86,700 channels (170 universes) and 2,400
//    frames, zstd-compressed, and reading the frame in the middle: under
//    50 ms, and about the same for a file twice as long.
// 3. Memory held while playing that file: a small multiple (at most 3x) of
//    one decompressed compression block, whatever the file's length.
//
// Exits non-zero when a target is missed. Run it from the release preset.

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "platform/LocalFileSystem.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/FseqFile.h"
#include "suite/seqlib/FseqWriter.h"
#include "suite/seqlib/PlainSequence.h"

namespace {

using Steady = std::chrono::steady_clock;

double MsSince(Steady::time_point start) {
  return std::chrono::duration<double, std::milli>(Steady::now() - start).count();
}

// The library's sequences need a Clock; loading does not look at it much.
class BenchClock : public tav::Clock {
 public:
  tav::DateTime Now() const override { return tav::DateTime(); }
  uint32_t TickCount() const override {
    return static_cast<uint32_t>(
        std::chrono::duration_cast<std::chrono::milliseconds>(Steady::now().time_since_epoch())
            .count());
  }
};

// Best of `rounds` runs of `work`, in milliseconds.
template <typename Work>
double Best(int rounds, Work work) {
  double best = 1e300;
  for (int i = 0; i < rounds; ++i) {
    auto start = Steady::now();
    work();
    best = std::min(best, MsSince(start));
  }
  return best;
}

std::string MakeFolder() {
  std::string pattern = (std::filesystem::temp_directory_path() / "tav-bench-XXXXXX").string();
  if (!::mkdtemp(pattern.data())) {
    std::perror("mkdtemp");
    std::exit(2);
  }
  return pattern + "/";
}

tav::SequenceData HundredThousandEffects() {
  tav::SequenceData data;
  data.media = "song.mp3";
  const int kChannels = 500, kPerChannel = 200;
  for (int c = 0; c < kChannels; ++c) {
    tav::SequenceChannel channel;
    channel.name = "Channel " + std::to_string(c);
    channel.address = {c % 2 ? tav::kFamilyDMX : tav::kFamilyTAV, 1 + c / 512, c % 2 ? 0 : c / 64,
                       1 + c % 512};
    for (int i = 0; i < kPerChannel; ++i) {
      int32_t type = 1 + (i + c) % 4;
      channel.effects.push_back({i * 1500 + c, 1000 + (i % 7) * 100, type,
                                 type == tav::kEffectSet ? 80 : 10,
                                 type == tav::kEffectSet ? 80 : 90, 0});
    }
    data.channels.push_back(std::move(channel));
  }
  return data;
}

bool PlainVersusExport(tav::FileSequenceLibrary& library, tav::FileSystem& fs,
                       const std::string& folder) {
  std::string plain = folder + "effects.tseq";
  fs.WriteAll(plain, tav::WritePlainSequence(HundredThousandEffects()));
  auto sequence = library.CreateSequence();
  sequence->LoadFile(plain);
  library.WriteCompressed(*sequence, plain + ".tcs");
  size_t effects = sequence->Info().effectCount;

  double plainMs = Best(3, [&] { library.CreateSequence()->LoadFile(plain); });
  double exportMs = Best(5, [&] { library.LoadCompressed(plain + ".tcs"); });
  double hashMs = Best(5, [&] {
    if (library.CurrentSourceHash(plain, {}) != sequence->Info().sourceHash) std::exit(3);
  });
  double checkedMs = Best(5, [&] {
    auto exported = library.LoadCompressed(plain + ".tcs");
    if (library.CurrentSourceHash(plain, exported->SubsequenceNames()) !=
        exported->Info().sourceHash) {
      std::exit(3);
    }
  });
  double ratio = plainMs / checkedMs;
  std::printf("plain sequence of %zu effects (%.1f MB): load %.1f ms\n", effects,
              fs.Stat(plain).size / 1e6, plainMs);
  std::printf("its compressed export (%.2f MB):        load %.1f ms\n",
              fs.Stat(plain + ".tcs").size / 1e6, exportMs);
  std::printf("  hashing the source to check the export: %.1f ms\n", hashMs);
  std::printf("  export loaded and checked: %.1f ms, %.1fx faster (target: at least 20x) %s\n",
              checkedMs, ratio, ratio >= 20 ? "ok" : "MISSED");
  return ratio >= 20;
}

constexpr uint32_t kFseqChannels = 86700;
constexpr uint32_t kBlockFrames = 20;

std::string WriteFseq(tav::FileSystem& fs, const std::string& path, uint32_t frames) {
  tav::FseqWriter::Options options;
  options.stepMs = 25;
  options.level = 1;
  options.framesPerBlock = kBlockFrames;
  options.media = "song.mp3";
  tav::FseqWriter writer(kFseqChannels, options);
  std::vector<uint8_t> frame(kFseqChannels);
  for (uint32_t f = 0; f < frames; ++f) {
    // A chase with a little texture, so blocks do not compress to nothing.
    for (uint32_t c = 0; c < kFseqChannels; ++c) {
      frame[c] = static_cast<uint8_t>((c * 7 + f * 13) ^ ((c * 2654435761u + f) >> 27));
    }
    writer.AddFrame(frame.data());
  }
  fs.WriteAll(path, writer.Finish());
  return path;
}

double OpenAndReadMiddle(tav::FileSystem& fs, const std::string& path) {
  return Best(5, [&] {
    tav::FseqFile file(fs.OpenForRead(path));
    const uint8_t* frame = file.Frame(file.FrameCount() / 2);
    if (!frame) std::exit(3);
  });
}

bool FseqFigures(tav::FileSequenceLibrary& library, tav::FileSystem& fs,
                 const std::string& folder) {
  bool ok = true;
  auto start = Steady::now();
  std::string shortFile = WriteFseq(fs, folder + "show.fseq", 2400);
  std::string longFile = WriteFseq(fs, folder + "show-twice.fseq", 4800);
  std::printf("\nFSEQ of %u channels, zstd, %u frames per block (written in %.0f ms)\n",
              kFseqChannels, kBlockFrames, MsSince(start));
  double shortMs = OpenAndReadMiddle(fs, shortFile);
  double longMs = OpenAndReadMiddle(fs, longFile);
  std::printf(
      "  2,400 frames (%.1f MB): open and read frame 1,200: %.2f ms (target: under 50 ms) %s\n",
      fs.Stat(shortFile).size / 1e6, shortMs, shortMs < 50 ? "ok" : "MISSED");
  std::printf(
      "  4,800 frames (%.1f MB): open and read frame 2,400: %.2f ms (target: about the same) %s\n",
      fs.Stat(longFile).size / 1e6, longMs,
      longMs < 50 && longMs < 2 * shortMs + 2 ? "ok" : "MISSED");
  ok = ok && shortMs < 50 && longMs < 50 && longMs < 2 * shortMs + 2;

  const size_t block = static_cast<size_t>(kBlockFrames) * kFseqChannels;
  for (const std::string& path : {shortFile, longFile}) {
    auto sequence = library.CreateSequence();
    sequence->LoadFile(path);
    auto stream = sequence->Content()->openStream();
    stream->Seek(0);
    tav::PlayEvent event;
    size_t events = 0, peak = 0;
    auto playStart = Steady::now();
    while (stream->NextTime() != tav::EventStream::kEnd) {
      stream->Next(event);
      if (++events % 170 == 0) peak = std::max(peak, stream->MemoryHeld());
    }
    double playMs = MsSince(playStart);
    double multiple = static_cast<double>(peak) / block;
    std::printf(
        "  playing %s: %zu events in %.0f ms (%.1f us per frame); memory held %.2f MB = %.2f x one "
        "block of %.2f MB (target: at most 3x) %s\n",
        std::filesystem::path(path).filename().c_str(), events, playMs,
        playMs * 1000 / sequence->Info().frameCount, peak / 1e6, multiple, block / 1e6,
        multiple <= 3 ? "ok" : "MISSED");
    ok = ok && multiple <= 3;
  }
  return ok;
}

}  // namespace

int main() {
  std::string folder = MakeFolder();
  auto fs = tav::LocalFileSystem();
  auto resolver = std::make_shared<tav::PathResolver>(fs, [&](int32_t) { return folder; });
  tav::FileSequenceLibrary library(std::make_shared<BenchClock>(), fs, resolver);
  bool ok = PlainVersusExport(library, *fs, folder);
  ok = FseqFigures(library, *fs, folder) && ok;
  std::filesystem::remove_all(folder);
  std::printf("\n%s\n", ok ? "all targets met" : "TARGET MISSED");
  return ok ? 0 : 1;
}
