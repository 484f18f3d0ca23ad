// BTreeNode and SplayTree: the sweep status of the triangulator, a top-down
// splay tree of edges (Linebase) ordered by their keys.
//
// The tree holds pointers to edges it does not own; they must outlive their
// nodes. Keys are doubles compared with < and >, so a key compares equal to
// a NaN; such keys leave the order undefined but every operation still ends.
//
// Sweep keys: after SetSweepHeight(y) the tree orders edges by their x at
// height y and refreshes an edge's key (Linebase::setKeyValue(y)) whenever a
// search meets it. A search thus costs only the path it walks, and between
// sweep events the keys need no refreshing as a whole. Before the first
// SetSweepHeight (and after ClearSweepHeight) the keys are used as stored.
//
// Operations splay (restructure) the tree and cost O(log n) amortised; the
// traversals, Height and the copy are iterative, so even a degenerate tree of
// any depth is walked without deep recursion. Not thread-safe.
#pragma once

#include <krCoreLib/geometry/KRSweepElements.h>

#include <functional>

namespace krPolygonTriangulation {

struct KRCORELIB_API BTreeNode {
  Linebase* m_pData = nullptr;
  BTreeNode* m_pLeft = nullptr;
  BTreeNode* m_pRight = nullptr;
  // Scratch mark of the post-order walk; false between operations.
  bool m_bVisited = false;

  double keyValue() const noexcept { return m_pData->keyValue(); }
};

class KRCORELIB_API SplayTree {
public:
  using Visitor = std::function<void(BTreeNode*)>;
  using KeyVisitor = std::function<void(BTreeNode*, double)>;

  SplayTree() noexcept = default;
  // A tree of the same shape over the same edges, with the same sweep height.
  SplayTree(const SplayTree& other);
  SplayTree& operator=(const SplayTree& other);
  ~SplayTree();

  void SetSweepHeight(double y) noexcept;
  void ClearSweepHeight() noexcept;

  // Adds `edge` (null is ignored) with its current key. An edge whose key
  // equals one in the tree has its key raised by 1e-10 (by one ulp where
  // 1e-10 is below the key's resolution) until it is unique; a key that
  // cannot be raised (infinite or NaN) goes right of its equal.
  void Insert(Linebase* edge);
  // Removes the node whose key equals `key`, if there is one.
  void Delete(double key);
  // The node whose key equals `key`, or null.
  BTreeNode* Find(double key);
  // The nodes of the smallest and the largest key, or null when empty.
  BTreeNode* FindMin();
  BTreeNode* FindMax();
  // The node of the largest key strictly smaller than `key`: true and the
  // node in `node`, or false and null.
  bool FindMaxSmallerThan(double key, BTreeNode*& node);
  void DeleteMin();
  void DeleteMax();
  void MakeEmpty() noexcept;

  bool IsEmpty() const noexcept { return m_pRoot == nullptr; }
  long Size() const noexcept { return m_Size; }
  // The number of nodes on the longest path from the root; 0 when empty.
  long Height() const;
  BTreeNode* Root() const noexcept { return m_pRoot; }
  static BTreeNode* Left(const BTreeNode* node) noexcept { return node != nullptr ? node->m_pLeft : nullptr; }
  static BTreeNode* Right(const BTreeNode* node) noexcept { return node != nullptr ? node->m_pRight : nullptr; }

  // Visit every node (the visitor must not change the tree's shape).
  void PreOrder(const Visitor& visit) const;
  void InOrder(const Visitor& visit) const;
  // In order, passing `y` along (for example to set every key at a height).
  void InOrder(const KeyVisitor& visit, double y) const;
  void PostOrder(const Visitor& visit) const;

private:
  // The key of `node` at the sweep height, refreshed when sweeping.
  double key(BTreeNode* node) noexcept;
  // Top-down splay: the node of `key`, or the last one met looking for it,
  // becomes the root of the subtree `root`; returns the new subtree root.
  BTreeNode* splay(double key, BTreeNode* root) noexcept;
  static BTreeNode* rotateWithLeftChild(BTreeNode* k2) noexcept;
  static BTreeNode* rotateWithRightChild(BTreeNode* k1) noexcept;
  static BTreeNode* clone(const BTreeNode* root);
  static void reclaimMemory(BTreeNode* root) noexcept;
  // Removes the root, joining its subtrees.
  void remove(BTreeNode* root) noexcept;
  // The leftmost (side m_pLeft) or rightmost node, splayed up; and its
  // removal.
  BTreeNode* findExtreme(BTreeNode* BTreeNode::*side);
  void deleteExtreme(BTreeNode* BTreeNode::*side, BTreeNode* BTreeNode::*other);

  BTreeNode* m_pRoot = nullptr;
  long m_Size = 0;
  bool m_bSweeping = false;
  double m_SweepY = 0;
};

}  // namespace krPolygonTriangulation
