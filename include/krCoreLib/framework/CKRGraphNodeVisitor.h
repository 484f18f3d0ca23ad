// IKRGraphNodeVisitor and the graph walks: CKRGraphNodeVisitorImpl,
// CKRDFSVisitor (collects every node reached, in pre-order),
// CKRFilteredDFSVisitor (collects only nodes of chosen types) and
// CKRReleaseVisitor (releases every node reached).
//
// Each Start is one walk with a fresh process-wide session ID; nodes and
// edges reached are stamped with it, so a walk needs no set of its own.
// Session IDs run 1, 2, ..., 65534 and then 1 again: 0, the mark of a node
// or edge never reached, is never a session ID. A mark 65,534 walks old
// counts as the new walk's again.
//
// Only one walk runs at a time in the process: a Start made while another
// walk runs (also from a VisitNode override) returns 0 and does nothing.
// The depth-first walk calls VisitNode through the interface for every
// neighbour, so overrides apply to each node; it nests on the native stack
// only to a bounded depth and keeps deeper nodes on a list of its own, in
// the same order, so a chain of any length is walked on a default-sized
// stack. Not synchronised: walks run on one thread at a time.
#pragma once

#include <krCoreLib/framework/CKRGraphNode.h>
#include <krCoreLib/objectmodel/CKRObjectImpl.h>

#include <cstdint>
#include <vector>

class KRCORELIB_API IKRGraphNodeVisitor {
public:
  // Walks from `node`: 1, or 0 when refused.
  virtual int Start(CKRGraphNode* node) = 0;
  // Visits one node: 1, or 0 when it was visited in this walk already.
  virtual int VisitNode(CKRGraphNode* node) = 0;
  // The session ID of the current or last walk (0 before the first).
  virtual std::uint16_t GetSessionID() = 0;

protected:
  ~IKRGraphNodeVisitor() = default;
};

class KRCORELIB_API CKRGraphNodeVisitorImpl : public CKRObjectImpl, public IKRGraphNodeVisitor {
  KR_DECLARE_OBJECT_TYPE(CKRGraphNodeVisitorImpl, CKRObjectTypeImpl, "{4D788BB9-51E7-44CC-8A34-62698C2C3D43}")

public:
  // 0 while any walk runs and for null. Otherwise takes the next session
  // ID, runs VisitNode(node) as the one walk of the process and returns 1.
  int Start(CKRGraphNode* node) override;
  // 0 for null and for a node visited in this session; otherwise marks it:
  // 1. Follows no edge.
  int VisitNode(CKRGraphNode* node) override;
  std::uint16_t GetSessionID() override;

  // Advances the process-wide session counter (1 to 65534, then 1 again)
  // and returns the new value.
  static std::uint16_t GetNextSessionID();

protected:
  CKRGraphNodeVisitorImpl() = default;
  ~CKRGraphNodeVisitorImpl() override = default;

private:
  std::uint16_t m_iSessionID = 0;

  static std::uint16_t m_iNextSessionID;
  static bool m_bLocked;
};

class KRCORELIB_API CKRDFSVisitor : public CKRGraphNodeVisitorImpl {
  KR_DECLARE_OBJECT_TYPE(CKRDFSVisitor, CKRObjectTypeImpl, "{797F206F-C5AD-4521-AD2F-64064A981555}")

public:
  using NodeList = CKRObjPtrList<CKRGraphNode>;

  // Depth-first from `node`: 0 for null and for a node visited in this
  // session. Otherwise marks it, collects it (AddToDFSList), and for each
  // of its edges in list order not yet crossed in this session marks the
  // edge and calls VisitNode on the neighbour across it (when the edge's
  // direction allows leaving that way): 1. Nodes are collected in
  // pre-order; every edge is crossed at most once per walk.
  int VisitNode(CKRGraphNode* node) override;

  // The collected nodes; they accumulate over walks until cleared, each
  // node once.
  NodeList::Iterator GetDFSNodeIterator() { return m_DFSNodeList.GetIterator(); }
  NodeList::ReverseIterator GetDFSNodeReverseIterator() { return m_DFSNodeList.GetReverseIterator(); }
  IKRReadOnlyCollection* GetDFSNodeCollection() { return &m_DFSNodeList; }
  // Forgets the collected nodes (does not release them).
  void ClearDFSNodeList() { m_DFSNodeList.RemoveAll(false); }

protected:
  CKRDFSVisitor() = default;
  ~CKRDFSVisitor() override = default;

  // Appends `node` unless it is listed already.
  virtual void AddToDFSList(CKRGraphNode* node);

  // The depth-first step of VisitNode for `node`, collecting it only when
  // `collect` holds. Neighbours are visited through VisitNode.
  int VisitDepthFirst(CKRGraphNode* node, bool collect);

  NodeList m_DFSNodeList;

private:
  // A node whose edges the walk is going through.
  struct SKRFrame {
    CKRGraphNode* m_pNode;
    CKRGraphNode::EdgeList::Iterator m_Edges;
  };

  // Calls of VisitNode nest on the native stack up to this depth; deeper
  // nodes wait on m_Frames for the innermost running loop. 1,000 levels
  // of a VisitNode override and the base's step take well under 1 MiB,
  // also with the address sanitizer, of a default 8 MiB stack.
  static constexpr int kMaxNesting = 1000;

  std::vector<SKRFrame> m_Frames;
  int m_iNesting = 0;
};

class KRCORELIB_API CKRFilteredDFSVisitor : public CKRDFSVisitor {
  KR_DECLARE_OBJECT_TYPE(CKRFilteredDFSVisitor, CKRObjectTypeImpl, "{BD386A1D-1C52-4A9C-A66F-B563BBCC61B1}")

public:
  // 0 when no seek type has been added; otherwise as the base.
  int Start(CKRGraphNode* node) override;
  // The depth-first step, collecting `node` only when it is of a seek type
  // (IsTypeOf); the walk goes on through nodes of other types.
  int VisitNode(CKRGraphNode* node) override;

  // Appends a type ID (duplicates allowed).
  void AddSeekType(CKRGuid typeID) { m_SeekTypes.push_back(typeID); }
  void ClearSeekTypes() { m_SeekTypes.clear(); }

protected:
  CKRFilteredDFSVisitor() = default;
  ~CKRFilteredDFSVisitor() override = default;

private:
  bool IsSought(CKRGraphNode* node) const;

  std::vector<CKRGuid> m_SeekTypes;
};

class KRCORELIB_API CKRReleaseVisitor : public CKRDFSVisitor {
  KR_DECLARE_OBJECT_TYPE(CKRReleaseVisitor, CKRObjectTypeImpl, "{64DAD3B7-DA58-45BC-BADD-FD31CB388093}")

public:
  // Collects every node reachable from `node` (the base's walk) and, when
  // the walk ran, releases the collected nodes in collection order (each
  // with its edges) and empties the list: 1. 0 when the walk was refused.
  int Start(CKRGraphNode* node) override;

protected:
  CKRReleaseVisitor() = default;
  ~CKRReleaseVisitor() override = default;
};
