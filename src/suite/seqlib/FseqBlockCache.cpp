#include "suite/seqlib/FseqBlockCache.h"

namespace tav {

std::string FseqBlockCache::KeyOf(const std::string& file, uint64_t fileSize, uint64_t offset) {
  return std::to_string(fileSize) + ':' + std::to_string(offset) + ':' + file;
}

FseqBlockCache::Block FseqBlockCache::Find(const std::string& file, uint64_t fileSize,
                                           uint64_t offset) {
  auto it = m_index.find(KeyOf(file, fileSize, offset));
  if (it == m_index.end()) return nullptr;
  m_recent.splice(m_recent.begin(), m_recent, it->second);
  return it->second->block;
}

FseqBlockCache::Block FseqBlockCache::Keep(const std::string& file, uint64_t fileSize,
                                           uint64_t offset, std::vector<uint8_t> bytes) {
  auto block = std::make_shared<const std::vector<uint8_t>>(std::move(bytes));
  if (block->size() > m_limit) return block;
  std::string key = KeyOf(file, fileSize, offset);
  if (auto old = m_index.find(key); old != m_index.end()) {
    m_held -= old->second->block->size();
    m_recent.erase(old->second);
    m_index.erase(old);
  }
  while (!m_recent.empty() && m_held + block->size() > m_limit) {
    m_held -= m_recent.back().block->size();
    m_index.erase(m_recent.back().key);
    m_recent.pop_back();
  }
  m_recent.push_front({key, block});
  m_index.emplace(std::move(key), m_recent.begin());
  m_held += block->size();
  return block;
}

}  // namespace tav
