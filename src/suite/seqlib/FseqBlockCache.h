#pragma once
// Decoded compression blocks of FSEQ files, kept for a reader that opens the
// same file again soon. A simulated evening plays a looping sequence some
// hundreds of times in a few seconds, and without this would spend most of
// them inflating the same blocks again. The player itself does not use it:
// it keeps one block per playing sequence, for memory's sake.
//
// A block is known by the file's name and size and its offset in the file,
// so a file replaced while the cache lives could be served stale: only
// programs that read files they do not write (the simulation) should share
// one. Holds at most `limitBytes` of blocks, dropping the least recently
// used first. Single-threaded.

#include <cstddef>
#include <cstdint>
#include <list>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

namespace tav {

class FseqBlockCache {
 public:
  using Block = std::shared_ptr<const std::vector<uint8_t>>;

  explicit FseqBlockCache(size_t limitBytes) : m_limit(limitBytes) {}

  // The block, or nullptr when it is not held.
  Block Find(const std::string& file, uint64_t fileSize, uint64_t offset);
  // Keeps `bytes` (unless larger than the whole limit) and returns them.
  Block Keep(const std::string& file, uint64_t fileSize, uint64_t offset,
             std::vector<uint8_t> bytes);

  size_t BytesHeld() const { return m_held; }

 private:
  struct Entry {
    std::string key;
    Block block;
  };
  static std::string KeyOf(const std::string& file, uint64_t fileSize, uint64_t offset);

  size_t m_limit;
  size_t m_held = 0;
  std::list<Entry> m_recent;  // most recently used first
  std::unordered_map<std::string, std::list<Entry>::iterator> m_index;
};

}  // namespace tav
