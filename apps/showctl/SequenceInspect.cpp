// showctl sequence inspect: what a sequence file holds, from its headers.
// FSEQ files and compressed exports are opened as streams, which read the
// headers and nothing of the frames, so a file of any length answers at
// once; a plain sequence has to be parsed.

#include <fmt/format.h>

#include <iostream>

#include "SequenceCommands.h"
#include "platform/LocalFileSystem.h"
#include "suite/seqlib/CompressedSequence.h"
#include "suite/seqlib/CompressedSequenceReader.h"
#include "suite/seqlib/ContentHash.h"
#include "suite/seqlib/FseqConversion.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SequenceSummary.h"

namespace tav::showctl {
namespace {

void Line(const char* label, const std::string& value) {
  std::cout << fmt::format("{:<15}{}\n", std::string(label) + ":", value);
}

std::string Step(int32_t stepMs) {
  if (stepMs <= 0) return "";
  double perSecond = 1000.0 / stepMs;
  return fmt::format(" at {} ms ({:.4g} per second)", stepMs, perSecond);
}

void PrintCounts(const SequenceSummary& s, bool withEffects) {
  if (withEffects) {
    Line("Effects", fmt::format("{} on {} channel(s)", s.effectCount, s.effectChannels));
  }
  if (s.frameTracks == 0) {
    Line("Frames", "none");
  } else {
    Line("Frames", fmt::format("{}{}", s.timelineFrames, Step(s.stepMs)));
    Line("Level blocks", fmt::format("{} ({} frame track(s), one block per track and frame)",
                                     s.levelBlocks, s.frameTracks));
  }
  std::string channels;
  for (const auto& [family, count] : s.addressesPerFamily) {
    channels += (channels.empty() ? "" : ", ") + FamilyName(family) + " " + std::to_string(count);
  }
  Line("Channels", channels.empty() ? "none" : channels);
  if (!s.dmxUniverses.empty()) {
    Line("Universes", fmt::format("{} to {} ({})", *s.dmxUniverses.begin(),
                                  *s.dmxUniverses.rbegin(), s.dmxUniverses.size()));
  }
}

void PrintMetadata(const CompiledSequence& head) {
  Line("Media", head.media.empty() ? "none" : head.media);
  Line("Shell command", head.shellCommand.empty() ? "none" : head.shellCommand);
  Line("Subsequences", head.subsequences.empty() ? "none" : "");
  for (const auto& sub : head.subsequences) {
    std::cout << "  " << sub.file << " at " << sub.offsetMs << " ms\n";
  }
}

std::string CompressionText(const FseqFile& f) {
  switch (f.CompressionType()) {
    case FseqFile::Compression::Zstd:
      return fmt::format("zstd-compressed in {} block(s)", f.BlockCount());
    case FseqFile::Compression::Zlib:
      return fmt::format("zlib-compressed in {} block(s)", f.BlockCount());
    default:
      return "uncompressed";
  }
}

// Printable header payloads as text, others as their size.
std::string HeaderText(const FseqFile::VariableHeader& h) {
  std::string text = h.payload;
  while (!text.empty() && text.back() == '\0') text.pop_back();
  bool printable = !text.empty() && std::all_of(text.begin(), text.end(), [](char c) {
    return static_cast<unsigned char>(c) >= 0x20;
  });
  return printable ? h.code + " = " + text : fmt::format("{} ({} bytes)", h.code, h.payload.size());
}

void InspectFseq(const FseqStreamedSequence& stream) {
  const FseqFile& f = stream.File();
  Line("Format", fmt::format("{} {}.{}, {}", f.IsEffectSequence() ? "ESEQ" : "FSEQ",
                             f.MajorVersion(), f.MinorVersion(), CompressionText(f)));
  Line("Length", Duration(static_cast<int64_t>(f.DurationMs())));
  Line("Frames", fmt::format("{}{}", f.FrameCount(), Step(static_cast<int32_t>(f.StepMs()))));
  SequenceSummary s = Summarize(stream.Head(), stream.Groups());
  Line("Level blocks",
       fmt::format("{} ({} universe piece(s) per frame)", s.levelBlocks, s.frameTracks));
  Line("Channels", fmt::format("{} stored per frame", f.ChannelCount()));
  bool sparse = !(f.Ranges().size() == 1 && f.Ranges()[0].start == 0 &&
                  f.Ranges()[0].count == f.ChannelCount());
  std::string ranges;
  for (const auto& r : f.Ranges()) {
    ranges += fmt::format("{}{}-{} ({})", ranges.empty() ? "" : ", ", r.start + 1,
                          r.start + r.count, r.count);
  }
  Line("Sparse ranges", sparse ? ranges : "none");
  if (!s.dmxUniverses.empty()) {
    Line("Universes", fmt::format("{} to {} ({})", *s.dmxUniverses.begin(),
                                  *s.dmxUniverses.rbegin(), s.dmxUniverses.size()));
  }
  Line("Media", f.MediaFilename().empty() ? "none" : f.MediaFilename());
  Line("Producer", f.Producer().empty() ? "not named" : f.Producer());
  std::string headers;
  for (const auto& h : f.VariableHeaders())
    headers += (headers.empty() ? "" : "; ") + HeaderText(h);
  Line("Headers", headers.empty() ? "none" : headers);
  Line("Export", "not needed (FSEQ plays directly)");
}

void InspectExport(const CompressedSequenceReader& reader) {
  const CompiledSequence& head = reader.Head();
  Line("Format", "compressed export (tcs), version 2");
  Line("Length", Duration(head.lengthMs));
  PrintCounts(Summarize(head, reader.Groups()), true);
  PrintMetadata(head);
  Line("Export", "this is one (source hash " + ContentHashText(head.sourceHash) + ")");
}

void InspectPlain(const FileSequenceLibrary& library, const std::string& path) {
  auto content = library.LoadContent(path);
  Line("File", path);
  const CompiledSequence& compiled = *content->compiled;
  Line("Format", "plain sequence (JSON)");
  Line("Length", Duration(compiled.lengthMs));
  PrintCounts(Summarize(compiled, GroupTracks(compiled.tracks)), true);
  PrintMetadata(compiled);
  std::string exportPath = path + "." + kCompressedExtension;
  if (content->hasBeenExported()) {
    Line("Export", "current (" + exportPath + ")");
  } else if (LocalFileSystem()->Stat(exportPath).IsFile()) {
    Line("Export", "out of date (" + exportPath + ")");
  } else {
    Line("Export", "none");
  }
}

}  // namespace

void Inspect(const SequenceOptions& o) {
  auto library = MakeSequenceLibrary(o);
  if (library->FormatOf(o.file) == "plain") {
    InspectPlain(*library, o.file);
    return;
  }
  // Opened before anything is printed, so a damaged header gives one line.
  auto stream = library->OpenStreamed(o.file);
  Line("File", o.file);
  if (auto* fseq = dynamic_cast<FseqStreamedSequence*>(stream.get())) {
    InspectFseq(*fseq);
  } else {
    InspectExport(dynamic_cast<CompressedSequenceReader&>(*stream));
  }
}

}  // namespace tav::showctl
