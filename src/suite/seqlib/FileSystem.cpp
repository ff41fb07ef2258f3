#include "suite/seqlib/FileSystem.h"

#include "support/Error.h"

namespace tav {

void MemoryWritableFile::WriteAt(uint64_t offset, std::string_view bytes) {
  if (offset > m_bytes.size() || bytes.size() > m_bytes.size() - offset) {
    throw errors::InvalidProcedureCall("MemoryWritableFile.WriteAt");
  }
  m_bytes.replace(static_cast<size_t>(offset), bytes.size(), bytes);
}

// The port's own defaults live here, with the port, so that its vtable does
// too (the first of them decides where the compiler puts it).
std::string FileSystem::ReadAll(const std::string& path) const {
  auto file = OpenForRead(path);
  std::string bytes(file->Size(), '\0');
  ReadExactly(*file, 0, bytes.data(), bytes.size(), "FileSystem.ReadAll", "the whole file");
  return bytes;
}

std::unique_ptr<WritableFile> FileSystem::OpenForWrite(const std::string& path) {
  return std::make_unique<MemoryWritableFile>(
      [this, path](std::string_view bytes) { WriteAll(path, bytes); });
}

}  // namespace tav
