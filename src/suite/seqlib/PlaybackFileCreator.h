#pragma once
// Finds a playable file for a sequence name that does not exist as given:
// the same base name in the sequence folder (a name from another machine),
// or the same name in another format this library plays (a show that names
// "carol.fseq" while only "carol.tseq" or its export is at hand). The
// result says what was chosen, with errors and warnings for the log.
// Shares the file system and the resolver.

#include <cstdint>
#include <memory>
#include <string>

#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/PathResolver.h"

namespace tav {

struct PlaybackFileResult {
  int32_t errorCount = 0;
  std::string errorText;
  // True when a stand-in was chosen for the name asked for.
  bool created = false;
  int32_t warningCount = 0;
  std::string warningText;
  std::string informationMessage;
  std::string playbackFilename;
};

class PlaybackFileCreator {
 public:
  // The extensions of the formats looked for, in order of preference.
  static constexpr const char* kKnownExtensions[] = {"tseq", "json", "fseq", "eseq"};

  PlaybackFileCreator(std::shared_ptr<const FileSystem> fileSystem,
                      std::shared_ptr<const PathResolver> resolver);

  PlaybackFileResult PreparePlaybackFile(const std::string& szFilename) const;

 private:
  std::shared_ptr<const FileSystem> m_fileSystem;
  std::shared_ptr<const PathResolver> m_resolver;
};

}  // namespace tav
