#include "suite/seqlib/PlaybackFileCreator.h"

#include <algorithm>
#include <cctype>

#include "suite/seqlib/CompressedSequence.h"
#include "support/Error.h"

namespace tav {

namespace {

std::string Lower(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(),
                 [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
  return text;
}

std::string Stem(const std::string& base) {
  std::string stem = base;
  std::string lower = Lower(stem);
  std::string suffix = std::string(".") + kCompressedExtension;
  if (lower.size() > suffix.size() && lower.ends_with(suffix))
    stem.resize(stem.size() - suffix.size());
  auto dot = stem.find_last_of('.');
  return dot == std::string::npos || dot == 0 ? stem : stem.substr(0, dot);
}

}  // namespace

PlaybackFileCreator::PlaybackFileCreator(std::shared_ptr<const FileSystem> fileSystem,
                                         std::shared_ptr<const PathResolver> resolver)
    : m_fileSystem(std::move(fileSystem)), m_resolver(std::move(resolver)) {
  if (!m_fileSystem || !m_resolver) throw errors::ObjectNotSet("PlaybackFileCreator");
}

PlaybackFileResult PlaybackFileCreator::PreparePlaybackFile(const std::string& szFilename) const {
  PlaybackFileResult result;
  if (szFilename.empty()) {
    result.errorCount = 1;
    result.errorText = "No sequence file name given";
    return result;
  }
  std::string resolved = m_resolver->ResolvePath(szFilename, PathResolver::kKindSequence);
  if (m_fileSystem->Stat(resolved).IsFile() ||
      m_fileSystem->Stat(resolved + "." + kCompressedExtension).IsFile()) {
    result.playbackFilename = resolved;
    if (resolved != szFilename) {
      result.created = true;
      result.informationMessage = "Playing " + resolved + " for " + szFilename;
    }
    return result;
  }

  // The same stem in another known format, in the sequence folder and in
  // the folder the name points to; plain files before their exports.
  std::string stem = Lower(Stem(PathResolver::BaseName(szFilename)));
  std::vector<std::string> folders = {m_resolver->Folder(PathResolver::kKindSequence)};
  auto slash = szFilename.find_last_of('/');
  if (PathResolver::IsAbsolute(szFilename) && slash != std::string::npos) {
    std::string own = szFilename.substr(0, slash + 1);
    if (own != folders[0]) folders.push_back(own);
  }
  std::vector<std::string> found;
  for (bool compressed : {false, true}) {
    for (const char* extension : kKnownExtensions) {
      for (const auto& folder : folders) {
        std::vector<std::string> entries = m_fileSystem->ListDirectory(folder);
        std::sort(entries.begin(), entries.end());
        for (const auto& entry : entries) {
          std::string wanted =
              stem + "." + extension + (compressed ? std::string(".") + kCompressedExtension : "");
          std::string path = folder + entry;
          if (Lower(entry) == wanted && m_fileSystem->Stat(path).IsFile() &&
              std::find(found.begin(), found.end(), path) == found.end()) {
            found.push_back(path);
          }
        }
      }
    }
  }
  if (found.empty()) {
    result.errorCount = 1;
    result.errorText = "No playable file found for " + szFilename + " (looked for " +
                       Stem(PathResolver::BaseName(szFilename)) + " in " + folders[0] + ")";
    return result;
  }
  result.created = true;
  result.playbackFilename = found.front();
  result.informationMessage = "Playing " + found.front() + " for " + szFilename;
  if (found.size() > 1) {
    result.warningCount = static_cast<int32_t>(found.size() - 1);
    result.warningText = "Other files could also stand in for " + szFilename + ":";
    for (size_t i = 1; i < found.size(); ++i) result.warningText += " " + found[i];
  }
  return result;
}

}  // namespace tav
