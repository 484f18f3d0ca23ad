#include <krCoreLib/framework/CKRGraphNode.h>

#include <krCoreLib/framework/CKRGraphNodeVisitor.h>
#include <krCoreLib/serialization/CKRObjCollectionFieldT.h>
#include <krCoreLib/serialization/CKRObjFieldT.h>

#include <utility>

KR_IMPLEMENT_SERIAL_TYPE(CKRGraphEdge, CKRSerialObject)
KR_IMPLEMENT_SERIAL_TYPE(CKRGraphNode, CKRSerialObject)

namespace {

constexpr CKRGuid kPrimaryNodeFieldID = CKRGuid::Literal("{1212F592-7438-407D-8ACB-7A5E5B7AC239}");
constexpr CKRGuid kSecondaryNodeFieldID = CKRGuid::Literal("{6DAE28D0-BFB9-4421-B142-F5671EF3A55A}");
constexpr CKRGuid kEdgeListFieldID = CKRGuid::Literal("{BC46ABAF-175D-4139-9B08-1B063477ADDE}");

// The flags stored archives carry for these fields: read, written, visible
// and expanded; the node links also carry bit 0x20, which has no meaning of
// its own, the edge list shows its edges' fields under it.
constexpr int kNodeLinkFlags = KRF_READ | KRF_WRITE | KRF_VISIBLE | KRF_EXPANDED | 0x20;
constexpr int kEdgeListFlags = KRF_READ | KRF_WRITE | KRF_VISIBLE | KRF_SHOW_LINKED_FIELDS | KRF_EXPANDED;

}  // namespace

// ---------------------------------------------------------------- edges

void CKRGraphEdge::CKRGraphEdgeType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRObjFieldT<CKRGraphNode>>(target, object, &CKRGraphEdge::m_pPrimaryNode, L"m_pPrimaryNode",
                                        L"m_pPrimaryNode", kPrimaryNodeFieldID, KRDT_OBJECT_LINK, kNodeLinkFlags);
  BindField<CKRObjFieldT<CKRGraphNode>>(target, object, &CKRGraphEdge::m_pSecondaryNode, L"m_pSecondaryNode",
                                        L"m_pSecondaryNode", kSecondaryNodeFieldID, KRDT_OBJECT_LINK, kNodeLinkFlags);
}

int CKRGraphEdge::OnInitialize() {
  m_iConnected = 0;
  m_pPrimaryNode = nullptr;
  m_pSecondaryNode = nullptr;
  m_iDirection = KR_EDGE_BOTH_WAYS;
  return CKRSerialObject::OnInitialize();
}

int CKRGraphEdge::OnBeforeRelease() {
  if (IsConnected() && Disconnect() == 0)
    return 0;
  return CKRSerialObject::OnBeforeRelease();
}

bool CKRGraphEdge::IsConnected() {
  if (m_iConnected != 0)
    return true;
  // The flag is not stored. Only Connect and loading enter an edge in a
  // node's list, so an unflagged edge that both of its distinct nodes list
  // was loaded joined: it counts as connected from now on.
  if (m_pPrimaryNode != nullptr && m_pSecondaryNode != nullptr && m_pPrimaryNode != m_pSecondaryNode &&
      m_pPrimaryNode->ListsEdge(this) && m_pSecondaryNode->ListsEdge(this))
    m_iConnected = 1;
  return m_iConnected != 0;
}

int CKRGraphEdge::SetNodes(CKRGraphNode* primary, CKRGraphNode* secondary) {
  if (ValidateNodes(primary, secondary) == 0 || IsConnected())
    return 0;
  m_pPrimaryNode = primary;
  m_pSecondaryNode = secondary;
  return 1;
}

int CKRGraphEdge::ValidateNodes(CKRGraphNode* primary, CKRGraphNode* secondary) {
  return primary != nullptr && secondary != nullptr ? 1 : 0;
}

int CKRGraphEdge::HasNode(CKRGraphNode* node) {
  return node != nullptr && (node == m_pPrimaryNode || node == m_pSecondaryNode) ? 1 : 0;
}

CKRGraphNode* CKRGraphEdge::GetNeighbor(CKRGraphNode* node) {
  if (node == nullptr)
    return nullptr;
  if (node == m_pPrimaryNode && m_iDirection != KR_EDGE_SECONDARY_TO_PRIMARY)
    return m_pSecondaryNode;
  if (node == m_pSecondaryNode && m_iDirection != KR_EDGE_PRIMARY_TO_SECONDARY)
    return m_pPrimaryNode;
  return nullptr;
}

CKRGraphNode* CKRGraphEdge::GetPrimary() {
  return m_pPrimaryNode;
}

CKRGraphNode* CKRGraphEdge::GetSecondary() {
  return m_pSecondaryNode;
}

int CKRGraphEdge::SwapNodes() {
  if (!IsConnected())
    return 0;
  std::swap(m_pPrimaryNode, m_pSecondaryNode);
  return 1;
}

int CKRGraphEdge::Connect() {
  if (m_pPrimaryNode == nullptr || m_pSecondaryNode == nullptr)
    return 0;
  if (m_pPrimaryNode->AddEdge(this) == 0)
    return 0;
  if (m_pSecondaryNode->AddEdge(this) == 0) {
    m_pPrimaryNode->RemoveEdge(this);
    return 0;
  }
  m_iConnected = 1;
  return 1;
}

int CKRGraphEdge::Disconnect() {
  if (m_pPrimaryNode == nullptr || m_pSecondaryNode == nullptr)
    return 0;
  const int fromPrimary = m_pPrimaryNode->RemoveEdge(this);
  m_pPrimaryNode = nullptr;
  const int fromSecondary = m_pSecondaryNode->RemoveEdge(this);
  m_pSecondaryNode = nullptr;
  m_iConnected = 0;
  return fromPrimary != 0 && fromSecondary != 0 ? 1 : 0;
}

void CKRGraphEdge::SetVisited(IKRGraphNodeVisitor* visitor) {
  if (visitor != nullptr)
    m_iVisitMark = visitor->GetSessionID();
}

int CKRGraphEdge::WasVisited(IKRGraphNodeVisitor* visitor) {
  return visitor != nullptr && m_iVisitMark == visitor->GetSessionID() ? 1 : 0;
}

bool CKRGraphEdge::SetDirection(std::uint16_t direction) {
  if (direction > KR_EDGE_PRIMARY_TO_SECONDARY)
    return false;
  m_iDirection = direction;
  return true;
}

// ---------------------------------------------------------------- nodes

void CKRGraphNode::CKRGraphNodeType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRObjCollectionFieldT<EdgeList>>(target, object, &CKRGraphNode::m_EdgeList, L"m_EdgeList", L"m_EdgeList",
                                              kEdgeListFieldID, KRDT_OBJECT_COLLECTION, kEdgeListFlags);
}

int CKRGraphNode::OnBeforeRelease() {
  Disconnect();
  return CKRSerialObject::OnBeforeRelease();
}

CKRGraphNode::EdgeList::Iterator CKRGraphNode::GetEdgeIterator() {
  return m_EdgeList.GetIterator();
}

CKRGraphEdge* CKRGraphNode::GetEdgeToNeighbor(CKRGraphNode* node) {
  if (node == nullptr)
    return nullptr;
  for (CKRGraphEdge* edge : m_EdgeList)
    if (edge->GetNeighbor(this) == node)
      return edge;
  return nullptr;
}

CKRGraphNode* CKRGraphNode::GetNeighbor(int index) {
  CKRGraphEdge* edge = GetEdge(index);
  return edge != nullptr ? edge->GetNeighbor(this) : nullptr;
}

CKRGraphEdge* CKRGraphNode::GetEdge(int index) {
  if (index < 0 || index >= m_EdgeList.GetCount())
    return nullptr;
  for (CKRGraphEdge* edge : m_EdgeList)
    if (index-- == 0)
      return edge;
  return nullptr;
}

void CKRGraphNode::Disconnect() {
  // First to last; each edge's release takes it out of both lists. An edge
  // that refuses its release is still unjoined and unlisted, so that no
  // node keeps an edge that leads to this one after it is gone.
  for (auto edges = m_EdgeList.GetIterator(); CKRGraphEdge* edge = edges.Next(1);) {
    // Only the pointer value is used after the release: the edge may be
    // gone.
    IKRObject* key = edge;
    const int released = edge->Release();
    if (!m_EdgeList.Contains(key))
      continue;
    if (released == 0)
      edge->Disconnect();
    m_EdgeList.Remove(key);
  }
}

IKRReadOnlyCollection* CKRGraphNode::GetEdgeCollection() {
  return &m_EdgeList;
}

void CKRGraphNode::SetVisited(IKRGraphNodeVisitor* visitor) {
  if (visitor != nullptr)
    m_iVisitMark = visitor->GetSessionID();
}

int CKRGraphNode::WasVisited(IKRGraphNodeVisitor* visitor) {
  return visitor != nullptr && m_iVisitMark == visitor->GetSessionID() ? 1 : 0;
}

int CKRGraphNode::AddEdge(CKRGraphEdge* edge) {
  return edge != nullptr ? m_EdgeList.Add(edge) : 0;
}

int CKRGraphNode::RemoveEdge(CKRGraphEdge* edge) {
  return edge != nullptr && m_EdgeList.Remove(edge) != nullptr ? 1 : 0;
}
