// showctl sequence convert: a sequence in another format. FSEQ files and
// exports stream through a block of frames at a time into the output, which
// replaces its file only once it is whole; a plain sequence is compiled in
// memory first (it was parsed whole anyway).

#include <fmt/format.h>

#include <cctype>
#include <iostream>

#include "CommandRegistry.h"
#include "SequenceCommands.h"
#include "platform/LocalFileSystem.h"
#include "suite/seqlib/CompressedSequence.h"
#include "suite/seqlib/CompressedSequenceWriter.h"
#include "suite/seqlib/PlainSequenceWriter.h"
#include "suite/seqlib/SequenceSummary.h"

namespace tav::showctl {
namespace {

bool EndsWithIgnoringCase(const std::string& text, const std::string& suffix) {
  if (text.size() < suffix.size()) return false;
  for (size_t i = 0; i < suffix.size(); ++i) {
    if (std::tolower(static_cast<unsigned char>(text[text.size() - suffix.size() + i])) !=
        suffix[i])
      return false;
  }
  return true;
}

}  // namespace

void Convert(const SequenceOptions& o) {
  std::string to = o.to;
  if (to.empty())
    to = EndsWithIgnoringCase(o.output, std::string(".") + kCompressedExtension) ? "tcs" : "plain";
  if (to != "tcs" && to != "plain")
    throw CommandFailed("--to must be \"plain\" or \"tcs\", not \"" + to + "\"");
  if (o.output == o.file) throw CommandFailed("the output must not be the input file");
  auto library = MakeSequenceLibrary(o);
  auto source = library->OpenStreamed(o.file, /*hashFseq=*/true);
  SequenceSummary summary = Summarize(source->Head(), source->Groups());
  auto out = LocalFileSystem()->OpenForWrite(o.output);
  if (to == "tcs") {
    WriteCompressedSequence(*source, *out);
  } else {
    WritePlainSequence(*source, *out);
  }
  out->Commit();
  if (to == "plain" && !source->Head().subsequences.empty()) {
    std::cerr << "showctl: note: the subsequences of " << o.file << " are merged into " << o.output
              << "\n";
  }
  std::cout << fmt::format("Wrote {} ({}, {} effects, {} frames, {} level blocks)\n", o.output,
                           to == "tcs" ? "compressed export" : "plain sequence",
                           summary.effectCount, summary.timelineFrames, summary.levelBlocks);
}

}  // namespace tav::showctl
