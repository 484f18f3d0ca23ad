// SplayTree: the sweep status against an ordered set, the tie shift, keys at
// the sweep height, and trees too deep for recursion.
#include <krCoreLib/geometry/KRSweepSplayTree.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <cmath>
#include <deque>
#include <limits>
#include <random>
#include <set>
#include <vector>

using namespace krPolygonTriangulation;

namespace {

// Edges whose stored key is a chosen x: horizontal edges from x to x + 1.
class CKREdgeSupply {
public:
  Linebase* Horizontal(double x) {
    Pointbase* start = &m_Points.emplace_back(x, 0.0);
    Pointbase* end = &m_Points.emplace_back(x + 1, 0.0);
    Linebase* edge = &m_Edges.emplace_back(unsigned(m_Edges.size() + 1), start, end, CONTOUR);
    edge->setKeyValue(0);
    return edge;
  }
  Linebase* Segment(double x0, double y0, double x1, double y1) {
    Pointbase* start = &m_Points.emplace_back(x0, y0);
    Pointbase* end = &m_Points.emplace_back(x1, y1);
    return &m_Edges.emplace_back(unsigned(m_Edges.size() + 1), start, end, CONTOUR);
  }

private:
  std::deque<Pointbase> m_Points;
  std::deque<Linebase> m_Edges;
};

std::vector<double> Keys(const SplayTree& tree) {
  std::vector<double> keys;
  tree.InOrder([&keys](BTreeNode* node) { keys.push_back(node->keyValue()); });
  return keys;
}

}  // namespace

TEST(SplayTree, OperationsMatchAnOrderedSet) {
  std::mt19937 random(KRTestSeed());
  std::uniform_int_distribution<int> values(0, 400);
  std::uniform_int_distribution<int> actions(0, 9);
  CKREdgeSupply supply;
  SplayTree tree;
  std::set<double> expected;
  for (int step = 0; step < 5000; ++step) {
    const double x = values(random);
    const int action = actions(random);
    SCOPED_TRACE(testing::Message() << "step " << step << " action " << action << " x " << x);
    if (action < 4) {
      if (expected.insert(x).second)
        tree.Insert(supply.Horizontal(x));
    } else if (action < 6) {
      tree.Delete(x);
      expected.erase(x);
    } else if (action < 8) {
      BTreeNode* node = nullptr;
      const auto below = expected.lower_bound(x);
      const bool found = tree.FindMaxSmallerThan(x, node);
      ASSERT_EQ(found, below != expected.begin());
      if (found) {
        ASSERT_EQ(node->keyValue(), *std::prev(below));
      }
      BTreeNode* same = tree.Find(x);
      ASSERT_EQ(same != nullptr, expected.count(x) == 1);
    } else if (action == 8 && !expected.empty()) {
      ASSERT_EQ(tree.FindMin()->keyValue(), *expected.begin());
      tree.DeleteMin();
      expected.erase(expected.begin());
    } else if (!expected.empty()) {
      ASSERT_EQ(tree.FindMax()->keyValue(), *expected.rbegin());
      tree.DeleteMax();
      expected.erase(std::prev(expected.end()));
    }
    ASSERT_EQ(tree.Size(), long(expected.size()));
    ASSERT_EQ(tree.IsEmpty(), expected.empty());
  }
  EXPECT_EQ(Keys(tree), std::vector<double>(expected.begin(), expected.end()));
  // A copy has the same order over the same edges and lives on its own.
  SplayTree copy(tree);
  EXPECT_EQ(Keys(copy), Keys(tree));
  EXPECT_EQ(copy.Height(), tree.Height());
  tree.MakeEmpty();
  EXPECT_TRUE(tree.IsEmpty());
  EXPECT_EQ(tree.FindMin(), nullptr);
  EXPECT_EQ(Keys(copy), std::vector<double>(expected.begin(), expected.end()));
}

TEST(SplayTree, KeysOutOfOrderLoseNoNode) {
  // Edges of invalid input cross, and their keys fall out of order: the
  // searches then go astray, but no operation may lose or repeat a node.
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> values(0, 100);
  CKREdgeSupply supply;
  SplayTree tree;
  std::vector<Linebase*> edges;
  for (int step = 0; step < 3000; ++step) {
    if (step % 3 != 2 || edges.empty()) {
      edges.push_back(supply.Horizontal(values(random)));
      tree.Insert(edges.back());
    } else {
      edges[random() % edges.size()]->increaseKeyValue(values(random) - 50);
      const int action = int(random() % 3);
      if (action == 0)
        tree.Delete(edges[random() % edges.size()]->keyValue());
      else if (action == 1)
        tree.DeleteMin();
      else
        tree.DeleteMax();
    }
    long reachable = 0;
    tree.InOrder([&reachable](BTreeNode*) { ++reachable; });
    ASSERT_EQ(reachable, tree.Size()) << "step " << step;
  }
}

TEST(SplayTree, EqualKeysAreShiftedApart) {
  CKREdgeSupply supply;
  SplayTree tree;
  Linebase* first = supply.Horizontal(5);
  Linebase* second = supply.Horizontal(5);
  Linebase* third = supply.Horizontal(5);
  tree.Insert(first);
  tree.Insert(second);
  tree.Insert(third);
  EXPECT_EQ(second->keyValue(), 5 + 1e-10);
  EXPECT_EQ(third->keyValue(), 5 + 1e-10 + 1e-10);
  EXPECT_EQ(Keys(tree), (std::vector<double>{5, 5 + 1e-10, 5 + 1e-10 + 1e-10}));

  // Where 1e-10 is below the key's resolution the shift is one ulp; keys
  // that cannot move still go in and the insertion ends.
  const double big = 1e12;
  tree.Insert(supply.Horizontal(big));
  Linebase* bigTie = supply.Horizontal(big);
  tree.Insert(bigTie);
  EXPECT_EQ(bigTie->keyValue(), std::nextafter(big, HUGE_VAL));
  const double inf = std::numeric_limits<double>::infinity();
  tree.Insert(supply.Horizontal(inf));
  tree.Insert(supply.Horizontal(inf));
  tree.Insert(supply.Horizontal(std::numeric_limits<double>::quiet_NaN()));
  tree.Insert(supply.Horizontal(std::numeric_limits<double>::quiet_NaN()));
  tree.Insert(supply.Horizontal(7));
  EXPECT_EQ(tree.Size(), 10);
  long visited = 0;
  tree.PostOrder([&visited](BTreeNode*) { ++visited; });
  EXPECT_EQ(visited, 10);
}

TEST(SplayTree, SweepingComparesEdgesAtTheSweepHeight) {
  // Three edges running down from y = 10 to y = 0 whose order in x never
  // changes but whose stored keys are stale: searches take keys at the
  // height and refresh the edges they meet.
  CKREdgeSupply supply;
  Linebase* left = supply.Segment(0, 10, 4, 0);
  Linebase* middle = supply.Segment(10, 10, 6, 0);
  Linebase* right = supply.Segment(20, 10, 30, 0);
  SplayTree tree;
  tree.SetSweepHeight(10);
  for (Linebase* edge : {middle, left, right}) {
    edge->setKeyValue(10);
    tree.Insert(edge);
  }
  tree.SetSweepHeight(0);
  BTreeNode* node = nullptr;
  ASSERT_TRUE(tree.FindMaxSmallerThan(5.5, node));
  EXPECT_EQ(node->m_pData, left);
  EXPECT_EQ(left->keyValue(), 4);
  ASSERT_TRUE(tree.FindMaxSmallerThan(7, node));
  EXPECT_EQ(node->m_pData, middle);
  tree.Delete(30);
  EXPECT_EQ(tree.Size(), 2);
  EXPECT_EQ(tree.Find(30), nullptr);
  // Every key at one height at once, as a visitor passed the height.
  tree.InOrder([](BTreeNode* n, double y) { n->m_pData->setKeyValue(y); }, 5);
  EXPECT_EQ(Keys(tree), (std::vector<double>{2, 8}));
}

TEST(SplayTree, DeepTreesNeedNoRecursion) {
  // Ascending insertions leave a single path as deep as the tree is large.
  constexpr int kCount = 300000;
  CKREdgeSupply supply;
  SplayTree tree;
  for (int i = 0; i < kCount; ++i)
    tree.Insert(supply.Horizontal(i));
  EXPECT_EQ(tree.Height(), kCount);
  long count = 0;
  tree.PreOrder([&count](BTreeNode*) { ++count; });
  tree.PostOrder([&count](BTreeNode*) { ++count; });
  EXPECT_EQ(count, 2L * kCount);
  SplayTree copy;
  copy = tree;
  EXPECT_EQ(copy.Size(), kCount);
  EXPECT_EQ(SplayTree::Left(SplayTree::Left(copy.Root()))->keyValue(), kCount - 3);
}
