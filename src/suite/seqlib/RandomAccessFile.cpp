#include "suite/seqlib/RandomAccessFile.h"

#include <cstring>

#include "suite/seqlib/SeqErrors.h"

namespace tav {

void ReadExactly(const RandomAccessFile& file, uint64_t offset, void* buffer, size_t count,
                 const char* source, const std::string& what) {
  if (count == 0) return;
  size_t got = file.ReadAt(offset, buffer, count);
  if (got != count) {
    throw seqerrors::PastEndOfFile(source, file.Name() + ": " + what + " needs " +
                                               std::to_string(count) + " bytes at offset " +
                                               std::to_string(offset) + ", the file has " +
                                               std::to_string(file.Size()));
  }
}

namespace {

size_t CopyOut(std::string_view bytes, uint64_t offset, void* buffer, size_t count) {
  if (offset >= bytes.size()) return 0;
  size_t n = std::min<uint64_t>(count, bytes.size() - offset);
  std::memcpy(buffer, bytes.data() + offset, n);
  return n;
}

}  // namespace

size_t MemoryFile::ReadAt(uint64_t offset, void* buffer, size_t count) const {
  return CopyOut(m_bytes, offset, buffer, count);
}

size_t MemoryView::ReadAt(uint64_t offset, void* buffer, size_t count) const {
  return CopyOut(m_bytes, offset, buffer, count);
}

}  // namespace tav
