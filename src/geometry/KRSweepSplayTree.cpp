// SplayTree: top-down splaying after Sleator and Tarjan, with keys taken at
// the sweep height when the tree is sweeping.
#include <krCoreLib/geometry/KRSweepSplayTree.h>

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

namespace {

// The shift that makes an inserted key unique. Keys are x coordinates; the
// shift is far below any distance between distinct edges of a sensible
// drawing, and a key too large for it to change moves by one ulp instead.
constexpr double kTieShift = 1e-10;

}  // namespace

namespace krPolygonTriangulation {

SplayTree::SplayTree(const SplayTree& other)
    : m_pRoot(clone(other.m_pRoot)), m_Size(other.m_Size), m_bSweeping(other.m_bSweeping), m_SweepY(other.m_SweepY) {}

SplayTree& SplayTree::operator=(const SplayTree& other) {
  if (this != &other) {
    BTreeNode* copy = clone(other.m_pRoot);
    MakeEmpty();
    m_pRoot = copy;
    m_Size = other.m_Size;
    m_bSweeping = other.m_bSweeping;
    m_SweepY = other.m_SweepY;
  }
  return *this;
}

SplayTree::~SplayTree() { MakeEmpty(); }

void SplayTree::SetSweepHeight(double y) noexcept {
  m_bSweeping = true;
  m_SweepY = y;
}

void SplayTree::ClearSweepHeight() noexcept { m_bSweeping = false; }

double SplayTree::key(BTreeNode* node) noexcept {
  if (m_bSweeping)
    node->m_pData->setKeyValue(m_SweepY);
  return node->m_pData->keyValue();
}

BTreeNode* SplayTree::rotateWithLeftChild(BTreeNode* k2) noexcept {
  BTreeNode* k1 = k2->m_pLeft;
  k2->m_pLeft = k1->m_pRight;
  k1->m_pRight = k2;
  return k1;
}

BTreeNode* SplayTree::rotateWithRightChild(BTreeNode* k1) noexcept {
  BTreeNode* k2 = k1->m_pRight;
  k1->m_pRight = k2->m_pLeft;
  k2->m_pLeft = k1;
  return k2;
}

BTreeNode* SplayTree::splay(double target, BTreeNode* root) noexcept {
  if (root == nullptr)
    return nullptr;
  // The left tree collects nodes smaller than the target (hung on the right
  // of its largest node), the right tree the larger ones.
  BTreeNode header;
  BTreeNode* leftMax = &header;
  BTreeNode* rightMin = &header;
  BTreeNode* t = root;
  for (;;) {
    const double k = key(t);
    if (target < k) {
      if (t->m_pLeft == nullptr)
        break;
      if (target < key(t->m_pLeft)) {
        t = rotateWithLeftChild(t);
        if (t->m_pLeft == nullptr)
          break;
      }
      rightMin->m_pLeft = t;
      rightMin = t;
      t = t->m_pLeft;
    } else if (k < target) {
      if (t->m_pRight == nullptr)
        break;
      if (key(t->m_pRight) < target) {
        t = rotateWithRightChild(t);
        if (t->m_pRight == nullptr)
          break;
      }
      leftMax->m_pRight = t;
      leftMax = t;
      t = t->m_pRight;
    } else {
      break;
    }
  }
  leftMax->m_pRight = t->m_pLeft;
  rightMin->m_pLeft = t->m_pRight;
  t->m_pLeft = header.m_pRight;
  t->m_pRight = header.m_pLeft;
  return t;
}

void SplayTree::Insert(Linebase* edge) {
  if (edge == nullptr)
    return;
  BTreeNode* node = new BTreeNode;
  node->m_pData = edge;
  ++m_Size;
  if (m_pRoot == nullptr) {
    m_pRoot = node;
    return;
  }
  for (;;) {
    const double k = edge->keyValue();
    m_pRoot = splay(k, m_pRoot);
    const double rootKey = key(m_pRoot);
    if (k < rootKey) {
      node->m_pLeft = m_pRoot->m_pLeft;
      node->m_pRight = m_pRoot;
      m_pRoot->m_pLeft = nullptr;
      break;
    }
    double shift = kTieShift;
    if (k + shift == k)
      shift = std::nextafter(k, HUGE_VAL) - k;
    // Raising strictly increases the key, so the ties end. Keys that do not
    // compare (NaN) and keys that cannot be raised (infinite) go right.
    if (k != rootKey || !(k + shift > k)) {
      node->m_pRight = m_pRoot->m_pRight;
      node->m_pLeft = m_pRoot;
      m_pRoot->m_pRight = nullptr;
      break;
    }
    edge->increaseKeyValue(shift);
  }
  m_pRoot = node;
}

void SplayTree::remove(BTreeNode* root) noexcept {
  // root is the tree's root: join its subtrees. Splaying the left subtree
  // at the removed key brings its largest node up, which has no right child
  // while the keys are in order. Keys out of order (edges of invalid input
  // that cross) may leave one: the right subtree then goes below the
  // rightmost node, so that no node is lost.
  const double k = key(root);
  BTreeNode* joined = nullptr;
  if (root->m_pLeft == nullptr) {
    joined = root->m_pRight;
  } else {
    joined = splay(k, root->m_pLeft);
    BTreeNode* rightmost = joined;
    while (rightmost->m_pRight != nullptr)
      rightmost = rightmost->m_pRight;
    rightmost->m_pRight = root->m_pRight;
  }
  delete root;
  --m_Size;
  m_pRoot = joined;
}

void SplayTree::Delete(double target) {
  if (m_pRoot == nullptr)
    return;
  m_pRoot = splay(target, m_pRoot);
  if (key(m_pRoot) != target)
    return;
  remove(m_pRoot);
}

BTreeNode* SplayTree::Find(double target) {
  if (m_pRoot == nullptr)
    return nullptr;
  m_pRoot = splay(target, m_pRoot);
  return key(m_pRoot) == target ? m_pRoot : nullptr;
}

BTreeNode* SplayTree::findExtreme(BTreeNode* BTreeNode::*side) {
  if (m_pRoot == nullptr)
    return nullptr;
  BTreeNode* node = m_pRoot;
  while (node->*side != nullptr)
    node = node->*side;
  m_pRoot = splay(key(node), m_pRoot);
  return node;
}

void SplayTree::deleteExtreme(BTreeNode* BTreeNode::*side, BTreeNode* BTreeNode::*other) {
  // The splay brings the extreme node up (to the root while the keys are in
  // order); it is then unlinked where it is, which holds whatever the keys.
  if (findExtreme(side) == nullptr)
    return;
  BTreeNode** link = &m_pRoot;
  while ((*link)->*side != nullptr)
    link = &((*link)->*side);
  BTreeNode* node = *link;
  *link = node->*other;
  delete node;
  --m_Size;
}

BTreeNode* SplayTree::FindMin() { return findExtreme(&BTreeNode::m_pLeft); }

BTreeNode* SplayTree::FindMax() { return findExtreme(&BTreeNode::m_pRight); }

bool SplayTree::FindMaxSmallerThan(double target, BTreeNode*& node) {
  node = nullptr;
  if (m_pRoot == nullptr)
    return false;
  m_pRoot = splay(target, m_pRoot);
  if (key(m_pRoot) < target) {
    node = m_pRoot;
  } else if (m_pRoot->m_pLeft != nullptr) {
    node = m_pRoot->m_pLeft;
    while (node->m_pRight != nullptr)
      node = node->m_pRight;
    // Brings the found edge's key to the sweep height for the caller.
    key(node);
  }
  return node != nullptr;
}

void SplayTree::DeleteMin() { deleteExtreme(&BTreeNode::m_pLeft, &BTreeNode::m_pRight); }

void SplayTree::DeleteMax() { deleteExtreme(&BTreeNode::m_pRight, &BTreeNode::m_pLeft); }

void SplayTree::MakeEmpty() noexcept {
  reclaimMemory(m_pRoot);
  m_pRoot = nullptr;
  m_Size = 0;
}

void SplayTree::reclaimMemory(BTreeNode* root) noexcept {
  // Rotating every left child up turns the tree into a right spine that is
  // freed from the top: no recursion and no extra memory.
  while (root != nullptr) {
    if (root->m_pLeft != nullptr) {
      root = rotateWithLeftChild(root);
    } else {
      BTreeNode* next = root->m_pRight;
      delete root;
      root = next;
    }
  }
}

BTreeNode* SplayTree::clone(const BTreeNode* root) {
  if (root == nullptr)
    return nullptr;
  // Pairs of (original, copy) whose children are still to be copied.
  std::vector<std::pair<const BTreeNode*, BTreeNode*>> pending;
  BTreeNode* copy = new BTreeNode{root->m_pData, nullptr, nullptr, false};
  pending.emplace_back(root, copy);
  while (!pending.empty()) {
    const auto [original, duplicate] = pending.back();
    pending.pop_back();
    if (original->m_pLeft != nullptr) {
      duplicate->m_pLeft = new BTreeNode{original->m_pLeft->m_pData, nullptr, nullptr, false};
      pending.emplace_back(original->m_pLeft, duplicate->m_pLeft);
    }
    if (original->m_pRight != nullptr) {
      duplicate->m_pRight = new BTreeNode{original->m_pRight->m_pData, nullptr, nullptr, false};
      pending.emplace_back(original->m_pRight, duplicate->m_pRight);
    }
  }
  return copy;
}

long SplayTree::Height() const {
  long height = 0;
  std::vector<std::pair<const BTreeNode*, long>> pending;
  if (m_pRoot != nullptr)
    pending.emplace_back(m_pRoot, 1);
  while (!pending.empty()) {
    const auto [node, depth] = pending.back();
    pending.pop_back();
    height = std::max(height, depth);
    if (node->m_pLeft != nullptr)
      pending.emplace_back(node->m_pLeft, depth + 1);
    if (node->m_pRight != nullptr)
      pending.emplace_back(node->m_pRight, depth + 1);
  }
  return height;
}

void SplayTree::PreOrder(const Visitor& visit) const {
  std::vector<BTreeNode*> pending;
  if (m_pRoot != nullptr)
    pending.push_back(m_pRoot);
  while (!pending.empty()) {
    BTreeNode* node = pending.back();
    pending.pop_back();
    visit(node);
    if (node->m_pRight != nullptr)
      pending.push_back(node->m_pRight);
    if (node->m_pLeft != nullptr)
      pending.push_back(node->m_pLeft);
  }
}

void SplayTree::InOrder(const Visitor& visit) const {
  InOrder([&visit](BTreeNode* node, double) { visit(node); }, 0.0);
}

void SplayTree::InOrder(const KeyVisitor& visit, double y) const {
  std::vector<BTreeNode*> pending;
  BTreeNode* node = m_pRoot;
  while (node != nullptr || !pending.empty()) {
    while (node != nullptr) {
      pending.push_back(node);
      node = node->m_pLeft;
    }
    node = pending.back();
    pending.pop_back();
    BTreeNode* right = node->m_pRight;
    visit(node, y);
    node = right;
  }
}

void SplayTree::PostOrder(const Visitor& visit) const {
  // A node is visited when met the second time: the first time it stays on
  // the stack, marked, under its children.
  std::vector<BTreeNode*> pending;
  if (m_pRoot != nullptr)
    pending.push_back(m_pRoot);
  while (!pending.empty()) {
    BTreeNode* node = pending.back();
    if (node->m_bVisited) {
      pending.pop_back();
      node->m_bVisited = false;
      visit(node);
      continue;
    }
    node->m_bVisited = true;
    if (node->m_pRight != nullptr)
      pending.push_back(node->m_pRight);
    if (node->m_pLeft != nullptr)
      pending.push_back(node->m_pLeft);
  }
}

}  // namespace krPolygonTriangulation
