// showctl sequence: look inside a sequence file, check every byte of it,
// print its levels at a moment, convert between the formats the player
// plays, and play one through the lighting outputs. The format of a file is judged by its content;
// the format written is chosen by the output name (".tcs" for a compressed export, anything else
// for the plain JSON format) unless --to says.

#include <fmt/format.h>

#include "CommandRegistry.h"
#include "SequenceCommands.h"
#include "SequencePlay.h"
#include "UserData.h"
#include "platform/LocalFileSystem.h"
#include "platform/SystemClock.h"

namespace tav::showctl {

std::shared_ptr<FileSequenceLibrary> MakeSequenceLibrary(const SequenceOptions& o) {
  auto fs = LocalFileSystem();
  PathResolver::FolderLookup folders = PathResolver::DefaultFolders(UserDataFolder());
  if (!o.folder.empty()) {
    std::string folder = o.folder;
    folders = [folder](int32_t) { return folder; };
  }
  auto resolver = std::make_shared<PathResolver>(fs, folders);
  return std::make_shared<FileSequenceLibrary>(std::make_shared<SystemClock>(), fs, resolver);
}

std::string ClockTime(int64_t ms) {
  return fmt::format("{}:{:02}.{:03}", ms / 60000, ms / 1000 % 60, ms % 1000);
}

std::string Duration(int64_t ms) {
  return fmt::format("{} ({} ms)", ClockTime(ms), ms);
}

namespace {

void Register(CLI::App& app) {
  auto o = std::make_shared<SequenceOptions>();
  auto* group =
      app.add_subcommand("sequence",
                         "Inspect and check sequence files, print their levels at a moment, and "
                         "convert between their formats");
  group->require_subcommand(1);
  group->add_option(
      "--folder", o->folder,
      "Folder to look for subsequences in (default: Sequences/ under the user data folder)");

  auto* inspect = group->add_subcommand(
      "inspect",
      "Show a sequence's format, length, frames, channels per family, media, shell command, "
      "subsequences and whether its compressed export is current; for FSEQ also its version, "
      "compression, step, sparse ranges and headers. Reads the headers only");
  inspect->add_option("FILE", o->file, "Plain sequence, FSEQ file or compressed export")
      ->required();
  inspect->callback([o] { Inspect(*o); });

  auto* verify = group->add_subcommand(
      "verify",
      "Read every block and frame of a sequence and name the first damage (exit status 1 "
      "when there is one)");
  verify->add_option("FILE", o->file, "Plain sequence, FSEQ file or compressed export")->required();
  verify->add_flag("--progress", o->progress,
                   "Report progress on standard error also when it is not a terminal");
  verify->callback([o] { Verify(*o); });

  auto* levels = group->add_subcommand(
      "levels",
      "Print the levels a sequence gives at a moment, as the player starts there: the effect "
      "on each effect channel (percent) and the frame levels of DMX slots and TAV circuits "
      "(0-255)");
  levels->add_option("FILE", o->file, "Plain sequence, FSEQ file or compressed export")->required();
  auto* at = levels->add_option(
      "--at", o->at,
      "The moment: seconds (90, 90.5), minutes and seconds (1:30, 1:30.250), hours too "
      "(1:02:03.5), or milliseconds (1500ms); default 0");
  auto* frame = levels->add_option(
      "--frame", o->frame,
      "The moment frame N of the timeline is due (0 is the first; inspect tells how many)");
  at->excludes(frame);
  auto* channels = levels->add_option(
      "--channels", o->channels,
      "Only these DMX channels, counted from 1 across universes of 512 as FSEQ counts them "
      "(universe 2 slot 1 is channel 513): 1-512, 1-10,600-700, 42");
  auto* universe = levels->add_option("--universe", o->universe, "Only DMX universe U");
  channels->excludes(universe);
  levels->add_flag("--json", o->json, "Print JSON for scripts instead of a table");
  levels->callback([o] { Levels(*o); });

  auto* convert = group->add_subcommand(
      "convert",
      "Convert a sequence: plain, FSEQ or an export to a compressed export (.tcs) or to the "
      "plain format. FSEQ files and exports are converted a block of frames at a time");
  convert->add_option("IN", o->file, "Plain sequence, FSEQ file or compressed export")->required();
  convert
      ->add_option("OUT", o->output,
                   "File to write; a name ending in .tcs gets a compressed export")
      ->required();
  convert->add_option("--to", o->to,
                      "Output format, \"plain\" or \"tcs\" (default: by OUT's name)");
  convert->callback([o] { Convert(*o); });

  AddSequencePlayCommand(group, &o->folder);
}

}  // namespace

static CommandGroup reg{"sequence", Register};

}  // namespace tav::showctl
