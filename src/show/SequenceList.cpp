#include "show/SequenceList.h"

#include <algorithm>

#include "support/Error.h"

namespace tav {

const SequenceRef& SequenceList::Item(int32_t index) const {
  if (index < 1 || index > Count()) throw errors::SubscriptOutOfRange("SequenceList.Item");
  return m_items[static_cast<size_t>(index - 1)];
}

void SequenceList::Add(SequenceRef item) {
  if (Contains(item.get())) throw errors::KeyAlreadyAssociated("SequenceList.Add");
  m_items.push_back(std::move(item));
}

void SequenceList::Remove(int32_t index) {
  if (index < 1 || index > Count()) throw errors::SubscriptOutOfRange("SequenceList.Remove");
  m_items.erase(m_items.begin() + (index - 1));
}

bool SequenceList::Remove(const SequencePlayInfo* item) {
  auto it = std::find_if(m_items.begin(), m_items.end(),
                         [item](const SequenceRef& held) { return held.get() == item; });
  if (it == m_items.end()) return false;
  m_items.erase(it);
  return true;
}

bool SequenceList::Contains(const SequencePlayInfo* item) const {
  return std::any_of(m_items.begin(), m_items.end(),
                     [item](const SequenceRef& held) { return held.get() == item; });
}

}  // namespace tav
