#include "schedule/LinkedList.h"

#include <gtest/gtest.h>

#include "support/Error.h"

namespace tav {
namespace {

std::shared_ptr<ShowEvent> Named(const std::string& name) {
  auto e = std::make_shared<ShowEvent>();
  e->SetFilename(name);
  return e;
}

// The names forward from FirstNode and backward from LastNode, which must
// agree: a broken back link shows up as a difference.
std::string Forward(const LinkedList& list) {
  std::string names;
  for (auto n = list.FirstNode(); n; n = n->NextNode()) names += n->Obj()->Filename();
  return names;
}
std::string Backward(const LinkedList& list) {
  std::string names;
  for (auto n = list.LastNode(); n; n = n->PreviousNode()) names.insert(0, n->Obj()->Filename());
  return names;
}

void ExpectList(const LinkedList& list, const std::string& names) {
  EXPECT_EQ(Forward(list), names);
  EXPECT_EQ(Backward(list), names);
  EXPECT_EQ(list.Count(), static_cast<int32_t>(names.size()));
}

TEST(LinkedList, InsertsKeepBothDirectionsAndTheEnds) {
  auto list = NewSingleNodeList(Named("c"));
  ExpectList(*list, "c");
  auto c = list->FirstNode();
  auto a = list->InsertBefore(c, Named("a"));
  EXPECT_EQ(list->FirstNode(), a);
  auto e = list->InsertAfter(c, Named("e"));
  EXPECT_EQ(list->LastNode(), e);
  list->InsertAfter(a, Named("b"));
  list->InsertBefore(e, Named("d"));
  ExpectList(*list, "abcde");
}

TEST(LinkedList, DeleteNodeUnlinksFirstMiddleAndLast) {
  auto list = NewSingleNodeList(Named("a"));
  auto a = list->FirstNode();
  auto b = list->InsertAfter(a, Named("b"));
  auto c = list->InsertAfter(b, Named("c"));
  auto d = list->InsertAfter(c, Named("d"));
  list->DeleteNode(b);
  ExpectList(*list, "acd");
  list->DeleteNode(a);
  ExpectList(*list, "cd");
  EXPECT_EQ(list->FirstNode(), c);
  list->DeleteNode(d);
  ExpectList(*list, "c");
  EXPECT_EQ(list->LastNode(), c);
  // The collection keeps every node ever inserted.
  EXPECT_EQ(list->Nodes().size(), 4u);
}

TEST(LinkedList, TheOnlyNodeCannotBeDeleted) {
  auto list = NewSingleNodeList(Named("a"));
  try {
    list->DeleteNode(list->FirstNode());
    ADD_FAILURE() << "deleted the only node";
  } catch (const Error& e) {
    EXPECT_EQ(e.Number(), 1);
    EXPECT_EQ(e.Source(), "LinkedList.DeleteNode");
    EXPECT_EQ(e.Description(), "Can't delete only node");
  }
  ExpectList(*list, "a");
}

TEST(LinkedList, NodesOutliveTheirListWithoutLeaking) {
  std::weak_ptr<Node> watched;
  std::shared_ptr<Node> kept;
  {
    auto list = NewSingleNodeList(Named("a"));
    auto b = list->InsertAfter(list->FirstNode(), Named("b"));
    list->InsertAfter(b, Named("c"));
    watched = list->FirstNode();
    kept = b;
  }
  // The list is gone: nodes nobody holds are released (no cycle keeps them),
  // a node still held keeps its event and its successor.
  EXPECT_TRUE(watched.expired());
  EXPECT_EQ(kept->Obj()->Filename(), "b");
  ASSERT_TRUE(kept->NextNode());
  EXPECT_EQ(kept->NextNode()->Obj()->Filename(), "c");
}

}  // namespace
}  // namespace tav
