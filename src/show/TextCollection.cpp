#include "show/TextCollection.h"

#include "support/Error.h"

namespace tav {

size_t TextCollection::Offset(int32_t index, const char* source) const {
  if (index < 1 || index > Count()) throw errors::SubscriptOutOfRange(source);
  return static_cast<size_t>(index - 1);
}

const std::string& TextCollection::Item(int32_t index) const {
  return m_items[Offset(index, "TextCollection.Item")];
}

void TextCollection::Add(std::string item) {
  m_items.push_back(std::move(item));
}

void TextCollection::Insert(int32_t before, std::string item) {
  size_t at = Offset(before, "TextCollection.Insert");
  m_items.insert(m_items.begin() + static_cast<std::ptrdiff_t>(at), std::move(item));
}

void TextCollection::Remove(int32_t index) {
  size_t at = Offset(index, "TextCollection.Remove");
  m_items.erase(m_items.begin() + static_cast<std::ptrdiff_t>(at));
}

}  // namespace tav
