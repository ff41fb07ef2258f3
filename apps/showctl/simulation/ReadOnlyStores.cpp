#include "ReadOnlyStores.h"

#include "suite/seqlib/SeqErrors.h"
#include "support/Error.h"

namespace tav::simulation {
namespace {

constexpr const char* kRefusal = ": a simulation writes no files";

}  // namespace

void ReadOnlyFileSystem::WriteAll(const std::string& path, std::string_view) {
  throw seqerrors::FileAccess("FileSystem.WriteAll", path + kRefusal);
}

void ReadOnlyFileSystem::WriteAll(const std::string& path, std::string_view,
                                  const std::function<void()>&) {
  throw seqerrors::FileAccess("FileSystem.WriteAll", path + kRefusal);
}

std::unique_ptr<WritableFile> ReadOnlyFileSystem::OpenForWrite(const std::string& path) {
  throw seqerrors::FileAccess("FileSystem.OpenForWrite", path + kRefusal);
}

std::optional<std::string> SnapshotTextFiles::ReadText(const std::string& path) {
  auto found = m_read.find(path);
  if (found != m_read.end()) return found->second;
  std::optional<std::string> text = m_files.ReadText(path);
  m_read.emplace(path, text);
  return text;
}

void SnapshotTextFiles::WriteText(const std::string& path, std::string_view) {
  throw seqerrors::FileAccess("TextFileStore.WriteText", path + kRefusal);
}

void ExportSkippingLibrary::WriteCompressed(const Sequence&, const std::string& path) {
  if (m_onExport) m_onExport(path);
}

}  // namespace tav::simulation
