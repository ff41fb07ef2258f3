// The FSEQ reader on arbitrary bytes: opening and reading frames may only
// fail with tav::Error.

#include <algorithm>
#include <string>

#include "FuzzCommon.h"
#include "suite/seqlib/FseqEventStream.h"
#include "suite/seqlib/FseqFile.h"

namespace {

void FuzzOne(std::string_view input) {
  auto file = std::make_shared<tav::MemoryFile>(std::string(input), "fuzz.fseq");
  auto reader = std::make_unique<tav::FseqFile>(file);
  uint32_t frames = reader->FrameCount();
  uint32_t picks[] = {0, frames / 2, frames > 0 ? frames - 1 : 0, frames, frames + 1};
  for (uint32_t f : picks) {
    const uint8_t* frame = reader->Frame(f);
    if (frame && f >= frames) __builtin_trap();
    if (frame) {
      volatile uint8_t sink = frame[0] ^ frame[reader->ChannelCount() - 1];
      (void)sink;
    }
  }
  tav::FseqEventStream stream(std::move(reader), tav::UniverseMap::Uniform());
  stream.Seek(0);
  tav::PlayEvent event;
  for (int i = 0; i < 64 && stream.NextTime() != tav::EventStream::kEnd; ++i) stream.Next(event);
}

}  // namespace

TAV_FUZZ_TARGET(FuzzOne(input))
