#pragma once
// A file read at arbitrary offsets, so readers of large files (FSEQ) fetch
// only the part they need. MemoryFile serves bytes already in memory: the
// fuzz targets, tests that build damaged files, and small files read whole;
// MemoryView serves bytes someone else holds.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace tav {

class RandomAccessFile {
 public:
  virtual ~RandomAccessFile() = default;
  virtual uint64_t Size() const = 0;
  // Reads up to `count` bytes at `offset`; returns how many were read (fewer
  // only at the end of the file). Throws tav::Error when the read fails.
  virtual size_t ReadAt(uint64_t offset, void* buffer, size_t count) const = 0;
  // The name used in error messages.
  virtual const std::string& Name() const = 0;
};

// Reads exactly `count` bytes or throws the past-end-of-file error naming
// `what` and the offset.
void ReadExactly(const RandomAccessFile& file, uint64_t offset, void* buffer, size_t count,
                 const char* source, const std::string& what);

class MemoryFile : public RandomAccessFile {
 public:
  explicit MemoryFile(std::string bytes, std::string name = "(memory)")
      : m_bytes(std::move(bytes)), m_name(std::move(name)) {}
  uint64_t Size() const override { return m_bytes.size(); }
  size_t ReadAt(uint64_t offset, void* buffer, size_t count) const override;
  const std::string& Name() const override { return m_name; }

 private:
  std::string m_bytes;
  std::string m_name;
};

// Bytes owned elsewhere, which must outlive the view.
class MemoryView : public RandomAccessFile {
 public:
  MemoryView(std::string_view bytes, std::string name) : m_bytes(bytes), m_name(std::move(name)) {}
  uint64_t Size() const override { return m_bytes.size(); }
  size_t ReadAt(uint64_t offset, void* buffer, size_t count) const override;
  const std::string& Name() const override { return m_name; }

 private:
  std::string_view m_bytes;
  std::string m_name;
};

}  // namespace tav
