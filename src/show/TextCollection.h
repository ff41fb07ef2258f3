#pragma once
// An ordered collection of texts addressed from 1, the way a playlist's
// sequence names are numbered in show files, the engine and the tray. Callers
// change a playlist's names through it directly. Indexes outside 1..Count fail
// with the subscript error (9) rather than being clamped, so that an
// off-by-one in a caller shows up at once.

#include <cstdint>
#include <string>
#include <vector>

namespace tav {

class TextCollection {
 public:
  int32_t Count() const { return static_cast<int32_t>(m_items.size()); }
  // 1-based.
  const std::string& Item(int32_t index) const;
  // Appends at the end.
  void Add(std::string item);
  // Inserts so that the new item gets the 1-based index `before`; 1..Count.
  void Insert(int32_t before, std::string item);
  // Removes the item at a 1-based index; later items move down.
  void Remove(int32_t index);
  void Clear() { m_items.clear(); }

  // In order, for range-for.
  std::vector<std::string>::const_iterator begin() const { return m_items.begin(); }
  std::vector<std::string>::const_iterator end() const { return m_items.end(); }

 private:
  size_t Offset(int32_t index, const char* source) const;

  std::vector<std::string> m_items;
};

}  // namespace tav
