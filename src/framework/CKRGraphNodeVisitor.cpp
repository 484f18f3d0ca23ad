#include <krCoreLib/framework/CKRGraphNodeVisitor.h>

KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRGraphNodeVisitorImpl, CKRObjectImpl)
KR_IMPLEMENT_OBJECT_TYPE(CKRDFSVisitor, CKRGraphNodeVisitorImpl)
KR_IMPLEMENT_OBJECT_TYPE(CKRFilteredDFSVisitor, CKRDFSVisitor)
KR_IMPLEMENT_OBJECT_TYPE(CKRReleaseVisitor, CKRDFSVisitor)

std::uint16_t CKRGraphNodeVisitorImpl::m_iNextSessionID = 0;
bool CKRGraphNodeVisitorImpl::m_bLocked = false;

// ---------------------------------------------------------------- any walk

std::uint16_t CKRGraphNodeVisitorImpl::GetNextSessionID() {
  // 1 to 65534, then 1 again: 0 is the mark of everything never visited, so
  // a walk with session 0 would take every new node and edge as visited.
  m_iNextSessionID = static_cast<std::uint16_t>(m_iNextSessionID % 65534 + 1);
  return m_iNextSessionID;
}

int CKRGraphNodeVisitorImpl::Start(CKRGraphNode* node) {
  if (m_bLocked || node == nullptr)
    return 0;
  m_iSessionID = GetNextSessionID();
  // Unlocked also when a VisitNode override throws.
  struct SKRWalkLock {
    SKRWalkLock() { m_bLocked = true; }
    ~SKRWalkLock() { m_bLocked = false; }
  } lock;
  VisitNode(node);
  return 1;
}

int CKRGraphNodeVisitorImpl::VisitNode(CKRGraphNode* node) {
  if (node == nullptr || node->WasVisited(this) != 0)
    return 0;
  node->SetVisited(this);
  return 1;
}

std::uint16_t CKRGraphNodeVisitorImpl::GetSessionID() {
  return m_iSessionID;
}

// ---------------------------------------------------------------- depth-first

int CKRDFSVisitor::VisitNode(CKRGraphNode* node) {
  return VisitDepthFirst(node, true);
}

void CKRDFSVisitor::AddToDFSList(CKRGraphNode* node) {
  m_DFSNodeList.Add(node);
}

int CKRDFSVisitor::VisitDepthFirst(CKRGraphNode* node, bool collect) {
  if (node == nullptr || node->WasVisited(this) != 0)
    return 0;
  node->SetVisited(this);
  if (collect)
    AddToDFSList(node);
  m_Frames.push_back({node, node->GetEdgeIterator()});
  // Deep in the walk: the innermost running loop below takes this node's
  // edges next, before it goes on with its own, which is the order the
  // nested call would have gone in.
  if (m_iNesting >= kMaxNesting)
    return 1;

  const std::size_t base = m_Frames.size() - 1;
  // Also when a VisitNode override throws: the frames of this call and the
  // nesting are undone, so that the visitor can walk again.
  struct SKRNestingGuard {
    CKRDFSVisitor* m_pVisitor;
    std::size_t m_Base;
    ~SKRNestingGuard() {
      --m_pVisitor->m_iNesting;
      m_pVisitor->m_Frames.resize(m_Base);
    }
  } guard{this, base};
  ++m_iNesting;

  while (m_Frames.size() > base) {
    // Not held across the visit below: it may add frames, which moves the
    // vector.
    SKRFrame& top = m_Frames.back();
    CKRGraphNode* from = top.m_pNode;
    CKRGraphEdge* edge = top.m_Edges.Next(0);
    if (edge == nullptr) {
      m_Frames.pop_back();
      continue;
    }
    if (edge->WasVisited(this) != 0)
      continue;
    edge->SetVisited(this);
    if (CKRGraphNode* neighbor = edge->GetNeighbor(from))
      VisitNode(neighbor);
  }
  return 1;
}

// ---------------------------------------------------------------- filtered

int CKRFilteredDFSVisitor::Start(CKRGraphNode* node) {
  return m_SeekTypes.empty() ? 0 : CKRDFSVisitor::Start(node);
}

int CKRFilteredDFSVisitor::VisitNode(CKRGraphNode* node) {
  if (node == nullptr || node->WasVisited(this) != 0)
    return 0;
  return VisitDepthFirst(node, IsSought(node));
}

bool CKRFilteredDFSVisitor::IsSought(CKRGraphNode* node) const {
  for (const CKRGuid& typeID : m_SeekTypes)
    if (node->IsTypeOf(typeID) != 0)
      return true;
  return false;
}

// ---------------------------------------------------------------- release

int CKRReleaseVisitor::Start(CKRGraphNode* node) {
  if (CKRDFSVisitor::Start(node) == 0)
    return 0;
  // Each node's release releases its edges; an edge reached only through
  // nodes released before is gone with them.
  m_DFSNodeList.RemoveAll(true);
  return 1;
}
