// CKRGraphNode and CKRGraphEdge: a small storable graph.
//
// A node keeps the ordered list of its edges; an edge joins a primary and a
// secondary node and may be followable in one direction only. Edges join
// nodes in two steps: SetNodes names the nodes, Connect enters the edge in
// both nodes' lists. Neither owns the other's memory, but releasing a node
// releases its edges, and releasing a connected edge takes it out of both
// nodes' lists, so no node ever lists a released edge.
//
// Both classes are storable (CKRSerialObject): an edge stores its two node
// links, a node its edge list, so storing any node or edge stores the whole
// connected part of the graph. The connected flag and the direction are not
// stored. A loaded edge that both of its (distinct) nodes list counts as
// connected, exactly as if Connect had joined it: releasing it, or either
// node, leaves no node listing it. The direction of a loaded edge is what
// its class sets in OnInitialize.
//
// Visit marks (the session ID of the last walk that reached the object,
// CKRGraphNodeVisitorImpl) live on the nodes and edges themselves. Nodes
// and edges are created and released through their types. Not
// synchronised.
#pragma once

#include <krCoreLib/objectmodel/CKRObjPtrList.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

#include <cstdint>

class CKRGraphNode;
class IKRGraphNodeVisitor;

class KRCORELIB_API CKRGraphEdge : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRGraphEdge, CKRSerialObjectTypeImpl, "{48F087FA-103C-4BB3-8197-06B52EEA4757}")

public:
  // The directions an edge can be followed in (GetDirection).
  enum : std::uint16_t {
    KR_EDGE_BOTH_WAYS = 0,             // either way
    KR_EDGE_SECONDARY_TO_PRIMARY = 1,  // only from the secondary to the primary node
    KR_EDGE_PRIMARY_TO_SECONDARY = 2,  // only from the primary to the secondary node
  };

  // Names the nodes without connecting: 1; 0 when ValidateNodes refuses or
  // the edge is connected.
  virtual int SetNodes(CKRGraphNode* primary, CKRGraphNode* secondary);
  // 1 when both nodes are non-null. Derived edges restrict which nodes they
  // may join.
  virtual int ValidateNodes(CKRGraphNode* primary, CKRGraphNode* secondary);
  // 1 when `node` (not null) is the primary or the secondary node.
  virtual int HasNode(CKRGraphNode* node);
  // The node reached by leaving `node` over this edge: the secondary node
  // from the primary (direction 0 or 2), the primary node from the
  // secondary (direction 0 or 1); null otherwise and for null.
  virtual CKRGraphNode* GetNeighbor(CKRGraphNode* node);
  virtual CKRGraphNode* GetPrimary();
  virtual CKRGraphNode* GetSecondary();
  // Exchanges the nodes of a connected edge (both keep listing it; the
  // meaning of directions 1 and 2 turns round): 1; 0 when not connected.
  virtual int SwapNodes();
  // Enters the edge in the primary's, then the secondary's edge list: 1.
  // 0 when a node is missing or a list refuses the edge (an edge listed
  // already, or primary and secondary the same node); nothing stays listed
  // then.
  virtual int Connect();
  // Takes the edge out of both lists and forgets both nodes; the edge is
  // unjoined afterwards whatever the result. 1 when both lists held it; 0
  // when one did not or a node is missing.
  virtual int Disconnect();
  // Stamps the visitor's session ID (nothing for null).
  virtual void SetVisited(IKRGraphNodeVisitor* visitor);
  // 1 when stamped with the visitor's session ID; 0 for null.
  virtual int WasVisited(IKRGraphNodeVisitor* visitor);

  // Not connected, no nodes, followable both ways; the base's answer.
  int OnInitialize() override;
  // A connected edge disconnects first and refuses the release (0) when
  // that reports a failure; then the base's answer.
  int OnBeforeRelease() override;

  // True after a successful Connect, and for a loaded edge that both of
  // its nodes list.
  bool IsConnected();
  std::uint16_t GetDirection() const { return m_iDirection; }

protected:
  CKRGraphEdge() = default;
  ~CKRGraphEdge() override = default;

  // For derived edge classes, typically in OnInitialize after the base's:
  // one of the directions above; other values are refused (false).
  bool SetDirection(std::uint16_t direction);

private:
  std::int32_t m_iConnected = 0;
  std::uint16_t m_iVisitMark = 0;
  CKRGraphNode* m_pPrimaryNode = nullptr;
  CKRGraphNode* m_pSecondaryNode = nullptr;
  std::uint16_t m_iDirection = KR_EDGE_BOTH_WAYS;
};

class KRCORELIB_API CKRGraphNode : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRGraphNode, CKRSerialObjectTypeImpl, "{4E82A8F0-B483-47FE-BE4A-2C72C1A39F63}")

public:
  using EdgeList = CKRObjPtrList<CKRGraphEdge>;

  // First to last edge; it survives the removal of edges other than the
  // one at its position.
  virtual EdgeList::Iterator GetEdgeIterator();
  // The first edge, in list order, over which `node` is reached from this
  // node; null when there is none or `node` is null.
  virtual CKRGraphEdge* GetEdgeToNeighbor(CKRGraphNode* node);
  // The node reached over GetEdge(index) (null when the edge's direction
  // forbids leaving this way); null when `index` is out of range.
  virtual CKRGraphNode* GetNeighbor(int index);
  // The edge at 0-based `index`; null when out of range.
  virtual CKRGraphEdge* GetEdge(int index);
  // Releases every edge, first to last (each takes itself out of its other
  // node's list); the list is empty afterwards.
  virtual void Disconnect();
  // The edge list, read-only.
  virtual IKRReadOnlyCollection* GetEdgeCollection();
  // As for edges.
  virtual void SetVisited(IKRGraphNodeVisitor* visitor);
  virtual int WasVisited(IKRGraphNodeVisitor* visitor);

  // Releases the edges (Disconnect), then answers as the base.
  int OnBeforeRelease() override;

protected:
  CKRGraphNode() = default;
  ~CKRGraphNode() override = default;

private:
  friend class CKRGraphEdge;
  // Appends; 0 for null and for an edge listed already.
  virtual int AddEdge(CKRGraphEdge* edge);
  // 1 when the edge was listed.
  virtual int RemoveEdge(CKRGraphEdge* edge);
  bool ListsEdge(const CKRGraphEdge* edge) const { return m_EdgeList.Contains(edge); }

  std::uint16_t m_iVisitMark = 0;
  EdgeList m_EdgeList;
};
