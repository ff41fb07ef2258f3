#include "suite/seqlib/FileSystem.h"

#include "support/Error.h"

namespace tav {

void MemoryWritableFile::WriteAt(uint64_t offset, std::string_view bytes) {
  if (offset > m_bytes.size() || bytes.size() > m_bytes.size() - offset) {
    throw errors::InvalidProcedureCall("MemoryWritableFile.WriteAt");
  }
  m_bytes.replace(static_cast<size_t>(offset), bytes.size(), bytes);
}

std::unique_ptr<WritableFile> FileSystem::OpenForWrite(const std::string& path) {
  return std::make_unique<MemoryWritableFile>(
      [this, path](std::string_view bytes) { WriteAll(path, bytes); });
}

}  // namespace tav
