#include "suite/seqlib/PathResolver.h"

#include <algorithm>
#include <cctype>

#include "suite/seqlib/CompressedSequence.h"
#include "support/Error.h"

namespace tav {

namespace {

std::string WithSeparator(std::string folder) {
  if (folder.empty()) return folder;
  if (folder.back() == '\\') folder.back() = '/';
  if (folder.back() != '/') folder.push_back('/');
  return folder;
}

std::string Lower(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(),
                 [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
  return text;
}

}  // namespace

PathResolver::FolderLookup PathResolver::DefaultFolders(const std::string& userDataPath) {
  std::string base = WithSeparator(userDataPath);
  return [base](int32_t kind) { return base + (kind == kKindMedia ? "Media/" : "Sequences/"); };
}

PathResolver::PathResolver(std::shared_ptr<const FileSystem> fileSystem, FolderLookup folders)
    : m_fileSystem(std::move(fileSystem)), m_folders(std::move(folders)) {
  if (!m_fileSystem || !m_folders) throw errors::ObjectNotSet("PathResolver");
}

std::string PathResolver::Folder(int32_t kind) const {
  return WithSeparator(m_folders(kind));
}

std::string PathResolver::BaseName(const std::string& name) {
  auto cut = name.find_last_of("/\\");
  return cut == std::string::npos ? name : name.substr(cut + 1);
}

bool PathResolver::IsAbsolute(const std::string& name) {
  return !name.empty() && name[0] == '/';
}

bool PathResolver::IsForeignAbsolute(const std::string& name) {
  bool drive = name.size() >= 3 && std::isalpha(static_cast<unsigned char>(name[0])) &&
               name[1] == ':' && (name[2] == '\\' || name[2] == '/');
  return drive || name.rfind("\\\\", 0) == 0;
}

bool PathResolver::Present(const std::string& path, int32_t kind) const {
  if (m_fileSystem->Stat(path).IsFile()) return true;
  return kind == kKindSequence && m_fileSystem->Stat(path + "." + kCompressedExtension).IsFile();
}

const PathResolver::Listing& PathResolver::ListingOf(const std::string& folder) const {
  FileStatus status = m_fileSystem->Stat(folder);
  Listing& listing = m_listings[folder];
  bool exists = status.exists && status.isDirectory;
  if (listing.listed && listing.exists == exists && listing.modifiedNs == status.modifiedNs) {
    return listing;
  }
  listing = Listing{true, exists, status.modifiedNs, {}};
  if (!exists) return listing;
  for (auto& entry : m_fileSystem->ListDirectory(folder)) {
    listing.byLowerName[Lower(entry)].push_back(std::move(entry));
  }
  return listing;
}

std::string PathResolver::FindIgnoringCase(const std::string& folder, const std::string& base,
                                           int32_t kind) const {
  const Listing& listing = ListingOf(folder);
  auto it = listing.byLowerName.find(Lower(base));
  if (it == listing.byLowerName.end()) return "";
  // The listing may be older than the folder's content: check each name.
  for (const auto& entry : it->second) {
    if (Present(folder + entry, kind)) return folder + entry;
  }
  return "";
}

std::string PathResolver::ResolvePath(const std::string& name, int32_t kind) const {
  if (name.empty()) return "";
  if (IsAbsolute(name) && Present(name, kind)) return name;
  std::string folder = Folder(kind);
  std::string relative;
  if (!IsAbsolute(name) && !IsForeignAbsolute(name)) {
    relative = name;
    std::replace(relative.begin(), relative.end(), '\\', '/');
    if (Present(folder + relative, kind)) return folder + relative;
  }
  std::string base = BaseName(name);
  if (!base.empty()) {
    if (Present(folder + base, kind)) return folder + base;
    std::string found = FindIgnoringCase(folder, base, kind);
    if (!found.empty()) return found;
  }
  if (IsAbsolute(name)) return name;
  return folder + (relative.empty() ? base : relative);
}

}  // namespace tav
