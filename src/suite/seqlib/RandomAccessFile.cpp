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

size_t MemoryFile::ReadAt(uint64_t offset, void* buffer, size_t count) const {
  if (offset >= m_bytes.size()) return 0;
  size_t n = std::min<uint64_t>(count, m_bytes.size() - offset);
  std::memcpy(buffer, m_bytes.data() + offset, n);
  return n;
}

}  // namespace tav
