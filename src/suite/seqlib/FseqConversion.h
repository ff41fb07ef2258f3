#pragma once
// An FSEQ file read whole into the authored form: one DMX track per
// universe piece, every frame. For conversion and for FSEQ files included
// as subsequences; playing an FSEQ file never does this.

#include <functional>

#include "suite/seqlib/FseqFile.h"
#include "suite/seqlib/SequenceData.h"
#include "suite/seqlib/UniverseMap.h"

namespace tav {

SequenceData FseqToSequenceData(FseqFile& file, const UniverseMap& map,
                                const std::function<void()>& keepAlive = {});

}  // namespace tav
