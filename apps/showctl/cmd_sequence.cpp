// showctl sequence: look inside a sequence file and convert between the
// formats the player plays. The format of a file is judged by its content;
// the format written is chosen by the output name (".tcs" for a compressed
// export, anything else for the plain JSON format) unless --to says.

#include <fmt/format.h>

#include "UserData.h"

#include <cctype>
#include <iostream>
#include <map>
#include <set>

#include "CommandRegistry.h"
#include "SequencePlay.h"
#include "platform/LocalFileSystem.h"
#include "platform/PlatformPaths.h"
#include "platform/SystemClock.h"
#include "suite/seqlib/CompressedSequence.h"
#include "suite/seqlib/ContentHash.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/PlainSequence.h"
#include "suite/seqlib/PlayEvent.h"

namespace tav::showctl {
namespace {

struct SequenceOptions {
  std::string file;
  std::string output;
  std::string to;
  std::string folder;
};

std::shared_ptr<FileSequenceLibrary> MakeLibrary(const SequenceOptions& o) {
  auto fs = LocalFileSystem();
  PathResolver::FolderLookup folders = PathResolver::DefaultFolders(UserDataFolder());
  if (!o.folder.empty()) {
    std::string folder = o.folder;
    folders = [folder](int32_t) { return folder; };
  }
  auto resolver = std::make_shared<PathResolver>(fs, folders);
  return std::make_shared<FileSequenceLibrary>(std::make_shared<SystemClock>(), fs, resolver);
}

std::string Duration(int64_t ms) {
  return fmt::format("{}:{:02}.{:03} ({} ms)", ms / 60000, ms / 1000 % 60, ms % 1000, ms);
}

// Distinct addresses per family, counting every slot or circuit of a track.
std::map<int32_t, size_t> ChannelsPerFamily(const CompiledSequence& compiled) {
  std::map<int32_t, std::set<ChannelAddress>> addresses;
  for (const auto& channel : compiled.channels)
    addresses[channel.address.family].insert(channel.address);
  for (const auto& track : compiled.tracks) {
    for (int32_t k = 0; k < track.count; ++k) {
      addresses[track.family].insert(
          {track.family, track.network, track.unit, track.firstAddress + k});
    }
  }
  std::map<int32_t, size_t> counts;
  for (const auto& [family, set] : addresses) counts[family] = set.size();
  return counts;
}

void Inspect(const SequenceOptions& o) {
  auto library = MakeLibrary(o);
  auto content = library->LoadContent(o.file);
  const SequenceInfo& info = content->info;
  std::cout << "File:          " << info.path << "\n";
  std::cout << "Format:        "
            << (info.format == "plain"  ? "plain sequence (JSON)"
                : info.format == "fseq" ? "FSEQ"
                                        : "compressed export (tcs)")
            << "\n";
  std::cout << "Length:        " << Duration(info.lengthMs) << "\n";
  if (content->compiled) {
    std::cout << "Effects:       " << info.effectCount << "\n";
    std::cout << "Frames:        " << info.frameCount << " (over "
              << content->compiled->tracks.size() << " tracks)\n";
    std::cout << "Channels:      ";
    auto counts = ChannelsPerFamily(*content->compiled);
    if (counts.empty()) std::cout << "none";
    bool first = true;
    for (const auto& [family, count] : counts) {
      std::cout << (first ? "" : ", ") << FamilyName(family) << " " << count;
      first = false;
    }
    std::cout << "\n";
  } else {
    std::cout << "Frames:        " << info.frameCount << "\n";
    std::cout << "Channels:      DMX " << info.channelCount << "\n";
    auto stream = content->openStream();
    stream->Seek(0);
    std::set<int32_t> universes;
    PlayEvent event;
    while (stream->NextTime() == 0) {
      stream->Next(event);
      universes.insert(event.lNetwork);
    }
    if (!universes.empty()) {
      std::cout << "Universes:     " << *universes.begin() << " to " << *universes.rbegin() << " ("
                << universes.size() << ")\n";
    }
  }
  std::cout << "Media:         " << (info.media.empty() ? "none" : info.media) << "\n";
  std::cout << "Shell command: " << (info.shellCommand.empty() ? "none" : info.shellCommand)
            << "\n";
  std::cout << "Subsequences:  " << (info.subsequences.empty() ? "none" : "") << "\n";
  for (const auto& sub : info.subsequences)
    std::cout << "  " << sub.file << " at " << sub.offsetMs << " ms\n";
  std::cout << "Export:        ";
  if (info.format == "plain") {
    std::string exportPath = info.path + "." + kCompressedExtension;
    if (content->hasBeenExported()) {
      std::cout << "current (" << exportPath << ")\n";
    } else if (LocalFileSystem()->Stat(exportPath).IsFile()) {
      std::cout << "out of date (" << exportPath << ")\n";
    } else {
      std::cout << "none\n";
    }
  } else if (info.format == "fseq") {
    std::cout << "not needed (FSEQ plays directly)\n";
  } else {
    std::cout << "this is one (source hash " << ContentHashText(info.sourceHash) << ")\n";
  }
}

bool EndsWithIgnoringCase(const std::string& text, const std::string& suffix) {
  if (text.size() < suffix.size()) return false;
  for (size_t i = 0; i < suffix.size(); ++i) {
    if (std::tolower(static_cast<unsigned char>(text[text.size() - suffix.size() + i])) !=
        suffix[i])
      return false;
  }
  return true;
}

void Convert(const SequenceOptions& o) {
  std::string to = o.to;
  if (to.empty())
    to = EndsWithIgnoringCase(o.output, std::string(".") + kCompressedExtension) ? "tcs" : "plain";
  if (to != "tcs" && to != "plain")
    throw CommandFailed("--to must be \"plain\" or \"tcs\", not \"" + to + "\"");
  if (o.output == o.file) throw CommandFailed("the output must not be the input file");
  auto library = MakeLibrary(o);
  auto compiled = library->LoadCompiled(o.file);
  auto fs = LocalFileSystem();
  if (to == "tcs") {
    fs->WriteAll(o.output, WriteCompressedSequence(*compiled));
  } else {
    SequenceData data = Decompile(*compiled);
    fs->WriteAll(o.output, WritePlainSequence(data));
    if (!compiled->subsequences.empty()) {
      std::cerr << "showctl: note: the subsequences of " << o.file << " are merged into "
                << o.output << "\n";
    }
  }
  std::cout << "Wrote " << o.output << " ("
            << (to == "tcs" ? "compressed export" : "plain sequence") << ", "
            << compiled->effects.size() << " effects, " << compiled->FrameCount() << " frames)\n";
}

}  // namespace

static CommandGroup reg{
    "sequence", [](CLI::App& app) {
      auto options = std::make_shared<SequenceOptions>();
      auto* group = app.add_subcommand("sequence", "Inspect, convert and play sequence files");
      group->require_subcommand(1);
      group->add_option(
          "--folder", options->folder,
          "Folder to look for subsequences in (default: Sequences/ under the user data folder)");

      auto* inspect = group->add_subcommand("inspect",
                                            "Show a sequence's format, length, channels per "
                                            "family, media, shell command, subsequences "
                                            "and whether its compressed export is current");
      inspect->add_option("FILE", options->file, "Plain sequence, FSEQ file or compressed export")
          ->required();
      inspect->callback([options] { Inspect(*options); });

      auto* convert = group->add_subcommand("convert",
                                            "Convert a sequence: plain or FSEQ to a compressed "
                                            "export (.tcs), FSEQ or an export to the "
                                            "plain format");
      convert->add_option("IN", options->file, "Plain sequence, FSEQ file or compressed export")
          ->required();
      convert
          ->add_option("OUT", options->output,
                       "File to write; a name ending in .tcs gets a compressed export")
          ->required();
      convert->add_option("--to", options->to,
                          "Output format, \"plain\" or \"tcs\" (default: by OUT's name)");
      convert->callback([options] { Convert(*options); });

      AddSequencePlayCommand(group, &options->folder);
    }};

}  // namespace tav::showctl
