#pragma once
// Turns a sequence or media name into a full path. Relative names are
// looked up in the folder for their kind (from the settings, by default
// under UserDataPath). A name written on another machine (a Windows path
// such as "C:\Shows\a.fseq", say) that does not exist as given is looked
// for by its base name in that folder, also without regard to case.
// A sequence counts as present when its compressed export is.
//
// Asks for the folders at each use (the settings may change); shares the
// file system. The search without regard to case works on a listing of the
// folder kept from one search to the next and taken again when the folder's
// modification time changes, so a show naming many missing files does not
// list a large folder once per name. (A file added within the file system's
// timestamp granularity of the listing is seen at the folder's next change;
// exact names are always looked up afresh.) Single-threaded.

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "suite/seqlib/FileSystem.h"

namespace tav {

class PathResolver {
 public:
  static constexpr int32_t kKindSequence = 2;
  static constexpr int32_t kKindMedia = 3;

  // The folder for a kind, ending with a separator or not.
  using FolderLookup = std::function<std::string(int32_t kind)>;
  // The default folders: "Sequences/" and "Media/" under UserDataPath.
  static FolderLookup DefaultFolders(const std::string& userDataPath);

  PathResolver(std::shared_ptr<const FileSystem> fileSystem, FolderLookup folders);

  // "" for an empty name. When nothing is found, the path where the name
  // would be (the folder and the name) so the caller's error names it.
  std::string ResolvePath(const std::string& name, int32_t kind) const;
  std::string Folder(int32_t kind) const;

  // The part after the last '/' or '\'.
  static std::string BaseName(const std::string& name);
  static bool IsAbsolute(const std::string& name);
  static bool IsForeignAbsolute(const std::string& name);

 private:
  // A folder's entries by their lower-case names, as listed when the folder
  // had the modification time noted.
  struct Listing {
    bool listed = false;
    bool exists = false;
    int64_t modifiedNs = 0;
    std::map<std::string, std::vector<std::string>> byLowerName;
  };

  bool Present(const std::string& path, int32_t kind) const;
  std::string FindIgnoringCase(const std::string& folder, const std::string& base,
                               int32_t kind) const;
  const Listing& ListingOf(const std::string& folder) const;

  std::shared_ptr<const FileSystem> m_fileSystem;
  FolderLookup m_folders;
  mutable std::map<std::string, Listing> m_listings;
};

}  // namespace tav
