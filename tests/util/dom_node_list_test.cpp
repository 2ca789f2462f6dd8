// Lists of nodes.
#include "util/dom_node_list.h"

#include <gtest/gtest.h>

#include <vector>

using VMQ::DOMNode;
using VMQ::DOMNodeList;

namespace {

// Counts how often nodes are deleted.
class CountedNode : public DOMNode {
 public:
  explicit CountedNode(int& deleted) : deleted_(deleted) {}
  ~CountedNode() override { ++deleted_; }
  [[nodiscard]] uint8_t getNodeType() const override { return 7; }

 private:
  int& deleted_;
};

TEST(DOMNodeListTest, NewListIsEmpty) {
  const DOMNodeList list(true);
  EXPECT_EQ(list.getLength(), 0u);
  EXPECT_EQ(list.item(0), nullptr);
}

TEST(DOMNodeListTest, NodesKeepTheirOrder) {
  int deleted = 0;
  DOMNodeList list(true);
  std::vector<DOMNode*> nodes;
  for (int i = 0; i < 5; ++i) {
    nodes.push_back(new CountedNode(deleted));
    list.append(nodes.back());
  }
  EXPECT_EQ(list.getLength(), 5u);
  for (unsigned i = 0; i < 5; ++i) EXPECT_EQ(list.item(i), nodes[i]);
  std::vector<DOMNode*> visited;
  for (DOMNode* const node : list) visited.push_back(node);
  EXPECT_EQ(visited, nodes);
}

TEST(DOMNodeListTest, IndexOfTheLengthGivesNull) {
  int deleted = 0;
  DOMNodeList list(true);
  list.append(new CountedNode(deleted));
  EXPECT_NE(list.item(0), nullptr);
  EXPECT_EQ(list.item(1), nullptr);
  EXPECT_EQ(list.item(0xFFFFFFFF), nullptr);
}

TEST(DOMNodeListTest, NullIsNotAppended) {
  DOMNodeList list(true);
  list.append(nullptr);
  EXPECT_EQ(list.getLength(), 0u);
}

TEST(DOMNodeListTest, OwningListDeletesItsNodesOnce) {
  int deleted = 0;
  {
    DOMNodeList list(true);
    list.append(new CountedNode(deleted));
    list.append(new CountedNode(deleted));
    EXPECT_EQ(deleted, 0);
  }
  EXPECT_EQ(deleted, 2);
}

TEST(DOMNodeListTest, OtherListLeavesItsNodes) {
  int deleted = 0;
  CountedNode node(deleted);
  {
    DOMNodeList list(false);
    list.append(&node);
    list.append(&node);
  }
  EXPECT_EQ(deleted, 0);
}

TEST(DOMNodeListTest, FreeFunctionDeletesAListAndIgnoresNull) {
  int deleted = 0;
  auto* const list = new DOMNodeList(true);
  list->append(new CountedNode(deleted));
  VMQ::freeDOMNodeListFunc(list);
  EXPECT_EQ(deleted, 1);
  VMQ::freeDOMNodeListFunc(nullptr);
}

TEST(DOMNodeTest, DumpsNothingUnlessItsKindSaysHow) {
  int deleted = 0;
  const CountedNode node(deleted);
  VMQ::String out("before");
  node.dump(out);
  EXPECT_EQ(out.toNarrow(), "before");
}

}  // namespace
