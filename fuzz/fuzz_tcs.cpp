// The compressed-export reader on arbitrary bytes: it may only fail with
// tav::Error, and what it accepts must write back to the same sequence and
// play.

#include "FuzzCommon.h"
#include "suite/seqlib/CompiledEventStream.h"
#include "suite/seqlib/CompressedSequence.h"

namespace {

void FuzzOne(std::string_view input) {
  auto compiled =
      std::make_shared<tav::CompiledSequence>(tav::ReadCompressedSequence(input, "fuzz.tcs"));
  if (tav::ReadCompressedSequence(tav::WriteCompressedSequence(*compiled), "again") != *compiled)
    __builtin_trap();
  tav::CompiledEventStream stream(compiled);
  for (int64_t at : {int64_t{0}, compiled->lengthMs / 2, compiled->lengthMs}) {
    stream.Seek(at);
    tav::PlayEvent event;
    for (int i = 0; i < 256 && stream.NextTime() != tav::EventStream::kEnd; ++i) stream.Next(event);
  }
  (void)stream.LightsOff();
}

}  // namespace

TAV_FUZZ_TARGET(FuzzOne(input))
