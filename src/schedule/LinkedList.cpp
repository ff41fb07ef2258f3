#include "schedule/LinkedList.h"

#include "support/Error.h"

namespace tav {

std::shared_ptr<Node> LinkedList::InsertAfter(const std::shared_ptr<Node>& Predecessor,
                                              std::shared_ptr<ShowEvent> Element) {
  if (!Predecessor) throw errors::ObjectNotSet("LinkedList.InsertAfter");
  auto node = std::make_shared<Node>();
  node->SetObj(std::move(Element));
  node->SetPreviousNode(Predecessor);
  node->SetNextNode(Predecessor->NextNode());
  m_nodes.push_back(node);
  if (auto next = Predecessor->NextNode()) next->SetPreviousNode(node);
  Predecessor->SetNextNode(node);
  ++m_count;
  if (Predecessor == m_lastNode) m_lastNode = node;
  return node;
}

std::shared_ptr<Node> LinkedList::InsertBefore(const std::shared_ptr<Node>& Successor,
                                               std::shared_ptr<ShowEvent> Element) {
  if (!Successor) throw errors::ObjectNotSet("LinkedList.InsertBefore");
  auto node = std::make_shared<Node>();
  node->SetObj(std::move(Element));
  node->SetNextNode(Successor);
  auto previous = Successor->PreviousNode();
  node->SetPreviousNode(previous);
  m_nodes.push_back(node);
  if (previous) previous->SetNextNode(node);
  Successor->SetPreviousNode(node);
  ++m_count;
  if (Successor == m_firstNode) m_firstNode = node;
  return node;
}

void LinkedList::DeleteNode(const std::shared_ptr<Node>& node) {
  if (!node) throw errors::ObjectNotSet("LinkedList.DeleteNode");
  if (m_count == 1) throw Error(1, "LinkedList.DeleteNode", "Can't delete only node");
  auto previous = node->PreviousNode();
  auto next = node->NextNode();
  if (!previous) {
    m_firstNode = next;
    if (next) next->SetPreviousNode(nullptr);
  } else if (!next) {
    m_lastNode = previous;
    previous->SetNextNode(nullptr);
  } else {
    previous->SetNextNode(next);
    next->SetPreviousNode(previous);
  }
  --m_count;
}

std::shared_ptr<LinkedList> NewSingleNodeList(std::shared_ptr<ShowEvent> Element) {
  auto list = std::make_shared<LinkedList>();
  auto node = std::make_shared<Node>();
  node->SetObj(std::move(Element));
  list->Nodes().push_back(node);
  list->SetFirstNode(node);
  list->SetLastNode(node);
  list->SetCount(1);
  return list;
}

}  // namespace tav
