#pragma once
// The doubly linked list in which a week schedule keeps its show events, in
// time order. Nodes are shared objects: a schedule hands them out (the node
// holding the event at a time) and takes them back to remove a show.
//
// Ownership: the list's Nodes collection holds every node ever inserted, also
// after DeleteNode, until the list itself goes; each node owns its successor
// and only observes its predecessor, so the links never form an ownership
// cycle. A node taken out of a list that is gone still reads its event but may
// have lost its neighbours.

#include <cstdint>
#include <memory>
#include <vector>

#include "schedule/ShowEvent.h"

namespace tav {

class Node {
 public:
  std::shared_ptr<Node> NextNode() const { return m_nextNode; }
  void SetNextNode(std::shared_ptr<Node> value) { m_nextNode = std::move(value); }
  std::shared_ptr<Node> PreviousNode() const { return m_previousNode.lock(); }
  void SetPreviousNode(const std::shared_ptr<Node>& value) { m_previousNode = value; }
  // The held object; in schedules always a show event.
  const std::shared_ptr<ShowEvent>& Obj() const { return m_obj; }
  void SetObj(std::shared_ptr<ShowEvent> value) { m_obj = std::move(value); }

 private:
  std::shared_ptr<Node> m_nextNode;
  std::weak_ptr<Node> m_previousNode;
  std::shared_ptr<ShowEvent> m_obj;
};

class LinkedList {
 public:
  const std::vector<std::shared_ptr<Node>>& Nodes() const { return m_nodes; }
  std::vector<std::shared_ptr<Node>>& Nodes() { return m_nodes; }
  const std::shared_ptr<Node>& FirstNode() const { return m_firstNode; }
  void SetFirstNode(std::shared_ptr<Node> value) { m_firstNode = std::move(value); }
  const std::shared_ptr<Node>& LastNode() const { return m_lastNode; }
  void SetLastNode(std::shared_ptr<Node> value) { m_lastNode = std::move(value); }
  int32_t Count() const { return m_count; }
  void SetCount(int32_t value) { m_count = value; }

  // Insert a new node holding Element next to a node of this list and return
  // it; the list's first and last node follow.
  std::shared_ptr<Node> InsertAfter(const std::shared_ptr<Node>& Predecessor,
                                    std::shared_ptr<ShowEvent> Element);
  std::shared_ptr<Node> InsertBefore(const std::shared_ptr<Node>& Successor,
                                     std::shared_ptr<ShowEvent> Element);
  // Unlinks the node (it stays in Nodes). Fails with error 1 from
  // "LinkedList.DeleteNode" when it is the only node: a list is never empty.
  void DeleteNode(const std::shared_ptr<Node>& node);

 private:
  std::vector<std::shared_ptr<Node>> m_nodes;
  std::shared_ptr<Node> m_firstNode;
  std::shared_ptr<Node> m_lastNode;
  int32_t m_count = 0;
};

// A list of one node holding Element, which is both first and last.
std::shared_ptr<LinkedList> NewSingleNodeList(std::shared_ptr<ShowEvent> Element);

}  // namespace tav
