// The plain sequence parser on arbitrary text: it may only fail with
// tav::Error, and what it accepts must survive writing and reading again,
// and play.

#include "FuzzCommon.h"
#include "suite/seqlib/CompiledEventStream.h"
#include "suite/seqlib/PlainSequence.h"

namespace {

void FuzzOne(std::string_view input) {
  tav::SequenceData data = tav::ParsePlainSequence(input, "fuzz.tseq");
  if (tav::ParsePlainSequence(tav::WritePlainSequence(data), "again") != data) __builtin_trap();
  auto compiled = std::make_shared<tav::CompiledSequence>(
      tav::Compile(data, [](const tav::SubsequenceRef&) { return nullptr; }));
  tav::CompiledEventStream stream(compiled);
  for (int64_t at : {int64_t{0}, compiled->lengthMs / 2}) {
    stream.Seek(at);
    tav::PlayEvent event;
    int64_t last = 0;
    for (int i = 0; i < 256 && stream.NextTime() != tav::EventStream::kEnd; ++i) {
      stream.Next(event);
      if (event.lDueTime < last) __builtin_trap();  // play order
      last = event.lDueTime;
    }
  }
  (void)stream.LightsOff();
}

}  // namespace

TAV_FUZZ_TARGET(FuzzOne(input))
